// The pieces of the HTML handler on their own: percent-decoding, the refresh parser, the
// element tracker's limits and the script string extractor's hand-overs.
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "engine/html/decrunch_limits.h"
#include "engine/html/element_tracker.h"
#include "engine/html/percent_decoding.h"
#include "engine/html/refresh_parser.h"
#include "engine/html/script_text_extractor.h"
#include "tests/engine/html/decrunch_test_support.h"

namespace {

using decrunch_test::Events;
using html_decrunch::RefreshParser;

TEST(DecrunchPercentDecoding, OnlyHexPairsAreDecoded) {
  EXPECT_EQ(html_decrunch::percentDecode("a%41%2f%zz%4g%%41%"), "aA/%zz%4g%%41%");
  EXPECT_EQ(html_decrunch::percentDecode("%4"), "%4");
  EXPECT_EQ(html_decrunch::percentDecode("%00x"), std::string("\0x", 2));
}

// The target bytes the parser hands back, and its fallback text.
std::pair<std::string, std::string> ReadRefresh(const std::string& content) {
  RefreshParser parser;
  parser.reset();
  std::string target;
  for (const char c : content) {
    const RefreshParser::Step step = parser.feed(static_cast<std::uint8_t>(c));
    if (step == RefreshParser::Step::kFirstUrl) target += '|';
    if (step != RefreshParser::Step::kNone) target += c;
  }
  return {target, parser.fallback()};
}

TEST(DecrunchRefreshParser, DelayUrlAndFallback) {
  using Result = std::pair<std::string, std::string>;
  EXPECT_EQ(ReadRefresh("  10 ;\t URL  = data:x y"), (Result{"|data:x y", ""}));
  EXPECT_EQ(ReadRefresh("0;url='a'"), (Result{"|'a'", ""}));
  EXPECT_EQ(ReadRefresh("5"), (Result{"", ""}));
  EXPECT_EQ(ReadRefresh("width=device"), (Result{"", "width=device"}));
  EXPECT_EQ(ReadRefresh("5;u rl=x"), (Result{"", "5;u rl=x"}));
  EXPECT_EQ(ReadRefresh("5 5;url=x"), (Result{"", "5 5;url=x"}));
  // The raw text and the fallback are bounded.
  const std::string blanks(3 * html_decrunch::kMaxRefreshTextBytes, ' ');
  EXPECT_EQ(ReadRefresh(blanks + "x").second.size(), html_decrunch::kMaxRefreshTextBytes);
  EXPECT_EQ(ReadRefresh("x" + blanks).second.size(), html_decrunch::kMaxRefreshTextBytes);
}

// The same through feedUpToTarget in runs of every length: the run stops right after the
// target's first byte, and what the parser ends with does not depend on the cuts.
TEST(DecrunchRefreshParser, RunsUpToTheTargetAsByteByByte) {
  const std::vector<std::string> contents = {
      "  10 ;\t URL  = data:x y",
      "0;url='a'",
      "5",
      "width=device",
      "5;u rl=x",
      "5 5;url=x",
      "0; url=",
      "0;url= \n x",
      std::string(600, ' ') + "1;url=" + std::string(600, 'z')};
  for (const std::string& content : contents) {
    const auto expected = ReadRefresh(content);
    for (std::size_t cut = 1; cut <= content.size(); ++cut) {
      RefreshParser parser;
      parser.reset();
      std::string target;
      std::size_t at = 0;
      while (at < content.size()) {
        const std::size_t run = std::min(cut, content.size() - at);
        if (parser.inTarget()) {
          target.append(content, at, run);
          at += run;
          continue;
        }
        if (parser.gaveUp()) {
          parser.addFallback(content.data() + at, run);
          at += run;
          continue;
        }
        const std::size_t taken = parser.feedUpToTarget(content.data() + at, run);
        ASSERT_GT(taken, 0u);
        at += taken;
        if (parser.inTarget()) target += '|' + content.substr(at - 1, 1);
      }
      EXPECT_EQ(target, expected.first) << content << ", runs of " << cut;
      EXPECT_EQ(parser.fallback(), expected.second) << content << ", runs of " << cut;
    }
  }
}

class ClosedNames : public html_decrunch::ElementTracker::Listener {
 public:
  void elementClosed(std::string_view name) override { names.emplace_back(name); }
  std::vector<std::string> names;
};

TEST(DecrunchElementTracker, TrackedKindsVoidElementsAndHead) {
  ClosedNames closed;
  html_decrunch::ElementTracker tracker(closed);
  for (const char* name : {"html", "head", "title", "body", "a", "b", "a", "img"}) {
    tracker.open(name);
    tracker.startTagEnded();
  }
  tracker.close("br");  // void: ignored
  tracker.close("x");   // not open: nothing
  EXPECT_EQ(closed.names, (std::vector<std::string>{"head", "title", "a", "b", "img"}));
  EXPECT_EQ(tracker.openNames(), (std::vector<std::string>{"html", "body", "a"}));
  tracker.close("html");
  EXPECT_EQ(tracker.openNames(), std::vector<std::string>{});
}

TEST(DecrunchElementTracker, ForgetsTheOldestPastItsLimits) {
  ClosedNames closed;
  html_decrunch::ElementTracker tracker(closed);
  tracker.open("select");
  for (std::size_t i = 0; i < html_decrunch::kMaxOpenElements; ++i) tracker.open("p");
  // The select was forgotten, not closed, and no longer counts as open.
  EXPECT_TRUE(closed.names.empty());
  EXPECT_EQ(tracker.openNames().size(), html_decrunch::kMaxOpenElements);
  tracker.open("select");
  tracker.close("select");
  EXPECT_EQ(closed.names, std::vector<std::string>{"select"});
  // Long names are bounded by their bytes.
  const std::string longName(1024, 'n');
  for (int i = 0; i < 200; ++i) tracker.open(longName);
  EXPECT_LE(tracker.openNames().size(), html_decrunch::kMaxOpenElementNameBytes / 1024);
  tracker.close("p");  // every p was forgotten under the long names
  EXPECT_EQ(closed.names.size(), 1u);
}

class Pieces : public html::Decrunch::TextHandler {
 public:
  void text(const char* data, std::size_t n) override { events.emplace_back(data, n); }
  void breakText() override { events.push_back("<break>"); }
  void end() override { events.push_back("<end>"); }
  Events events;
};

TEST(DecrunchScriptExtractor, HandOversAndUrlsAcrossThem) {
  decrunch_test::Recorder receiver;
  Pieces pieces;
  {
    html_decrunch::ScriptTextExtractor extractor(pieces, receiver);
    const std::string script =
        "a = '" + std::string(990, 'x') + "http://split.example/path?q';" + " b = 'ftp://x%2Ecom%4";
    extractor.feed(script.data(), script.size());
    extractor.finish();
  }
  EXPECT_EQ(pieces.events, (Events{std::string(990, 'x') + "http://s",
                                   "plit.example/path?q'ftp://x.com%4", "<end>"}));
  // A URL may span hand-overs; the run still open at the end of the script counts too.
  EXPECT_EQ(receiver.events, (Events{"script_url:split.example/path", "script_url:x.com%4"}));
}

TEST(DecrunchScriptExtractor, RunsOfPercentSignsDoNotOverflowTheBuffer) {
  decrunch_test::Recorder receiver;
  Pieces pieces;
  html_decrunch::ScriptTextExtractor extractor(pieces, receiver);
  const std::string script = "'" + std::string(5000, '%') + "'";
  extractor.feed(script.data(), script.size());
  extractor.finish();
  std::size_t total = 0;
  for (const std::string& piece : pieces.events) {
    EXPECT_LE(piece.size(), html_decrunch::kScriptTextBytes);
    if (piece != "<end>") total += piece.size();
  }
  EXPECT_EQ(total, 5001u);
}

}  // namespace
