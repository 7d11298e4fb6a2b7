// pelmix kb verify: checks a container and every entry in it, as the engine would on load.
#include <iostream>

#include "tools/pelmix/command.h"
#include "tools/pelmix/kb_container.h"

namespace pelmix::cli {
namespace {

int RunKbVerify(const std::vector<std::string>& args, const GlobalOptions&) {
  if (args.size() != 1) return UsageError("kb verify needs exactly one FILE");
  std::shared_ptr<ap::PackedFile> container;
  try {
    container = OpenContainer(args[0]);
  } catch (const std::exception& e) {
    std::cout << DescribeFailure(e) << "\n";
    return kExitFailure;
  }
  // Slot by slot rather than by name, so that a second entry of the same name is checked too.
  for (std::uint32_t i = 0; i < container->entry_count(); ++i) {
    ap::PackedFile::Record record;
    try {
      record = container->record(i);
    } catch (const std::exception& e) {
      std::cout << DescribeFailure(e) << "\n";
      return kExitFailure;
    }
    try {
      container->open_record(record);
    } catch (const std::exception& e) {
      std::cout << record.name << ": " << DescribeFailure(e) << "\n";
      return kExitFailure;
    }
  }
  std::cout << "ok " << container->entry_count() << "\n";
  return kExitOk;
}

}  // namespace

PELMIX_COMMAND({"kb verify", "FILE",
                "check a container's checksums and open every entry; prints ok and the count",
                RunKbVerify})

}  // namespace pelmix::cli
