// The example knowledge base (built from examples/kb/ into the build tree) as named entries,
// so that tests can make containers with one entry missing, damaged or replaced.
#pragma once

#include <fstream>
#include <iterator>
#include <map>
#include <memory>
#include <sstream>
#include <string>

#include "engine/kb/packed_file.h"
#include "host/stream.h"
#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"
#include "tools/kbtools/container_writer.h"

namespace service_test {

using Entries = std::map<std::string, std::string>;

inline std::string ReadFileBytes(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

// The entries of a container, read back through the engine's own reader.
inline Entries EntriesOf(const std::string& container) {
  auto stream = pelmix::host::MemoryStream::Create(container);
  ap::PackedFile packed(std::make_shared<cf::adapters::AntiphishingIOAdapter>(stream.Get()));
  Entries entries;
  packed.enumerate([&](const std::string& name, std::uint64_t) {
    auto file = packed.open(name);
    std::string data(static_cast<std::size_t>(file->file_size()), '\0');
    if (!data.empty()) file->file_read(data.data(), data.size());
    entries[name] = data;
  });
  return entries;
}

inline const Entries& ExampleEntries() {
  static const Entries entries = EntriesOf(ReadFileBytes(PELMIX_EXAMPLE_KB));
  return entries;
}

inline std::string Pack(const Entries& entries) {
  pelmix::kbtools::ContainerWriter writer;
  for (const auto& [name, data] : entries) writer.Add(name, data);
  return writer.Build();
}

inline std::string Without(const std::string& name) {
  Entries entries = ExampleEntries();
  entries.erase(name);
  return Pack(entries);
}

inline std::string Replacing(const std::string& name, const std::string& data) {
  Entries entries = ExampleEntries();
  entries[name] = data;
  return Pack(entries);
}

}  // namespace service_test
