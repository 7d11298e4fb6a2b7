// Tags read whole by the text state against the same tags read state by state: dense random
// markup under every handler policy, fed whole and in chunks that hold some tags whole and cut
// others, must give the byte-at-a-time machine's events exactly. And the cases where a tag's
// end decides what is reported: trailing '/', line feeds in quotes, void end tags.
#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

#include "engine/html/state_machine.h"
#include "tests/engine/html/decrunch_test_support.h"
#include "tests/engine/html/scan_test_support.h"

namespace {

using html_test::Events;
using html_test::RecordingHandler;
using html_test::Tokenize;

class Bytewise {
 public:
  Bytewise() { util::setBulkScanning(false); }
  ~Bytewise() { util::setBulkScanning(true); }
};

// A start or end tag put together from the pieces whose order decides how attributes are
// read, now and then left open or longer than a tag read whole may be.
std::string RandomTag(std::mt19937& random) {
  static const std::vector<std::string> names = {
      "a", "DIV", "br", "img", "x-y", "", "/", "br/", "meta", "input", "a/", "<", "p", "Script"};
  static const std::vector<std::string> parts = {
      " ",     "\t",   "\n",    "=",       "'",          "\"",         "/",     "/ ",
      "a",     "HREF", "src",   "x=1",     "y='q w'",    "z=\"a\nb\"", "w=a/",  "v=/",
      " / ",   "= ",   " =",    "u=\"/\"", "t='>'",      "s=\"x>y\"",  "r=>",   "q= \"k\"",
      "Value", "alt",  "&amp;", "href=h/", "title=\"\"", "k=''",       "e=a=b", "c =d"};
  std::string tag = "<";
  if (random() % 5 == 0) tag += "/";
  tag += names[random() % names.size()];
  if (random() % 4 != 0) {
    tag += random() % 2 ? " " : "\n";
    for (int i = random() % 8; i > 0; --i) tag += parts[random() % parts.size()];
  }
  if (random() % 40 == 0) tag += "x=\"" + std::string(700 + random() % 700, 'v') + "\"";
  if (random() % 12 != 0) tag += ">";
  return tag;
}

std::string RandomMarkup(std::mt19937& random) {
  std::string page;
  for (int i = random() % 60; i > 0; --i) {
    switch (random() % 6) {
      case 0:
        page += std::string(1 + random() % 30, 't');
        break;
      case 1:
        page += random() % 2 ? "<!-- c -->" : "<script>s='<a>'</script>";
        break;
      default:
        page += RandomTag(random);
        break;
    }
  }
  return page;
}

// Chunks of 1 to 3,000 bytes: some hold several tags whole, some cut a tag.
std::vector<std::string_view> WideChunks(std::string_view doc, std::mt19937& random) {
  std::vector<std::string_view> chunks;
  for (std::size_t at = 0; at < doc.size();) {
    chunks.push_back(doc.substr(at, 1 + random() % 3000));
    at += chunks.back().size();
  }
  return chunks;
}

TEST(WholeTags, SameEventsAsTheStatesUnderEveryPolicy) {
  std::vector<RecordingHandler::Policy> policies(5);
  policies[1].defaultMode = html::kAttrStream;
  policies[2].defaultMode = html::kAttrSkip;
  policies[3].reportAttributes = false;
  policies[4].modes = {{"href", html::kAttrStream}, {"src", html::kAttrSkip}, {"x", 7}};
  policies[4].rawText = false;
  std::mt19937 random(99);
  for (std::uint32_t round = 0; round < 1500; ++round) {
    const std::string page = RandomMarkup(random);
    const auto& policy = policies[round % policies.size()];
    Events reference;
    {
      Bytewise bytewise;
      reference = Tokenize(page, policy);
    }
    ASSERT_EQ(Tokenize(page, policy), reference) << "round " << round << ": " << page;
    ASSERT_EQ(Tokenize(WideChunks(page, random), policy), reference)
        << "round " << round << ": " << page;
  }
}

TEST(WholeTags, WholePipelineSameAsTheStates) {
  std::mt19937 random(4711);
  for (std::uint32_t round = 0; round < 400; ++round) {
    std::string page = RandomMarkup(random);
    page += "<a href=/l title=x>link</a><input type=submit value=Go/><br>";
    Events reference;
    {
      Bytewise bytewise;
      reference = decrunch_test::Decrunched(page);
    }
    ASSERT_EQ(decrunch_test::Decrunched(page), reference) << "round " << round << ": " << page;
  }
}

TEST(WholeTags, WhereTheEndOfTheTagDecides) {
  RecordingHandler::Policy skipping;
  skipping.reportAttributes = false;
  RecordingHandler::Policy streaming;
  streaming.defaultMode = html::kAttrStream;
  // A '/' after a blank is an attribute name of its own for a reported element, but makes a
  // skipped one self-closing.
  EXPECT_EQ(Tokenize("<x a / >"), (Events{"open:x", "attr:a", "attr:/", "tagend"}));
  EXPECT_EQ(Tokenize("<x a / >", skipping), (Events{"open:x", "tagend", "close:x"}));
  // A value's trailing '/' closes the element and is not part of the value; in quotes it is.
  EXPECT_EQ(Tokenize("<a href=h/><a href='h/'>"),
            (Events{"open:a", "attr:href", "value:h", "tagend", "close:a", "open:a", "attr:href",
                    "value:h/", "tagend"}));
  EXPECT_EQ(Tokenize("<a href=h/x/>", streaming),
            (Events{"open:a", "attr:href", "chars:h/x", "tagend", "close:a"}));
  // Line feeds inside quotes are dropped, a '>' inside them does not end the tag.
  EXPECT_EQ(Tokenize("<p t=\"a\nb>c\">x<br>"),
            (Events{"open:p", "attr:t", "value:ab>c", "tagend", "text:x", "open:br", "tagend"}));
  // End tags of void elements say nothing; whatever follows an end tag's name is skipped.
  EXPECT_EQ(Tokenize("</BR></Div x=\">\"y><br>"),
            (Events{"close:div", "text:\"y>", "open:br", "tagend"}));
  // "<br/>" without attributes closes at once; a tag without a name is still a tag.
  EXPECT_EQ(Tokenize("<BR/>< b>"),
            (Events{"open:br", "tagend", "close:br", "open:", "attr:b", "tagend"}));
}

}  // namespace
