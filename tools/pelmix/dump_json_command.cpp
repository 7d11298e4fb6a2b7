// pelmix dump json: whether the JSON stream validator still accepts the input after its last
// byte.
#include <iostream>
#include <string_view>

#include "engine/html/json_state_machine.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/dump_input.h"
#include "tools/pelmix/json_lines.h"

namespace pelmix::cli {
namespace {

int RunDumpJson(const std::vector<std::string>& args, const GlobalOptions&) {
  utils::JSONStateMachine<char> validator;
  return RunDumpOverInput(
      "dump json", args,
      [&](std::string_view chunk) { validator.feed(chunk.data(), chunk.size()); },
      [&] { JsonLine().Bool("accepted", validator.accepted()).Write(std::cout); });
}

}  // namespace

PELMIX_COMMAND({"dump json", "[--chunk N] FILE|-",
                "tell whether the JSON stream validator accepts the input", RunDumpJson})

}  // namespace pelmix::cli
