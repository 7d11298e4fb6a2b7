// pelmix kb config: the engine configuration a container carries in "v3.cfg", as the
// engine reads it (defaults included).
#include <cstdio>
#include <iostream>

#include "engine/kb/engine_config.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/kb_container.h"

namespace pelmix::cli {
namespace {

// Nine significant digits name a single-precision value exactly.
std::string Single(float value) {
  char text[32];
  std::snprintf(text, sizeof text, "%.9g", static_cast<double>(value));
  return text;
}

void PrintChannel(const char* prefix, const ap::ChannelConfig& channel) {
  std::cout << prefix << "_loud=" << (channel.loud ? 1 : 0) << "\n"
            << prefix << "_loud_probability=" << Single(channel.loud_probability) << "\n"
            << prefix << "_threshold=" << Single(channel.threshold) << "\n"
            << prefix << "_threshold_loud=" << Single(channel.threshold_loud) << "\n";
}

int RunKbConfig(const std::vector<std::string>& args, const GlobalOptions&) {
  if (args.size() != 1) return UsageError("kb config needs exactly one FILE");
  ap::EngineConfig config;
  try {
    const auto container = OpenContainer(args[0]);
    ap::LoadEngineConfig(*container, config);
  } catch (const std::exception& e) {
    std::cerr << "pelmix: kb config: " << DescribeFailure(e) << "\n";
    return kExitFailure;
  }
  std::cout << "dbstamp=" << config.dbstamp << "\n";
  PrintChannel("web", config.web);
  PrintChannel("mail", config.mail);
  return kExitOk;
}

}  // namespace

PELMIX_COMMAND({"kb config", "FILE", "print the engine configuration read from v3.cfg",
                RunKbConfig})

}  // namespace pelmix::cli
