// A receiver that fails: the failure reaches the caller of feed, and the pipeline's parts
// stay in step (the validator and the byte counter see every chunk the tokenizer was given),
// so that a later verdict is not taken on a half-seen page, and feeding on is safe.
#include <gtest/gtest.h>

#include <random>
#include <stdexcept>
#include <string>

#include "tests/engine/html/decrunch_test_support.h"
#include "tests/engine/html/scan_test_support.h"

namespace {

using decrunch_test::Events;

// Records like the test recorder and fails at chosen calls.
class FailingRecorder : public decrunch_test::Recorder {
 public:
  // Fails at the page text's text call number `textCall` (0: never), and from `everyCall`
  // on at every such call of any kind (0: never).
  explicit FailingRecorder(std::size_t textCall = 0, std::size_t everyCall = 0)
      : textCall_(textCall), everyCall_(everyCall) {}

  void text(const char* data, std::size_t n) override {
    tick();
    if (++texts_ == textCall_) throw std::runtime_error("receiver failed");
    Recorder::text(data, n);
  }
  void breakText() override {
    tick();
    Recorder::breakText();
  }
  void url(std::string_view value, html::UrlKind kind) override {
    tick();
    Recorder::url(value, kind);
  }
  TextHandler* commentSink() override {
    tick();
    return &comment_;
  }
  TextHandler* titleSink() override {
    tick();
    return Recorder::titleSink();
  }
  TextHandler* anchorSink(const html_decrunch::HtmlHandler& h) override {
    tick();
    return Recorder::anchorSink(h);
  }
  TextHandler* scriptSink(const html_decrunch::HtmlHandler&) override {
    tick();
    return &script_;
  }
  void beginNested() override {
    tick();
    Recorder::beginNested();
  }

  // Sinks whose end fails once.
  class FailingSink : public html::Decrunch::TextHandler {
   public:
    FailingSink(std::string name, Events& events) : name_(std::move(name)), events_(events) {}
    void text(const char*, std::size_t) override {}
    void breakText() override {}
    void end() override {
      events_.push_back(name_ + ".end");
      if (!failed_) {
        failed_ = true;
        throw std::runtime_error("sink failed");
      }
    }

   private:
    std::string name_;
    Events& events_;
    bool failed_ = false;
  };

 private:
  void tick() {
    if (everyCall_ != 0 && ++calls_ >= everyCall_ && calls_ % 3 == 0) {
      throw std::runtime_error("receiver failed");
    }
  }

  std::size_t textCall_;
  std::size_t everyCall_;
  std::size_t texts_ = 0;
  std::size_t calls_ = 0;
  FailingSink comment_{"comment", events};
  FailingSink script_{"script", events};
};

TEST(DecrunchFailure, ValidatorAndCounterSeeTheChunkTheReceiverFailedIn) {
  FailingRecorder receiver(1);
  html::Decrunch pipeline(receiver, false);
  const std::string json = "{\"a\": [1, 2]}";
  pipeline.feed(json.data(), json.size());
  ASSERT_TRUE(pipeline.jsonAccepted());
  const std::string markup = "<p>x<br><p>more";
  EXPECT_THROW(pipeline.feed(markup.data(), markup.size()), std::runtime_error);
  // The page is no JSON, whatever the receiver did with its text.
  EXPECT_FALSE(pipeline.jsonAccepted());
  EXPECT_EQ(pipeline.byteCount(), json.size() + markup.size());
}

// A comment whose sink fails at its end, and a script whose sink does: the page goes on.
TEST(DecrunchFailure, FeedingOnAfterASinkFailedAtItsEnd) {
  FailingRecorder receiver;
  html::Decrunch pipeline(receiver, false);
  auto feed = [&](const std::string& s) { pipeline.feed(s.data(), s.size()); };
  EXPECT_THROW(feed("<!-- c -->"), std::runtime_error);
  // The comment's state outlived its sink: the rest of it goes nowhere.
  feed(std::string(3000, 'x') + "-->after<br>");
  EXPECT_THROW(feed("<script>s = 'q';</script>"), std::runtime_error);
  feed("not page text</script>later" + std::string(1, '\0') + "<br>");
  EXPECT_EQ(receiver.events, (Events{"comment.end", "text:after", "break", "script.end",
                                     "text:later" + std::string(1, '\0'), "break"}));
}

// Receivers failing at random calls over random pages: whatever fails, nothing breaks and
// the counter stays in step.
TEST(DecrunchFailure, RandomFailuresLeaveThePipelineUsable) {
  std::mt19937 random(99);
  const std::vector<std::string> pieces = {"<a href=/a>",
                                           "</a>",
                                           "<title>",
                                           "</title>",
                                           "<!--",
                                           "-->",
                                           "<script>",
                                           "</script>",
                                           "'str'",
                                           "\"<p>x\"",
                                           "<br>",
                                           "text",
                                           "&amp;",
                                           "<meta http-equiv=refresh content='0;url=",
                                           "data:text/html;base64,PGEgaHJlZj0vYj5C",
                                           "'>",
                                           "<img src=i alt=a>",
                                           std::string(1500, 't')};
  for (int round = 0; round < 200; ++round) {
    std::string page;
    for (int i = random() % 60; i > 0; --i) page += pieces[random() % pieces.size()];
    FailingRecorder receiver(0, 1 + random() % 20);
    std::size_t fed = 0;
    {
      html::Decrunch pipeline(receiver, false);
      for (std::string_view chunk : html_test::RandomChunks(page, round)) {
        try {
          pipeline.feed(chunk.data(), chunk.size());
        } catch (const std::runtime_error&) {
        }
        fed += chunk.size();
        ASSERT_EQ(pipeline.byteCount(), fed);
      }
    }
  }
}

}  // namespace
