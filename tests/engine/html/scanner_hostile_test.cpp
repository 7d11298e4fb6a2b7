// Hostile input: what an attacker controls must neither cost memory it should not nor make
// a scanner fail in an undocumented way.
#include <gtest/gtest.h>
#include <malloc.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "engine/common/error.h"
#include "engine/html/json_state_machine.h"
#include "tests/engine/html/scan_test_support.h"

namespace {

using html_test::Events;
using html_test::RecordingHandler;

std::size_t HeapInUse() {
  const struct mallinfo2 info = mallinfo2();
  return info.uordblks + info.hblkhd;
}

// Remembers only sizes, so that the measurement sees the tokenizer's memory alone.
class CountingHandler {
 public:
  struct Sink {
    void text(const char*, std::size_t) {}
    void end() {}
  };
  explicit CountingHandler(bool report, int mode) : report_(report), mode_(mode) {}
  void text(const char*, std::size_t) {}
  bool openElement(std::string_view) { return report_; }
  bool startTagEnd() { return false; }
  void closeElement(std::string_view) {}
  int attributeName(std::string_view) { return mode_; }
  void attributeValue(std::string_view value) { valueBytes += value.size(); }
  void attributeChar(char) { ++streamedBytes; }
  Sink* commentSink() { return nullptr; }
  void scriptText(const char*, std::size_t) {}

  std::size_t valueBytes = 0;
  std::size_t streamedBytes = 0;

 private:
  bool report_;
  int mode_;
};

// Feeds a start tag with a 10 MB value; returns the largest growth of the heap seen while
// the value streamed in.
std::size_t PeakGrowthOverHugeValue(CountingHandler& handler, const char* quote) {
  html::FastParserMachine<char, CountingHandler> tokenizer(handler);
  const std::string chunk(64 * 1024, 'v');
  const std::string head = std::string("<a href=") + quote;
  tokenizer.feed(head.data(), head.size());
  const std::size_t before = HeapInUse();
  std::size_t peak = before;
  for (int i = 0; i < 160; ++i) {
    tokenizer.feed(chunk.data(), chunk.size());
    peak = std::max(peak, HeapInUse());
  }
  const std::string tail = std::string(quote) + " b>";
  tokenizer.feed(tail.data(), tail.size());
  return peak - before;
}

TEST(ScannerHostile, SkippedHugeAttributeValueCostsNoMemory) {
  // The measurement must see a value that is stored: a collected one is, up to its limit.
  CountingHandler collect(true, html::kAttrCollect);
  const std::size_t collected = PeakGrowthOverHugeValue(collect, "\"");
  if (collected == 0) GTEST_SKIP() << "heap statistics are not available";
  EXPECT_EQ(collect.valueBytes, html::kMaxAttributeValueBytes);
  EXPECT_GE(collected, html::kMaxAttributeValueBytes);
  EXPECT_LT(collected, 4 * html::kMaxAttributeValueBytes);

  for (const char* quote : {"\"", "'", ""}) {
    CountingHandler unreported(false, html::kAttrCollect);
    EXPECT_LT(PeakGrowthOverHugeValue(unreported, quote), 16u * 1024) << quote;
    CountingHandler skipped(true, html::kAttrSkip);
    EXPECT_LT(PeakGrowthOverHugeValue(skipped, quote), 16u * 1024) << quote;
    CountingHandler streamed(true, html::kAttrStream);
    EXPECT_LT(PeakGrowthOverHugeValue(streamed, quote), 16u * 1024) << quote;
    EXPECT_EQ(streamed.streamedBytes, 160u * 64 * 1024) << quote;
  }
}

std::string RandomDocument(std::mt19937& random) {
  // Separated by '|': the bytes that matter to some state of some scanner.
  static const std::vector<std::string> pieces = [] {
    std::vector<std::string> list;
    std::string_view all =
        "<|>|/|</|<!--|-->|--|=|\"|'| |\n|\t|script|SCRIPT|style|noscript|</script>|</style>|"
        "</noscript>|a|href|x|\\|\\u|0|9|e|E|{|}|[|]|:|,|-|+|.|true|nul|data:|base64|;|%|%4|"
        "\x80|\xA0|\xff|*|/*|*/|//|&|#|(|)";
    for (std::size_t bar; (bar = all.find('|')) != std::string_view::npos;
         all.remove_prefix(bar + 1))
      list.emplace_back(all.substr(0, bar));
    list.emplace_back(all);
    list.emplace_back(1, '\0');
    list.emplace_back(1100, 'w');
    return list;
  }();
  std::string doc;
  const std::size_t n = random() % 300;
  for (std::size_t i = 0; i < n; ++i) doc += pieces[random() % pieces.size()];
  return doc;
}

// Every machine over documents made of the bytes that matter to some state; the only error
// allowed is the data-URL decoder's header error.
TEST(ScannerHostile, RandomInputNeverFailsAndStaysBounded) {
  std::mt19937 random(20240611);
  for (int round = 0; round < 400; ++round) {
    std::string doc = RandomDocument(random);
    if (round % 4 == 3) {  // some rounds in raw bytes
      for (char& c : doc) c = static_cast<char>(random());
    }
    RecordingHandler::Policy policy;
    policy.reportAttributes = random() % 4 != 0;
    policy.defaultMode = static_cast<int>(random() % 4);
    policy.rawText = random() % 2 == 0;
    policy.comments = random() % 2 == 0;
    RecordingHandler handler(policy);
    html_test::Tokenizer tokenizer(handler);
    utils::JSONStateMachine<char> json;
    html_test::StringRecorder strings;
    ap::JSParser<char> script(&strings);
    html_test::ByteRecorder bytes;
    utils::DataUrlMachine dataUrl(bytes);
    for (const char c : doc) {
      ASSERT_NO_THROW(tokenizer.feed(&c, 1)) << round;
      ASSERT_LE(tokenizer.depth(), 9u);
      ASSERT_NO_THROW(json.feed(&c, 1)) << round;
      ASSERT_NO_THROW(script.feed(&c, 1)) << round;
      try {
        dataUrl.feed(static_cast<std::uint8_t>(c));
      } catch (const ap::Error& e) {
        ASSERT_STREQ(e.what(), utils::DataUrlMachine::kHeaderError);
      }
    }
    ASSERT_NO_THROW(script.finish());
    ASSERT_LE(json.nesting(), utils::kMaxJsonNesting);
  }
}

// Input may stop anywhere. Scanners never look back, so what they report for a cut document
// is exactly the start of what they report for the whole one, and destroying them mid-token
// is clean.
TEST(ScannerHostile, UnterminatedAtEveryPoint) {
  const std::string page =
      "<html><!-- c --><a href=\"h\" title='t' x=y/><script>s('</scr')</script>"
      "<style>p{}</style><noscript><b></noscript><p a=b>text<br/></p></html>";
  const Events full = html_test::Tokenize(page);
  const std::string script = "a = /re'/; s = \"x\\u00e9\\\"y\" // c\n/* m */ t = 'q\\u4";
  Events fullStrings = html_test::ScanScript(script);
  fullStrings.erase(std::find(fullStrings.begin(), fullStrings.end(), "<finish>"),
                    fullStrings.end());
  for (std::size_t cut = 0; cut <= page.size(); ++cut) {
    const Events events = html_test::Tokenize(std::string_view(page).substr(0, cut));
    ASSERT_LE(events.size(), full.size());
    EXPECT_TRUE(std::equal(events.begin(), events.end(), full.begin())) << "cut at " << cut;
  }
  for (std::size_t cut = 0; cut <= script.size(); ++cut) {
    Events events = html_test::ScanScript(std::string_view(script).substr(0, cut));
    events.erase(std::find(events.begin(), events.end(), "<finish>"), events.end());
    ASSERT_LE(events.size(), fullStrings.size());
    EXPECT_TRUE(std::equal(events.begin(), events.end(), fullStrings.begin())) << "cut at " << cut;
  }
}

}  // namespace
