#include "engine/html/tokenizer.h"

#include <gtest/gtest.h>

#include <string>

#include "tests/engine/html/scan_test_support.h"

namespace {

using html_test::Events;
using html_test::RecordingHandler;
using html_test::Tokenize;

static_assert(html::TokenizerHandler<RecordingHandler, char>);

RecordingHandler::Policy SkipAttributes() {
  RecordingHandler::Policy policy;
  policy.reportAttributes = false;
  return policy;
}

TEST(Tokenizer, BlankAfterLessThanOpensAnUnnamedElement) {
  EXPECT_EQ(Tokenize("a < b > c<"), (Events{"text:a ", "open:", "attr:b", "tagend", "text: c"}));
}

TEST(Tokenizer, EmptyTagsAndVoidEndTags) {
  EXPECT_EQ(Tokenize("<></><//></br></P >"),
            (Events{"open:", "tagend", "close:", "close:/", "close:p"}));
}

TEST(Tokenizer, TextIsHeldUntilTheNextTagOrAFullChunk) {
  EXPECT_EQ(Tokenize("tail without a tag"), Events{});
  const std::string longText(1030, 'x');
  EXPECT_EQ(Tokenize(longText), (Events{"text:" + std::string(1024, 'x')}));
  EXPECT_EQ(Tokenize(longText + "<"),
            (Events{"text:" + std::string(1024, 'x'), "text:" + std::string(6, 'x')}));
}

TEST(Tokenizer, NamesAreLowerCasedAndHighBytesAreNotBlanks) {
  EXPECT_EQ(Tokenize("<DiV CLASS=Mixed>\xC3\x89<a\xA0z HREF='X'>"),
            (Events{"open:div", "attr:class", "value:Mixed", "tagend", "text:\xC3\x89",
                    "open:a\xA0z", "attr:href", "value:X", "tagend"}));
}

TEST(Tokenizer, EveryQuotingFormInEveryMode) {
  const std::string doc = "<p a=1 b='2 x' c=\"3\ny\" d e = 5 f=>";
  EXPECT_EQ(Tokenize(doc), (Events{"open:p", "attr:a", "value:1", "attr:b", "value:2 x", "attr:c",
                                   "value:3y", "attr:d", "attr:e", "value:5", "attr:f", "tagend"}));
  RecordingHandler::Policy stream;
  stream.defaultMode = html::kAttrStream;
  EXPECT_EQ(Tokenize(doc, stream),
            (Events{"open:p", "attr:a", "chars:1", "attr:b", "chars:2 x", "attr:c", "chars:3y",
                    "attr:d", "attr:e", "chars:5", "attr:f", "tagend"}));
  RecordingHandler::Policy skip;
  skip.defaultMode = html::kAttrSkip;
  EXPECT_EQ(Tokenize(doc, skip), (Events{"open:p", "attr:a", "attr:b", "attr:c", "attr:d", "attr:e",
                                         "attr:f", "tagend"}));
  EXPECT_EQ(Tokenize(doc, SkipAttributes()), (Events{"open:p", "tagend"}));
}

TEST(Tokenizer, LineFeedEndsAnUnquotedValue) {
  EXPECT_EQ(Tokenize("<a title=a\nb>"),
            (Events{"open:a", "attr:title", "value:a", "attr:b", "tagend"}));
}

TEST(Tokenizer, AttributeModesMayDifferPerAttribute) {
  RecordingHandler::Policy policy;
  policy.defaultMode = html::kAttrSkip;
  policy.modes = {{"href", html::kAttrCollect}, {"alt", html::kAttrStream}};
  EXPECT_EQ(Tokenize("<img src=a.png alt=\"An image\" href=x>", policy),
            (Events{"open:img", "attr:src", "attr:alt", "chars:An image", "attr:href", "value:x",
                    "tagend"}));
}

TEST(Tokenizer, SelfClosingStartTags) {
  const Events selfClosingBr = {"open:br", "tagend", "close:br"};
  for (const char* doc : {"<br/>", "<br />", "<BR/>"}) {
    EXPECT_EQ(Tokenize(doc), selfClosingBr) << doc;
    EXPECT_EQ(Tokenize(doc, SkipAttributes()), selfClosingBr) << doc;
  }
  EXPECT_EQ(Tokenize("<a href=x/>"),
            (Events{"open:a", "attr:href", "value:x", "tagend", "close:a"}));
  RecordingHandler::Policy stream;
  stream.defaultMode = html::kAttrStream;
  EXPECT_EQ(Tokenize("<a href=x/y/>", stream),
            (Events{"open:a", "attr:href", "chars:x/y", "tagend", "close:a"}));
  EXPECT_EQ(Tokenize("<a href=x/>", SkipAttributes()), (Events{"open:a", "tagend", "close:a"}));
  // A '/' that does not touch the '>' is just part of the tag.
  EXPECT_EQ(Tokenize("<a href=\"x/\" >"), (Events{"open:a", "attr:href", "value:x/", "tagend"}));
}

TEST(Tokenizer, ScriptWhoseLastValueEndsInSlashClosesAtOnce) {
  EXPECT_EQ(Tokenize("<script src=a.js/><b>x</b>"),
            (Events{"open:script", "attr:src", "value:a.js", "tagend", "close:script", "open:b",
                    "tagend", "text:x", "close:b"}));
}

TEST(Tokenizer, ScriptTextEndsOnlyAtTheExactClosingLiteral) {
  EXPECT_EQ(Tokenize("<script>if(a<b)x='</scr'+'ipt>';</SCRIPT ><p>y</ScRiPt>z<"),
            (Events{"open:script", "tagend", "script:if(a<b)x='</scr'+'ipt>';</SCRIPT ><p>y",
                    "close:script", "text:z"}));
  EXPECT_EQ(Tokenize("<script>a<</script>"),
            (Events{"open:script", "tagend", "script:a<", "close:script"}));
  EXPECT_EQ(Tokenize("<script></script>"), (Events{"open:script", "tagend", "close:script"}));
}

TEST(Tokenizer, ScriptTextComesInPiecesOfAtMost1024Bytes) {
  const std::string body(1024 + 7, 'j');
  EXPECT_EQ(Tokenize("<script>" + body + "</script>"),
            (Events{"open:script", "tagend", "script:" + std::string(1024, 'j'),
                    "script:" + std::string(7, 'j'), "close:script"}));
}

TEST(Tokenizer, RawTextIsSkippedWhenNotWanted) {
  RecordingHandler::Policy noRawText;
  noRawText.rawText = false;
  EXPECT_EQ(Tokenize("<script>var a='<b>';</script><i>", noRawText),
            (Events{"open:script", "tagend", "close:script", "open:i", "tagend"}));
  // Style text is read to its end and never delivered.
  EXPECT_EQ(Tokenize("<style>p{}<b></style><i>"),
            (Events{"open:style", "tagend", "close:style", "open:i", "tagend"}));
}

TEST(Tokenizer, NoscriptContentIsNeverTokenized) {
  const Events expected = {"open:noscript", "tagend", "close:noscript", "open:i", "tagend"};
  EXPECT_EQ(Tokenize("<noscript><a href=x>t</a></NOSCRIPT><i>"), expected);
  RecordingHandler::Policy noRawText;
  noRawText.rawText = false;
  EXPECT_EQ(Tokenize("<noscript><a href=x>t</a></NOSCRIPT><i>", noRawText), expected);
}

TEST(Tokenizer, CommentsEndWithTheirClosingDashes) {
  EXPECT_EQ(Tokenize("<!---->"), (Events{"comment:--", "comment_end"}));
  EXPECT_EQ(Tokenize("<!-- a -- b -->x<"), (Events{"comment: a -- b --", "comment_end", "text:x"}));
  // "-->" must follow the opener: "<!-->" does not close the comment.
  EXPECT_EQ(Tokenize("<!-->x-->"), (Events{"comment:>x--", "comment_end"}));
  RecordingHandler::Policy noComments;
  noComments.comments = false;
  EXPECT_EQ(Tokenize("<!-- <b> -->x<", noComments), (Events{"text:x"}));
  EXPECT_EQ(Tokenize("<!DOCTYPE html>"), (Events{"open:!doctype", "attr:html", "tagend"}));
}

TEST(Tokenizer, LongNamesAreCut) {
  const std::string name(2000, 'n');
  const std::string kept(html::kMaxTagNameBytes, 'n');
  EXPECT_EQ(Tokenize("<" + name + " a=1></" + name + ">"),
            (Events{"open:" + kept, "attr:a", "value:1", "tagend", "close:" + kept}));
  // A '/' past the cut is lost with the rest of the name.
  EXPECT_EQ(Tokenize("<" + name + "/>"), (Events{"open:" + kept, "tagend"}));
  const std::string attr(3000, 'a');
  EXPECT_EQ(Tokenize("<p " + attr + "=1>"),
            (Events{"open:p", "attr:" + std::string(html::kMaxAttributeNameBytes, 'a'), "value:1",
                    "tagend"}));
}

TEST(Tokenizer, CollectedValuesAreCutButStillSeeTheirSlash) {
  const std::string value(html::kMaxAttributeValueBytes + 10, 'v');
  const std::string kept(html::kMaxAttributeValueBytes, 'v');
  EXPECT_EQ(Tokenize("<a href=" + value + "/>"),
            (Events{"open:a", "attr:href", "value:" + kept, "tagend", "close:a"}));
  EXPECT_EQ(Tokenize("<a href='" + value + "'>"),
            (Events{"open:a", "attr:href", "value:" + kept, "tagend"}));
}

}  // namespace
