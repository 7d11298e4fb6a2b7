// pelmix kb pack: builds a knowledge-base container from a directory or from named files.
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <sstream>

#include "tools/kbtools/container_writer.h"
#include "tools/kbtools/kb_builder.h"
#include "tools/pelmix/command.h"

namespace pelmix::cli {
namespace {

namespace fs = std::filesystem;

// Every regular file under `dir`, named by its path relative to `dir` with '/' separators.
void AddDirectory(const fs::path& dir, const fs::path& out, kbtools::ContainerWriter& writer) {
  std::error_code ignored;
  for (const fs::directory_entry& entry : fs::recursive_directory_iterator(dir)) {
    if (!entry.is_regular_file()) continue;
    // A container written into the directory it packs must not swallow its old self.
    if (fs::equivalent(entry.path(), out, ignored)) continue;
    writer.Add(entry.path().lexically_relative(dir).generic_string(),
               kbtools::ReadWholeFile(entry.path()));
  }
}

int RunKbPack(const std::vector<std::string>& args, const GlobalOptions&) {
  if (args.size() < 2) return UsageError("kb pack needs OUT and a DIR or NAME=PATH arguments");
  const fs::path out = args[0];
  kbtools::ContainerWriter writer;
  try {
    std::error_code error;
    if (args.size() == 2 && fs::is_directory(args[1], error)) {
      AddDirectory(args[1], out, writer);
    } else {
      for (std::size_t i = 1; i < args.size(); ++i) {
        const std::size_t equals = args[i].find('=');
        if (equals == std::string::npos || equals == 0) {
          return UsageError("kb pack: expected a directory or NAME=PATH, got " + args[i]);
        }
        writer.Add(args[i].substr(0, equals), kbtools::ReadWholeFile(args[i].substr(equals + 1)));
      }
    }
    const std::string bytes = writer.Build();
    std::ofstream file(out, std::ios::binary | std::ios::trunc);
    file.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    file.close();
    if (!file) {
      fs::remove(out, error);
      throw std::runtime_error(out.string() + ": cannot be written");
    }
    std::cout << out.string() << ": " << writer.entry_count() << " entries, " << bytes.size()
              << " bytes\n";
  } catch (const std::exception& e) {
    std::cerr << "pelmix: kb pack: " << e.what() << "\n";
    return kExitFailure;
  }
  return kExitOk;
}

}  // namespace

PELMIX_COMMAND({"kb pack", "OUT DIR | OUT NAME=PATH...",
                "pack every file under DIR, or the named files, into the container OUT", RunKbPack})

}  // namespace pelmix::cli
