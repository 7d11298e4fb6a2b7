// pelmix dump dataurl: the media type and the bytes the data-URL decoder hands on. Bytes
// before a complete "data:" are skipped, as the page decoder skips them.
#include <iostream>
#include <string>
#include <string_view>

#include "engine/html/data_url_machine.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/dump_input.h"
#include "tools/pelmix/json_lines.h"

namespace pelmix::cli {
namespace {

class CollectBytes : public utils::DataUrlMachine::Handler {
 public:
  void byte(std::uint8_t b) override { data.push_back(static_cast<char>(b)); }
  std::string data;
};

int RunDumpDataUrl(const std::vector<std::string>& args, const GlobalOptions&) {
  CollectBytes output;
  utils::DataUrlMachine decoder(output);
  return RunDumpOverInput(
      "dump dataurl", args,
      [&](std::string_view chunk) { decoder.offer(chunk.data(), chunk.size()); },
      [&] {
        JsonLine()
            .Bytes("media_type", decoder.mediaType())
            .Bytes("data", output.data)
            .Write(std::cout);
      });
}

}  // namespace

PELMIX_COMMAND({"dump dataurl", "[--chunk N] FILE|-",
                "decode a data: URL and print its media type and bytes", RunDumpDataUrl})

}  // namespace pelmix::cli
