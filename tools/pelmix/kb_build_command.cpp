// pelmix kb build: compiles a knowledge-base source directory and packs it into a container.
#include <filesystem>
#include <fstream>
#include <iostream>

#include "tools/kbtools/container_writer.h"
#include "tools/kbtools/kb_builder.h"
#include "tools/pelmix/command.h"

namespace pelmix::cli {
namespace {

namespace fs = std::filesystem;

int RunKbBuild(const std::vector<std::string>& args, const GlobalOptions&) {
  if (args.size() != 2) return UsageError("kb build needs SRC_DIR and OUT");
  const fs::path dir = args[0];
  const fs::path out = args[1];
  try {
    kbtools::ContainerWriter writer;
    kbtools::BuildKnowledgeBase(dir, out, writer);
    const std::string bytes = writer.Build();
    std::ofstream file(out, std::ios::binary | std::ios::trunc);
    file.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    file.close();
    if (!file) {
      std::error_code ignored;
      fs::remove(out, ignored);
      throw std::runtime_error(out.string() + ": cannot be written");
    }
    std::cout << out.string() << ": " << writer.entry_count() << " entries, " << bytes.size()
              << " bytes\n";
  } catch (const std::exception& e) {
    std::cerr << "pelmix: kb build: " << e.what() << "\n";
    return kExitFailure;
  }
  return kExitOk;
}

}  // namespace

PELMIX_COMMAND({"kb build", "SRC_DIR OUT",
                "compile white_domains.txt and categorised_hosts.txt, pack them with every "
                "other file of SRC_DIR into the container OUT",
                RunKbBuild})

}  // namespace pelmix::cli
