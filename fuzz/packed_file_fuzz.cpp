// The fuzzer's bytes are a knowledge-base container: open it, list it, read every entry
// and the configuration, through the service's own adapter stack.
//
// Checksums would stop almost every mutation at the first check, so the marker byte (which
// the reader skips) asks for them to be repaired first: bit 0 the entries' sums, bit 1 the
// body sum. The structure behind them is then what the fuzzer explores.
#include <cstddef>
#include <cstdint>
#include <exception>
#include <string>
#include <vector>

#include "engine/kb/crc32.h"
#include "engine/kb/engine_config.h"
#include "engine/kb/packed_file.h"
#include "engine/kb/readable_stream.h"
#include "host/stream.h"
#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"

namespace {

std::uint64_t Le(const std::vector<std::uint8_t>& b, std::uint64_t at, int width) {
  std::uint64_t value = 0;
  for (int i = width - 1; i >= 0; --i) value = (value << 8) | b[at + i];
  return value;
}

void PutLe32(std::vector<std::uint8_t>& b, std::uint64_t at, std::uint32_t value) {
  for (int i = 0; i < 4; ++i) b[at + i] = static_cast<std::uint8_t>(value >> (8 * i));
}

void RepairEntrySums(std::vector<std::uint8_t>& b) {
  const std::uint64_t count = Le(b, 11, 4);
  const std::uint64_t table_end = 15 + 4 * count;
  if (table_end > b.size()) return;
  for (std::uint64_t i = 0; i < count; ++i) {
    const std::uint64_t record = table_end + Le(b, 15 + 4 * i, 4);
    if (record + 22 > b.size()) continue;
    const std::uint64_t size = Le(b, record, 8);
    const std::uint64_t offset = Le(b, record + 8, 8);
    if (offset > b.size() || size > b.size() - offset) continue;
    PutLe32(b, record + 16, ap::Crc32Of(b.data() + offset, size));
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  std::vector<std::uint8_t> bytes(data, data + size);
  if (size >= 15) {
    if (bytes[0] & 1) RepairEntrySums(bytes);
    if (bytes[0] & 2) PutLe32(bytes, 7, ap::Crc32Of(bytes.data() + 11, size - 11));
  }
  const auto stream = pelmix::host::MemoryStream::Create(std::move(bytes));
  try {
    ap::PackedFile packed(std::make_shared<cf::adapters::AntiphishingIOAdapter>(stream.Get()));
    std::vector<std::string> names;
    packed.enumerate([&](const std::string& name, std::uint64_t) { names.push_back(name); });
    for (const std::string& name : names) {
      try {
        if (auto entry = packed.open(name)) {
          ap::EntryTextStream text(entry);
          std::string line;
          while (std::getline(text, line)) {
          }
        }
      } catch (const std::exception&) {
      }
    }
    ap::EngineConfig config;
    ap::LoadEngineConfig(packed, config);
  } catch (const std::exception&) {
    // Refusing hostile input is the expected outcome; only crashes count.
  }
  return 0;
}
