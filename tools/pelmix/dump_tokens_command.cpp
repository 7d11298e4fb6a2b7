// pelmix dump tokens: every call the HTML tokenizer makes on a handler that wants everything.
#include <iostream>
#include <string_view>

#include "engine/html/tokenizer.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/dump_input.h"
#include "tools/pelmix/json_lines.h"

namespace pelmix::cli {
namespace {

class DumpTokensHandler {
 public:
  class CommentSink {
   public:
    void text(const char* data, std::size_t n) {
      JsonLine().Bytes("ev", "comment").Bytes("data", std::string_view(data, n)).Write(std::cout);
    }
    void end() { JsonLine().Bytes("ev", "comment_end").Write(std::cout); }
  };

  void text(const char* data, std::size_t n) {
    JsonLine().Bytes("ev", "text").Bytes("data", std::string_view(data, n)).Write(std::cout);
  }
  bool openElement(std::string_view name) {
    JsonLine().Bytes("ev", "open").Bytes("name", name).Write(std::cout);
    return true;
  }
  bool startTagEnd() {
    JsonLine().Bytes("ev", "tagend").Write(std::cout);
    return true;
  }
  void closeElement(std::string_view name) {
    JsonLine().Bytes("ev", "close").Bytes("name", name).Write(std::cout);
  }
  int attributeName(std::string_view name) {
    JsonLine().Bytes("ev", "attr").Bytes("name", name).Write(std::cout);
    return html::kAttrCollect;
  }
  void attributeValue(std::string_view value) {
    JsonLine().Bytes("ev", "value").Bytes("data", value).Write(std::cout);
  }
  void attributeChar(char) {}  // every attribute is collected
  CommentSink* commentSink() { return &comments_; }
  void scriptText(const char* data, std::size_t n) {
    JsonLine().Bytes("ev", "script").Bytes("data", std::string_view(data, n)).Write(std::cout);
  }

 private:
  CommentSink comments_;
};

int RunDumpTokens(const std::vector<std::string>& args, const GlobalOptions&) {
  DumpTokensHandler handler;
  html::FastParserMachine<char, DumpTokensHandler> tokenizer(handler);
  return RunDumpOverInput(
      "dump tokens", args,
      [&](std::string_view chunk) { tokenizer.feed(chunk.data(), chunk.size()); }, [] {});
}

}  // namespace

PELMIX_COMMAND({"dump tokens", "[--chunk N] FILE|-",
                "print the HTML tokenizer's events as JSON Lines", RunDumpTokens})

}  // namespace pelmix::cli
