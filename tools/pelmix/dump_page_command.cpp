// pelmix dump page: the page through a whole decrunch pipeline, with a receiver that prints
// every call it gets and hands out a sink for every request, each printing its own calls. It
// shows exactly what the page feature extractor would receive.
#include <array>
#include <iostream>
#include <memory>
#include <string_view>

#include "engine/html/decrunch.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/dump_input.h"
#include "tools/pelmix/json_lines.h"

namespace pelmix::cli {
namespace {

class PrintingReceiver final : public html::Decrunch::Handler {
 public:
  class Sink final : public html::Decrunch::TextHandler {
   public:
    explicit Sink(std::string_view name) : name_(name) {}
    void text(const char* data, std::size_t n) override {
      JsonLine()
          .Bytes("ev", "text")
          .Bytes("sink", name_)
          .Bytes("data", std::string_view(data, n))
          .Write(std::cout);
    }
    void breakText() override {
      JsonLine().Bytes("ev", "break").Bytes("sink", name_).Write(std::cout);
    }
    void end() override { JsonLine().Bytes("ev", "end").Bytes("sink", name_).Write(std::cout); }

   private:
    std::string_view name_;
  };

  void text(const char* data, std::size_t n) override {
    JsonLine().Bytes("ev", "text").Bytes("data", std::string_view(data, n)).Write(std::cout);
  }
  void breakText() override { JsonLine().Bytes("ev", "break").Write(std::cout); }
  void end() override { JsonLine().Bytes("ev", "end").Write(std::cout); }
  void url(std::string_view value, html::UrlKind kind) override {
    JsonLine().Bytes("ev", "url").Int("kind", kind).Bytes("url", value).Write(std::cout);
  }
  void scriptUrl(std::string_view text) override {
    JsonLine().Bytes("ev", "script_url").Bytes("url", text).Write(std::cout);
  }
  TextHandler* commentSink() override { return hand(comment_); }
  TextHandler* titleSink() override { return hand(title_); }
  TextHandler* descriptionSink() override { return hand(description_); }
  TextHandler* selectSink() override { return hand(select_); }
  TextHandler* anchorSink(const html_decrunch::HtmlHandler& handler) override {
    return hand(anchor_, &handler);
  }
  TextHandler* scriptSink(const html_decrunch::HtmlHandler& handler) override {
    return hand(script_, &handler);
  }
  void input(const html_decrunch::HtmlHandler& handler) override {
    JsonLine()
        .Bytes("ev", "input")
        .Bytes("type", handler.first().value)
        .Bytes("src", handler.second().value)
        .Bytes("value", handler.third().value)
        .Write(std::cout);
  }
  void beginNested() override { JsonLine().Bytes("ev", "begin_nested").Write(std::cout); }
  void endNested() override { JsonLine().Bytes("ev", "end_nested").Write(std::cout); }

 private:
  struct NamedSink {
    std::string_view name;
    Sink sink{name};
  };

  // Anchors and scripts show the href or src the handler holds when the sink is asked for.
  TextHandler* hand(NamedSink& named, const html_decrunch::HtmlHandler* handler = nullptr) {
    JsonLine line;
    line.Bytes("ev", "sink").Bytes("sink", named.name);
    if (handler != nullptr) line.Bytes("href", handler->first().value);
    line.Write(std::cout);
    return &named.sink;
  }

  NamedSink comment_{"comment"};
  NamedSink title_{"title"};
  NamedSink description_{"description"};
  NamedSink select_{"select"};
  NamedSink anchor_{"anchor"};
  NamedSink script_{"script"};
};

int RunDumpPage(const std::vector<std::string>& args, const GlobalOptions&) {
  PrintingReceiver receiver;
  auto pipeline = std::make_unique<html::Decrunch>(receiver, false);
  return RunDumpOverInput(
      "dump page", args,
      [&](std::string_view chunk) { pipeline->feed(chunk.data(), chunk.size()); },
      [&] {
        // What the pipeline does when it goes (finishing an open script) comes before the
        // verdict of the JSON validator, which is the last line.
        const bool accepted = pipeline->jsonAccepted();
        pipeline.reset();
        JsonLine().Bytes("ev", "json").Bool("accepted", accepted).Write(std::cout);
      });
}

}  // namespace

PELMIX_COMMAND({"dump page", "[--chunk N] FILE|-",
                "print what the decrunch pipeline hands the page analysis, as JSON Lines",
                RunDumpPage})

}  // namespace pelmix::cli
