// Hostile pages: nesting that would exhaust the stack, pages of a million elements, huge
// scripts and attribute values. Memory must stay bounded and nothing may fail.
#include <gtest/gtest.h>
#include <malloc.h>

#include <algorithm>
#include <functional>
#include <string>

#include "engine/html/decrunch.h"
#include "tests/engine/html/decrunch_test_support.h"

namespace {

std::size_t HeapInUse() {
  const struct mallinfo2 info = mallinfo2();
  return info.uordblks + info.hblkhd;
}

// Keeps only counts, so that the heap measurements see the pipeline alone.
class CountingReceiver : public html::Decrunch::Handler {
 public:
  class Sink : public html::Decrunch::TextHandler {
   public:
    void text(const char*, std::size_t n) override { bytes += n; }
    void breakText() override {}
    void end() override { ++ends; }
    std::size_t bytes = 0;
    std::size_t ends = 0;
  };

  void text(const char*, std::size_t n) override {
    textBytes += n;
    if (depth > 0) nestedTextBytes += n;
  }
  void breakText() override {}
  void end() override {}
  void url(std::string_view value, html::UrlKind) override { lastUrlBytes = value.size(); }
  void scriptUrl(std::string_view) override {}
  TextHandler* commentSink() override { return nullptr; }
  TextHandler* titleSink() override { return &title; }
  TextHandler* descriptionSink() override { return &description; }
  TextHandler* selectSink() override { return nullptr; }
  TextHandler* anchorSink(const html_decrunch::HtmlHandler& h) override {
    ++anchors;
    lastHrefBytes = h.first().value.size();
    if (h.first().value == "/bottom") ++bottoms;
    return &anchor;
  }
  TextHandler* scriptSink(const html_decrunch::HtmlHandler&) override { return &script; }
  void input(const html_decrunch::HtmlHandler&) override {}
  void beginNested() override { maxDepth = std::max(maxDepth, ++depth); }
  void endNested() override {
    if (depth-- == 0) unbalanced = true;
  }

  Sink title, description, anchor, script;
  std::size_t textBytes = 0, nestedTextBytes = 0, anchors = 0, bottoms = 0;
  std::size_t lastHrefBytes = 0, lastUrlBytes = 0;
  std::size_t depth = 0, maxDepth = 0;
  bool unbalanced = false;
};

// Feeds head, then `body` repeated `times`, then tail, in pieces; returns the largest growth
// of the heap seen while the body streamed in.
std::size_t PeakGrowth(html::Decrunch& pipeline, const std::string& head, const std::string& body,
                       std::size_t times, const std::string& tail) {
  pipeline.feed(head.data(), head.size());
  const std::size_t before = HeapInUse();
  std::size_t peak = before;
  for (std::size_t i = 0; i < times; ++i) {
    pipeline.feed(body.data(), body.size());
    if (i % 64 == 0) peak = std::max(peak, HeapInUse());
  }
  pipeline.feed(tail.data(), tail.size());
  return std::max(peak, HeapInUse()) - before;
}

constexpr std::size_t kChunk = 64 * 1024;
constexpr std::size_t k50MB = 800;  // chunks of kChunk
constexpr std::size_t k8MB = 128;

// HTML in a script string, percent-encoded so that each level survives the decoding of the
// levels above it. Its size grows with the square of the depth, not exponentially.
std::string ScriptNest(std::size_t levels) {
  std::string page = "<a href=/bottom>bottom</a><br>";
  for (std::size_t i = 0; i < levels; ++i) {
    std::string encoded;
    for (const char c : page) {
      if (c == '%' || c == '<' || c == '\'' || c == '\\') {
        static constexpr char kHex[] = "0123456789ABCDEF";
        encoded += '%';
        encoded += kHex[static_cast<std::uint8_t>(c) >> 4];
        encoded += kHex[c & 15];
      } else {
        encoded += c;
      }
    }
    page = "<script>w('" + encoded + "')</script>";
  }
  return page;
}

std::string RefreshNest(std::size_t levels) {
  std::string page = "<a href=/bottom>bottom</a><br>";
  for (std::size_t i = 0; i < levels; ++i) {
    page = "<meta content='0;url=data:text/html;base64," + decrunch_test::Base64(page) + "'>";
  }
  return page;
}

CountingReceiver Count(const std::string& page) {
  CountingReceiver receiver;
  {
    html::Decrunch pipeline(receiver, false);
    pipeline.feed(page.data(), page.size());
  }
  return receiver;
}

TEST(DecrunchHostile, NestingStopsAtItsLimit) {
  for (const auto& nest : {std::function<std::string(std::size_t)>(ScriptNest),
                           std::function<std::string(std::size_t)>(RefreshNest)}) {
    const CountingReceiver atLimit = Count(nest(html::kMaxDecrunchNesting));
    EXPECT_EQ(atLimit.bottoms, 1u);
    EXPECT_EQ(atLimit.maxDepth, html::kMaxDecrunchNesting);
    const CountingReceiver beyond = Count(nest(html::kMaxDecrunchNesting + 1));
    EXPECT_EQ(beyond.bottoms, 0u);
    EXPECT_EQ(beyond.maxDepth, html::kMaxDecrunchNesting);
    EXPECT_FALSE(atLimit.unbalanced || beyond.unbalanced);
    EXPECT_EQ(beyond.depth, 0u);
  }
  // Far deeper than any stack would survive without the limit.
  const CountingReceiver deep = Count(ScriptNest(300));
  EXPECT_EQ(deep.maxDepth, html::kMaxDecrunchNesting);
  EXPECT_EQ(deep.depth, 0u);
}

TEST(DecrunchHostile, AMillionAnchorsAndUnclosedElements) {
  CountingReceiver receiver;
  html::Decrunch pipeline(receiver, false);
  // Two anchors a unit, one closed by its end tag and one by the next anchor.
  const std::string unit = "<a href=/x>y</a><div><a href=/z>w<p>";
  std::string body;
  for (int i = 0; i < 1000; ++i) body += unit;
  const std::size_t growth = PeakGrowth(pipeline, "<body>", body, 500, "</a><br>");
  EXPECT_GE(receiver.anchors, 1'000'000u);
  EXPECT_EQ(receiver.anchor.ends, receiver.anchors);
  EXPECT_LE(pipeline.handler().openElements().size(), html_decrunch::kMaxOpenElements);
  EXPECT_LT(growth, 2u * 1024 * 1024);
}

TEST(DecrunchHostile, FiftyMegabyteScripts) {
  const std::string chunk(kChunk, 'x');
  {
    CountingReceiver receiver;
    html::Decrunch pipeline(receiver, false);
    EXPECT_LT(PeakGrowth(pipeline, "<script>s = '", chunk, k50MB, "';</script>"), 1024u * 1024);
    EXPECT_EQ(receiver.script.bytes, k50MB * kChunk + 1);
  }
  {
    // The same, as HTML written by the script: a nested page of 50 MB.
    CountingReceiver receiver;
    html::Decrunch pipeline(receiver, false);
    EXPECT_LT(PeakGrowth(pipeline, "<script>s = '<p>", chunk, k50MB, "<br>';</script>"),
              1024u * 1024);
    EXPECT_EQ(receiver.nestedTextBytes, k50MB * kChunk);
    EXPECT_EQ(receiver.maxDepth, 1u);
  }
}

TEST(DecrunchHostile, FiftyMegabyteAttributeValues) {
  const std::string chunk(kChunk, 'v');
  // Collected values keep what the tokenizer keeps; the handler adds one decoded copy.
  // Allocators that keep malloc's statistics to themselves (the sanitizers') report no
  // growth at all: the bounds are then checked only through what the receiver got.
  bool heapMeasured = true;
  for (const char* head : {"<a href=\"", "<img src=\"", "<input type=image src=\""}) {
    CountingReceiver receiver;
    html::Decrunch pipeline(receiver, false);
    const std::size_t growth = PeakGrowth(pipeline, head, chunk, k50MB, "\">t</a>");
    EXPECT_EQ(std::max(receiver.lastHrefBytes, receiver.lastUrlBytes),
              html::kMaxAttributeValueBytes)
        << head;
    if (growth == 0) {
      heapMeasured = false;
      continue;
    }
    EXPECT_GE(growth, html::kMaxAttributeValueBytes) << head;
    EXPECT_LT(growth, 4 * html::kMaxAttributeValueBytes) << head;
  }
  if (!heapMeasured) GTEST_SKIP() << "heap statistics are not available";
  // Streamed values are never stored: alternative text, descriptions, refresh contents
  // (whose fallback is bounded) and refresh targets that are no data URL.
  for (const char* head : {"<img alt=\"", "<meta name=description content=\"", "<meta content=\"",
                           "<meta content=\"0;url="}) {
    CountingReceiver receiver;
    html::Decrunch pipeline(receiver, false);
    EXPECT_LT(PeakGrowth(pipeline, head, chunk, k8MB, "\" name=description content=d>"),
              256u * 1024)
        << head;
  }
}

TEST(DecrunchHostile, MetaUrlDecoderGivesUpAfterTooManyRejectedBytes) {
  for (const std::size_t junk :
       {html_decrunch::kMaxMetaUrlRejectedBytes - 1, html_decrunch::kMaxMetaUrlRejectedBytes}) {
    const CountingReceiver receiver =
        Count("<meta content=\"0;url=" + std::string(junk, 'j') + "data:,<a href=/bottom>x</a>\">");
    EXPECT_EQ(receiver.bottoms, junk < html_decrunch::kMaxMetaUrlRejectedBytes ? 1u : 0u);
  }
}

}  // namespace
