#include "engine/html/js_parser.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "engine/common/error.h"
#include "engine/common/trace.h"
#include "tests/engine/html/scan_test_support.h"

namespace {

using html_test::Events;
using html_test::ScanScript;

TEST(ScriptScanner, DivisionAfterAnOperandIsNotARegularExpression) {
  EXPECT_EQ(ScanScript("x = a / b + \"q\" / 2;"), (Events{"q\"", "<finish>"}));
  EXPECT_EQ(ScanScript("y = f(x) / 2; z = 'r';"), (Events{"r'", "<finish>"}));
}

TEST(ScriptScanner, QuotesInsideRegularExpressionsAreNotStrings) {
  EXPECT_EQ(ScanScript("r = /\"[^\"]*\"/g; s = 'ok';"), (Events{"ok'", "<finish>"}));
  EXPECT_EQ(ScanScript("f(/'/); \"s\""), (Events{"s\"", "<finish>"}));
  EXPECT_EQ(ScanScript("x = /a\\/\"b/; \"s\""), (Events{"s\"", "<finish>"}));
  EXPECT_EQ(ScanScript("x = /abc\n\"s\""), (Events{"s\"", "<finish>"}));  // ends at a line end
}

TEST(ScriptScanner, CommentsAreSkipped) {
  EXPECT_EQ(ScanScript("// \"no\"\n/* 'no' **/ \"yes\" /* \"unterminated"),
            (Events{"yes\"", "<finish>"}));
}

TEST(ScriptScanner, EscapesSplitTheText) {
  EXPECT_EQ(ScanScript("\"ab\\\"cd\""), (Events{"ab", "\"", "cd\"", "<finish>"}));
  EXPECT_EQ(ScanScript("'\\b\\n\\r\\t\\q'"),
            (Events{"", "\b", "", "\n", "", "\r", "", "\t", "", "q", "'", "<finish>"}));
}

TEST(ScriptScanner, UnicodeEscapes) {
  EXPECT_EQ(ScanScript("\"\\u00e9\\u20AC\""),
            (Events{"", "\xC3\xA9", "", "\xE2\x82\xAC", "\"", "<finish>"}));
  // Fewer than four digits: given back as written; the breaking byte is an escaped byte.
  EXPECT_EQ(ScanScript("\"\\u41x\""), (Events{"", "\\u41", "x", "\"", "<finish>"}));
  EXPECT_EQ(ScanScript("\"\\un\""), (Events{"", "\\u", "\n", "\"", "<finish>"}));
  // A lone surrogate encodes to nothing.
  EXPECT_EQ(ScanScript("\"\\uD83D!\""), (Events{"", "", "!\"", "<finish>"}));
}

TEST(ScriptScanner, LongStringsComeInPieces) {
  const std::string body(1500, 'a');
  EXPECT_EQ(ScanScript("'" + body + "'"),
            (Events{std::string(1024, 'a'), std::string(476, 'a') + "'", "<finish>"}));
}

TEST(ScriptScanner, FinishHandsOverAPendingString) {
  EXPECT_EQ(ScanScript("var s = \"abc"), (Events{"<finish>", "abc"}));
  EXPECT_EQ(ScanScript("'a' /* 'b'"), (Events{"a'", "<finish>"}));
}

class CapturingLogger : public ap::TraceLoggerI {
 public:
  void Log(const std::string& text, int) override { lines.push_back(text); }
  bool IsEnabled(int) override { return true; }
  std::vector<std::string> lines;
};

TEST(ScriptScanner, UnflushedStringIsTraced) {
  const std::shared_ptr<ap::TraceLoggerI> previous = ap::EngineLogger();
  auto logger = std::make_shared<CapturingLogger>();
  ap::SetEngineLogger(logger);
  {
    html_test::StringRecorder recorder;
    ap::JSParser<char> parser(&recorder);
    const std::string script = "x = 'abc";
    parser.feed(script.data(), script.size());
  }
  ap::SetEngineLogger(previous);
  EXPECT_EQ(logger->lines, std::vector<std::string>{"SCRIPT STRING 3 chars unflushed"});
}

TEST(ScriptScanner, NullHandlerIsRefused) {
  try {
    ap::JSParser<char> parser(nullptr);
    FAIL() << "no error";
  } catch (const ap::Error& e) {
    EXPECT_STREQ(e.what(), "JSParser(): null handler");
  }
}

}  // namespace
