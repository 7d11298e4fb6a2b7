// pelmix kb cat: one entry's bytes on stdout.
#include <iostream>

#include "tools/pelmix/command.h"
#include "tools/pelmix/kb_container.h"

namespace pelmix::cli {
namespace {

int RunKbCat(const std::vector<std::string>& args, const GlobalOptions&) {
  if (args.size() != 2) return UsageError("kb cat needs FILE and NAME");
  const std::string& name = args[1];
  try {
    const auto container = OpenContainer(args[0]);
    const auto entry = container->open(name);
    if (!entry) {
      // open() gives nothing for an empty entry too: that one exists and prints nothing.
      bool present = false;
      container->enumerate([&](const std::string& entry_name, std::uint64_t) {
        if (entry_name == name) present = true;
      });
      if (present) return kExitOk;
      std::cerr << "pelmix: kb cat: " << args[0] << ": no entry " << name << "\n";
      return kExitFailure;
    }
    char buffer[64 * 1024];
    for (;;) {
      const std::int64_t got = entry->file_read(buffer, sizeof buffer);
      if (got <= 0) break;
      std::cout.write(buffer, got);
    }
    std::cout.flush();
    if (!std::cout) {
      std::cerr << "pelmix: kb cat: write to stdout failed\n";
      return kExitFailure;
    }
  } catch (const std::exception& e) {
    std::cerr << "pelmix: kb cat: " << name << ": " << DescribeFailure(e) << "\n";
    return kExitFailure;
  }
  return kExitOk;
}

}  // namespace

PELMIX_COMMAND({"kb cat", "FILE NAME", "write one entry of a container to stdout", RunKbCat})

}  // namespace pelmix::cli
