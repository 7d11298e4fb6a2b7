// pelmix dump strings: the input as one script's raw text through the script scanner, one
// line per piece of string-literal text it hands on.
#include <iostream>
#include <string_view>

#include "engine/html/js_parser.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/dump_input.h"
#include "tools/pelmix/json_lines.h"

namespace pelmix::cli {
namespace {

class DumpStringsHandler : public ap::JSParser<char>::Handler {
 public:
  void text(const char* data, std::size_t n) override {
    JsonLine().Bytes("ev", "text").Bytes("data", std::string_view(data, n)).Write(std::cout);
  }
};

int RunDumpStrings(const std::vector<std::string>& args, const GlobalOptions&) {
  DumpStringsHandler handler;
  ap::JSParser<char> parser(&handler);
  return RunDumpOverInput(
      "dump strings", args,
      [&](std::string_view chunk) { parser.feed(chunk.data(), chunk.size()); },
      [&] { parser.finish(); });
}

}  // namespace

PELMIX_COMMAND({"dump strings", "[--chunk N] FILE|-",
                "print the string-literal text the script scanner finds, as JSON Lines",
                RunDumpStrings})

}  // namespace pelmix::cli
