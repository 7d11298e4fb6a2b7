// Hostile pages with their exact events: floods of meta refreshes, megabyte attribute values,
// comments and scripts that never end, runs of '&'. What they cost is measured by the
// benchmarks; here they must say exactly what an ordinary page of the same shape says, and
// must not raise a single engine error on the way.
#include <gtest/gtest.h>

#include <string>

#include "engine/html/decrunch_limits.h"
#include "engine/html/tokenizer_parts.h"
#include "platform/exception_notification.h"
#include "tests/engine/html/decrunch_test_support.h"

namespace {

using decrunch_test::Decrunched;
using decrunch_test::Events;

// Counts the notifications that precede engine errors while it lives.
class ErrorCount {
 public:
  ErrorCount() : previous_(platform::SetExceptionObserver(&Observe)) { count_ = 0; }
  ~ErrorCount() { platform::SetExceptionObserver(previous_); }
  std::size_t count() const { return count_; }

 private:
  static void Observe(std::uint32_t code, std::uint32_t) {
    if (code == platform::kEngineErrorNotification) ++count_;
  }
  static inline std::size_t count_ = 0;
  platform::ExceptionObserver previous_;
};

Events Repeat(const Events& unit, std::size_t times, Events tail) {
  Events events;
  for (std::size_t i = 0; i < times; ++i) events.insert(events.end(), unit.begin(), unit.end());
  events.insert(events.end(), tail.begin(), tail.end());
  return events;
}

// Every refresh target that is no data URL still opens and closes a nested page (the
// decoder's), and decodes nothing.
TEST(DecrunchHostileEvents, RefreshFloods) {
  const std::string longTarget = "https://example.test/" + std::string(1100, 'p');
  struct Case {
    std::string meta;
    std::size_t times;
  };
  const Case cases[] = {
      {"<meta http-equiv=\"refresh\" content=\"0; url=" + longTarget + "\">", 2000},
      {"<meta http-equiv=refresh content='5;URL=/a'>", 50000},
      {"<meta http-equiv=refresh content=\"0;url=d" + std::string(3000, 'a') + "\">", 300},
  };
  for (const Case& c : cases) {
    std::string page;
    for (std::size_t i = 0; i < c.times; ++i) page += c.meta;
    page += "plain<br>";
    ErrorCount errors;
    EXPECT_EQ(Decrunched(page),
              Repeat({"begin_nested", "end_nested"}, c.times, {"text:plain", "break", "json:0"}))
        << c.meta;
    EXPECT_EQ(errors.count(), 0u) << c.meta;
  }
}

// Text around a refresh flood, and a data URL after the flood, arrive as on a plain page.
TEST(DecrunchHostileEvents, DataUrlAfterAFlood) {
  std::string page = "<title>T</title>";
  for (int i = 0; i < 1000; ++i) page += "<meta http-equiv=refresh content='0;url=/x'>";
  page += "<meta http-equiv=refresh content='0;url=data:text/html;base64," +
          decrunch_test::Base64("<a href=/in>In</a><br>") + "'>after<br>";
  ErrorCount errors;
  const Events events = Decrunched(page);
  const Events expected =
      Repeat({"begin_nested", "end_nested"}, 1000,
             {"begin_nested", "sink:anchor:/in", "text:In", "anchor.text:In", "anchor.end", "break",
              "end_nested", "text:after", "break", "json:0"});
  ASSERT_EQ(events.size(), 3 + expected.size());
  EXPECT_EQ(Events(events.begin(), events.begin() + 3),
            (Events{"sink:title", "title.text:T", "title.end"}));
  EXPECT_EQ(Events(events.begin() + 3, events.end()), expected);
  EXPECT_EQ(errors.count(), 0u);
}

TEST(DecrunchHostileEvents, MegabyteAttributeValues) {
  const std::size_t limit = html::kMaxAttributeValueBytes;
  const std::string huge(limit + 1000, 'v');
  const std::string kept(limit, 'v');
  EXPECT_EQ(
      Decrunched("<a href=\"" + huge + "\">t</a><br>"),
      (Events{"sink:anchor:" + kept, "text:t", "anchor.text:t", "anchor.end", "break", "json:0"}));
  EXPECT_EQ(Decrunched("<img src='" + huge + "'><br>"),
            (Events{"url:1:" + kept, "break", "break", "json:0"}));
  // Unquoted, with line feeds (which a quoted value drops), and skipped.
  EXPECT_EQ(Decrunched("<form action=" + huge + "/><br>"),
            (Events{"url:5:" + kept, "break", "json:0"}));
  std::string withFeeds;
  for (std::size_t i = 0; i < limit / 2; ++i) withFeeds += "v\n";
  EXPECT_EQ(Decrunched("<iframe src=\"" + withFeeds + "v\">"),
            (Events{"url:7:" + std::string(limit / 2 + 1, 'v'), "json:0"}));
  EXPECT_EQ(Decrunched("<p title=\"" + huge + "\" data-x=" + huge + ">x<br>"),
            (Events{"text:x", "break", "json:0"}));
}

TEST(DecrunchHostileEvents, CommentsAndScriptsThatNeverEnd) {
  // Comment text leaves in whole 1024-byte pieces; the rest dies with the page.
  const std::string comment(3000, 'c');
  EXPECT_EQ(Decrunched("<p>a<!--" + comment),
            (Events{"sink:comment", "comment.text:" + std::string(1024, 'c'),
                    "comment.text:" + std::string(1024, 'c'), "json:0"}));
  // Script text reaches the string scanner in 1024-byte pieces too: 4096 bytes of the 5005,
  // of which 4091 are the string. Its text is handed on in pieces of 998 and, when the page
  // ends the script, the rest.
  const std::string script = "<script>s = '" + std::string(5000, 'x');
  Events expected{"sink:script:"};
  for (int i = 0; i < 4; ++i) expected.push_back("script.text:" + std::string(998, 'x'));
  expected.push_back("script.text:" + std::string(4091 - 4 * 998, 'x'));
  expected.push_back("script.end");
  expected.push_back("json:0");
  EXPECT_EQ(Decrunched(script), expected);
  // A closing literal cut short and a comment that only looks closed change nothing.
  EXPECT_EQ(Decrunched("<style>" + std::string(5000, '<') + "</styl" + "</style >"),
            (Events{"json:0"}));
  EXPECT_EQ(Decrunched("<!-- -- > ->" + std::string(2000, '-') + ">tail<br>"),
            (Events{"sink:comment", "comment.text: -- > ->" + std::string(1016, '-'),
                    "comment.text:" + std::string(984, '-'), "comment.end", "text:tail", "break",
                    "json:0"}));
}

TEST(DecrunchHostileEvents, RunsOfAmpersands) {
  const std::string amps(5000, '&');
  EXPECT_EQ(Decrunched(amps + "<br>"),
            Repeat({"text:" + std::string(1000, '&')}, 5, {"break", "json:0"}));
  std::string unended;
  for (int i = 0; i < 1000; ++i) unended += "&amp";
  std::string written;
  for (int i = 0; i < 250; ++i) written += "&amp";
  EXPECT_EQ(Decrunched(unended + "<br>"), Repeat({"text:" + written}, 4, {"break", "json:0"}));
  // In an attribute value references are not decoded: the value is kept as written.
  EXPECT_EQ(Decrunched("<a href='" + amps + "'>x</a>"),
            (Events{"sink:anchor:" + amps, "text:x", "anchor.text:x", "anchor.end", "json:0"}));
}

}  // namespace
