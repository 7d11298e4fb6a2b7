// Handlers for the HTML benchmarks that want what the page analysis wants and only count.
#pragma once

#include <cstddef>
#include <string_view>

#include "engine/html/decrunch.h"
#include "engine/html/tokenizer_handler.h"

namespace bench_scan {

// A tokenizer handler: a few URL attributes collected, image text streamed, script text
// delivered, everything else skipped.
class AnalyserLikeHandler {
 public:
  struct Sink {
    void text(const char*, std::size_t n) { bytes += n; }
    void end() {}
    std::size_t bytes = 0;
  };

  void text(const char*, std::size_t n) { textBytes += n; }
  bool openElement(std::string_view name) {
    ++elements;
    return name == "a" || name == "img" || name == "input" || name == "form" || name == "link" ||
           name == "meta" || name == "script" || name == "iframe";
  }
  bool startTagEnd() { return true; }
  void closeElement(std::string_view) {}
  int attributeName(std::string_view name) {
    if (name == "href" || name == "src" || name == "action" || name == "content") {
      return html::kAttrCollect;
    }
    if (name == "alt" || name == "placeholder") return html::kAttrStream;
    return html::kAttrSkip;
  }
  void attributeValue(std::string_view value) { valueBytes += value.size(); }
  void attributeChar(char) { ++valueBytes; }
  Sink* commentSink() { return &comments; }
  void scriptText(const char*, std::size_t n) { scriptBytes += n; }

  std::size_t elements = 0;
  std::size_t textBytes = 0;
  std::size_t valueBytes = 0;
  std::size_t scriptBytes = 0;
  Sink comments;
};

// A pipeline receiver that takes what the page analysis takes: page text, title,
// description, anchors and scripts (no comment or select sinks).
class CountingReceiver final : public html::Decrunch::Handler {
 public:
  class Sink final : public html::Decrunch::TextHandler {
   public:
    void text(const char*, std::size_t n) override { bytes += n; }
    void breakText() override {}
    void end() override {}
    std::size_t bytes = 0;
  };

  void text(const char*, std::size_t n) override { textBytes += n; }
  void breakText() override {}
  void end() override {}
  void url(std::string_view, html::UrlKind) override { ++urls; }
  void scriptUrl(std::string_view) override { ++urls; }
  TextHandler* commentSink() override { return nullptr; }
  TextHandler* titleSink() override { return &sink; }
  TextHandler* descriptionSink() override { return &sink; }
  TextHandler* selectSink() override { return nullptr; }
  TextHandler* anchorSink(const html_decrunch::HtmlHandler&) override { return &sink; }
  TextHandler* scriptSink(const html_decrunch::HtmlHandler&) override { return &sink; }
  void input(const html_decrunch::HtmlHandler&) override { ++inputs; }
  void beginNested() override {}
  void endNested() override {}

  Sink sink;
  std::size_t textBytes = 0;
  std::size_t urls = 0;
  std::size_t inputs = 0;
};

// The size the web session hands over.
inline constexpr std::size_t kChunk = 4096;

}  // namespace bench_scan
