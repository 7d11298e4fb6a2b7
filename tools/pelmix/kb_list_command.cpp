// pelmix kb list: the entries of a container, in table order.
#include <iostream>

#include "tools/pelmix/command.h"
#include "tools/pelmix/kb_container.h"

namespace pelmix::cli {
namespace {

int RunKbList(const std::vector<std::string>& args, const GlobalOptions&) {
  if (args.size() != 1) return UsageError("kb list needs exactly one FILE");
  try {
    const auto container = OpenContainer(args[0]);
    container->enumerate([](const std::string& name, std::uint64_t size) {
      std::cout << name << '\t' << size << '\n';
    });
  } catch (const std::exception& e) {
    std::cerr << "pelmix: kb list: " << DescribeFailure(e) << "\n";
    return kExitFailure;
  }
  return kExitOk;
}

}  // namespace

PELMIX_COMMAND({"kb list", "FILE", "list a container's entries: name, TAB, size", RunKbList})

}  // namespace pelmix::cli
