// The decrunch pipeline as its receiver sees it: exact event sequences for the page text,
// the sink chain, the tag table, meta refreshes and script strings.
#include "engine/html/decrunch.h"

#include <gtest/gtest.h>

#include <string>

#include "tests/engine/html/decrunch_test_support.h"

namespace {

using decrunch_test::Decrunched;
using decrunch_test::Events;

TEST(DecrunchText, CharacterReferencesAndBufferPieces) {
  // A known name, an unknown one, a capitalised one, a bare '&', numeric forms, a reference
  // given up at a tag, and one given up by a second '&' (whose '&' stays text).
  EXPECT_EQ(Decrunched("a&amp;b &nope; &Lt; & x &#233;&#x20AC;&#65; &am<br>p; &a&amp;<br>"),
            (Events{"text:a&b &nope; &Lt; & x \xC3\xA9\xE2\x82\xAC"
                    "A &am",
                    "break", "text:p; &a&", "break", "json:0"}));
  // Pieces of at most 1000 bytes; text after the last tag is never delivered.
  const std::string page = std::string(2500, 'x') + "<div>tail";
  EXPECT_EQ(Decrunched(page),
            (Events{"text:" + std::string(1000, 'x'), "text:" + std::string(1000, 'x'),
                    "text:" + std::string(500, 'x'), "break", "json:0"}));
}

TEST(DecrunchSinks, AnchorTextReachesTheAnchorThatWasOpenWhileItWasRead) {
  EXPECT_EQ(Decrunched("before <a href=\"/p%41th%zz\">Go <b>now</b></a> after<br>"
                       "<a name=top>no href</a><a href=1>one<a href=2>two</a>"),
            (Events{"text:before ", "sink:anchor:/pAth%zz", "text:Go now", "anchor.text:Go now",
                    "anchor.end", "text: after", "break", "text:no href", "sink:anchor:1",
                    "text:one", "anchor.text:one", "anchor.end", "sink:anchor:2", "text:two",
                    "anchor.text:two", "anchor.end", "json:0"}));
}

TEST(DecrunchSinks, TitleTextReachesOnlyTheTitle) {
  // A reference being read when the title ends stays pending and finishes in page text.
  EXPECT_EQ(Decrunched("<title>Sign &amp; in</title>rest<br><title>a&amp</title>;b<br>"),
            (Events{"sink:title", "title.text:Sign & in", "title.end", "text:rest", "break",
                    "sink:title", "title.text:a", "title.end", "text:&b", "break", "json:0"}));
  // A title that was never closed ends before the next one asks for its sink.
  EXPECT_EQ(Decrunched("<title>a<title>b</title>"),
            (Events{"sink:title", "title.text:a", "title.end", "sink:title", "title.text:b",
                    "title.end", "json:0"}));
  // Without a title sink the title is page text; a body start tag closes an open head.
  EXPECT_EQ(Decrunched("<head><title>T<body>x<br>", {"title"}),
            (Events{"text:T", "text:x", "break", "json:0"}));
}

TEST(DecrunchSinks, FirstOptionIsPageTextLaterOptionsOnlyReachTheSelect) {
  EXPECT_EQ(
      Decrunched("<select><option>One<option>Two</option>mid<option>Three</select>after<br>"),
      (Events{"break", "sink:select", "select.break", "text:One", "select.text:One", "select.break",
              "select.text:Two", "select.break", "text:mid", "select.text:mid", "select.break",
              "select.text:Three", "select.end", "text:after", "break", "json:0"}));
  // An anchor inside a later option is appended after the current select.
  EXPECT_EQ(Decrunched("<select><option>1<option><a href=h>A</a></select>"),
            (Events{"break", "sink:select", "select.break", "text:1", "select.text:1",
                    "select.break", "sink:anchor:h", "select.text:A", "anchor.text:A", "anchor.end",
                    "select.end", "json:0"}));
}

TEST(DecrunchTags, ElementStringsNeverOutliveTheirElement) {
  // A meta http-equiv must not become the href of a later anchor, nor a meta name make a
  // later meta's content a description.
  EXPECT_EQ(Decrunched("<meta http-equiv=refresh content=x><a name=top>T</a>"
                       "<meta name=description><meta content=\"5\"><br>"),
            (Events{"text:T", "break", "json:0"}));
}

TEST(DecrunchTags, UrlsAndTheirKinds) {
  EXPECT_EQ(
      Decrunched(
          "<img src=\"a%2Fb.png\" alt=\"A&amp;B\"><link rel=\"StyleSheet\" href=\"/s%20.css\">"
          "<link rel=\"shortcut icon\" href=/f.ico><link rel=preload href=/p>"
          "<form action=/login><iframe src=if></iframe><frame src=fr><embed src=em>"
          "<object src=ob></object><area href=%zz><applet src=no><body background=no>"),
      (Events{"url:1:a/b.png", "break", "text:A", "text:&", "text:B", "break", "url:2:/s .css",
              "url:4:/f.ico", "url:5:/login", "url:7:if", "url:8:fr", "url:9:em", "url:9:ob",
              "url:6:%zz", "json:0"}));
}

TEST(DecrunchTags, InputRules) {
  EXPECT_EQ(Decrunched("<input type=hidden value=secret><input type=SUBMIT value=\"Log &amp; in\">"
                       "<input type=image src=\"/b%20.png\" value=v>"
                       "<input type=password src=%41 placeholder=\"Pw\"><input value=v>"),
            (Events{"text:Log & in", "break", "input:submit||Log &amp; in", "url:1:/b .png",
                    "break", "text:P", "text:w", "input:password|A|", "input:||v", "json:0"}));
}

TEST(DecrunchTags, MetaDescriptionAndItsFallback) {
  // Content read before the name is refresh content; giving up makes it fallback text, which
  // the description receives at the end of the tag. A second content goes to the open sink.
  EXPECT_EQ(
      Decrunched(
          "<meta name=Description content=\"Hi\">"
          "<meta content=\"Old\" name=description content=\"New\">"
          "<meta content=\"5\" name=description><meta name=description content=a content=b>"),
      (Events{"sink:description", "description.text:H", "description.text:i", "description.end",
              "sink:description", "description.text:N", "description.text:e", "description.text:w",
              "description.text:Old", "description.end", "sink:description", "description.text:a",
              "description.text:b", "description.end", "json:0"}));
}

TEST(DecrunchRefresh, DataUrlBehindARefreshIsAPageOfItsOwn) {
  // Base64 of "<a href=/d>Data</a><br>".
  EXPECT_EQ(Decrunched("<meta http-equiv=refresh content=\"5; URL = data:text/html;base64,"
                       "PGEgaHJlZj0vZD5EYXRhPC9hPjxicj4=\">x<br>"),
            (Events{"begin_nested", "sink:anchor:/d", "text:Data", "anchor.text:Data", "anchor.end",
                    "break", "end_nested", "text:x", "break", "json:0"}));
  // Percent-encoded; an ordinary refresh URL and content that is no refresh decode nothing.
  EXPECT_EQ(Decrunched("<meta content='0;url=\"data:,%3Ctitle%3EIn%3C/title%3E'>"
                       "<meta content='0;url=https://x.test/'><meta content='url=data:,<b>'>"),
            (Events{"begin_nested", "sink:title", "title.text:In", "title.end", "end_nested",
                    "begin_nested", "end_nested", "json:0"}));
}

// One decoder serves every refresh of a page: each target still opens and closes its own
// nested page, whatever the target before it left behind.
TEST(DecrunchRefresh, EveryTargetIsANestedPageOfItsOwn) {
  // Base64 of "<b>1</b><br>"; the second target stops inside an escape, the fourth in the
  // middle of base64, the fifth in its header.
  EXPECT_EQ(Decrunched("<meta content='0;url=data:text/html;base64,PGI+MTwvYj48YnI+'>"
                       "<meta content='0;url=data:,%3Ctitle%3EA%3'>"
                       "<meta content='0;url=/plain'>"
                       "<meta content='0;url=data:text/html;base64,PGI+MT'>"
                       "<meta content='0;url=data:text/html'>"
                       "<meta content='0;url=data:,%3Ctitle%3EB%3C/title%3E'>"),
            (Events{"begin_nested", "text:1", "break", "end_nested", "begin_nested", "sink:title",
                    "end_nested", "begin_nested", "end_nested", "begin_nested", "end_nested",
                    "begin_nested", "end_nested", "begin_nested", "sink:title", "title.text:B",
                    "title.end", "end_nested", "json:0"}));
  // A second content in one meta ends the first target before the second one begins.
  EXPECT_EQ(Decrunched("<meta content='0;url=data:,%3Cbr%3Ex' content='1;url=data:,y%3Cbr%3E'>"
                       "<meta content='0;url=/a' content='x'>"),
            (Events{"begin_nested", "break", "end_nested", "begin_nested", "text:y", "break",
                    "end_nested", "begin_nested", "end_nested", "json:0"}));
}

TEST(DecrunchScripts, StringsGoToTheScriptSinkAndUrlsAreReported) {
  EXPECT_EQ(Decrunched("<script src=\"/a%20b.js\">var u = \"http://evil.example/p%3Fx\", n = 2 / 1;"
                       "\n  s = ' \\u0041%41';</script>"),
            (Events{"sink:script:/a b.js", "script.text:http://evil.example/p?x\" AA'",
                    "script_url:evil.example/p", "script.end", "json:0"}));
  // Bytes of 0x80 and above are never blanks.
  EXPECT_EQ(Decrunched("<script>s = '\xE9t\xE9'</script>"),
            (Events{"sink:script:", "script.text:\xE9t\xE9'", "script.end", "json:0"}));
  // Leading blanks are dropped; closing quotes are string text. A script without strings
  // asks for no sink.
  EXPECT_EQ(Decrunched("<script>a = ' \\n'; b = \"\"</script><script>x = 1 / 2;</script>"),
            (Events{"sink:script:", "script.text:'\"", "script.end", "json:0"}));
}

TEST(DecrunchScripts, HtmlWrittenInScriptStringsIsParsedAsNestedPages) {
  // The inner script's own string holds HTML again; '%3C' is decoded before the decision.
  EXPECT_EQ(Decrunched("<script>document.write(\"<a href='/n'>Nested</a><br>\");</script>"
                       "<script>w('<script>var a = \"%3Cb>Deep</b><br>\";<\\/script>')</script>"),
            (Events{"begin_nested", "sink:anchor:/n", "text:Nested", "anchor.text:Nested",
                    "anchor.end", "break", "end_nested", "begin_nested", "begin_nested",
                    "text:Deep", "break", "end_nested", "end_nested", "json:0"}));
}

TEST(DecrunchTracker, EndTagsCloseEverythingOpenedAfterTheirElement) {
  EXPECT_EQ(Decrunched("<body><div><a href=x>y<select><option>o</body>z<br></a></select>"),
            (Events{"break", "sink:anchor:x", "text:y", "anchor.text:y", "break", "anchor.break",
                    "sink:select", "select.break", "text:o", "anchor.text:o", "select.text:o",
                    "anchor.end", "select.end", "text:z", "break", "json:0"}));
}

TEST(DecrunchPipeline, CountsBytesAndKeepsTheJsonVerdict) {
  decrunch_test::Recorder recorder;
  html::Decrunch pipeline(recorder, false);
  pipeline.feed("{\"a\": [1, ", 10);
  pipeline.feed("\"<b>\"]}", 7);
  EXPECT_EQ(pipeline.byteCount(), 17u);
  EXPECT_EQ(html::addByteCount(0xFFFFFFF0u, 15), 0xFFFFFFFFu);
  EXPECT_EQ(html::addByteCount(0xFFFFFFF0u, 16), 0xFFFFFFFFu);  // no wrap round to 0
  EXPECT_EQ(html::addByteCount(5, std::size_t{1} << 40), 0xFFFFFFFFu);
  EXPECT_TRUE(pipeline.jsonAccepted());
  pipeline.feed(" x", 2);
  EXPECT_FALSE(pipeline.jsonAccepted());
}

TEST(DecrunchPipeline, NestedPipelineBracketsItsReports) {
  decrunch_test::Recorder recorder;
  {
    html::Decrunch pipeline(recorder, true);
    // An open script is finished when the pipeline goes; what the tokenizer still holds
    // (the last 76 bytes) is not delivered.
    const std::string page = "<script>'" + std::string(1099, 'x');
    pipeline.feed(page.data(), page.size());
  }
  EXPECT_EQ(recorder.events,
            (Events{"begin_nested", "sink:script:", "script.text:" + std::string(998, 'x'),
                    "script.text:" + std::string(25, 'x'), "script.end", "end_nested"}));
}

}  // namespace
