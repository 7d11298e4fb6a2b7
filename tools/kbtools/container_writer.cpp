#include "tools/kbtools/container_writer.h"

#include <algorithm>
#include <stdexcept>

#include "engine/kb/crc32.h"
#include "engine/kb/packed_file.h"

namespace pelmix::kbtools {
namespace {

// Fixed part of an entry record: data_size, data_offset, data_crc, name_length.
constexpr std::uint64_t kRecordHeaderSize = 8 + 8 + 4 + 2;

void PutLe(std::string& out, std::uint64_t value, int width) {
  for (int i = 0; i < width; ++i) out.push_back(static_cast<char>((value >> (8 * i)) & 0xFF));
}

void PatchLe32(std::string& out, std::size_t at, std::uint32_t value) {
  for (int i = 0; i < 4; ++i) out[at + i] = static_cast<char>((value >> (8 * i)) & 0xFF);
}

}  // namespace

void ContainerWriter::Add(std::string name, std::string data) {
  if (name.size() > kMaxEntryNameLength) {
    throw std::invalid_argument("entry name longer than 65535 bytes");
  }
  for (const Entry& entry : entries_) {
    if (entry.name == name) throw std::invalid_argument("duplicate entry name: " + name);
  }
  entries_.push_back({std::move(name), std::move(data)});
}

std::string ContainerWriter::Build() const {
  std::vector<const Entry*> sorted;
  sorted.reserve(entries_.size());
  for (const Entry& entry : entries_) sorted.push_back(&entry);
  std::sort(sorted.begin(), sorted.end(),
            [](const Entry* a, const Entry* b) { return a->name < b->name; });

  const std::uint64_t table_end = ap::kPackedHeaderSize + 4ull * sorted.size();
  std::uint64_t data_start = table_end;
  for (const Entry* entry : sorted) data_start += kRecordHeaderSize + entry->name.size();
  std::uint64_t total = data_start;
  for (const Entry* entry : sorted) total += entry->data.size();
  if (total > kMaxContainerSize) throw std::length_error("container larger than 4 GiB");

  std::string out;
  out.reserve(static_cast<std::size_t>(total));
  out.append(kContainerMarker, sizeof kContainerMarker);
  PutLe(out, total, 4);
  PutLe(out, 0, 4);  // body_crc, filled in below
  PutLe(out, sorted.size(), 4);
  std::uint64_t record = table_end;
  for (const Entry* entry : sorted) {
    PutLe(out, record - table_end, 4);
    record += kRecordHeaderSize + entry->name.size();
  }
  std::uint64_t data = data_start;
  for (const Entry* entry : sorted) {
    PutLe(out, entry->data.size(), 8);
    PutLe(out, data, 8);
    PutLe(out, ap::Crc32Of(entry->data.data(), entry->data.size()), 4);
    PutLe(out, entry->name.size(), 2);
    out += entry->name;
    data += entry->data.size();
  }
  for (const Entry* entry : sorted) out += entry->data;
  PatchLe32(out, 7,
            ap::Crc32Of(out.data() + ap::kPackedBodyOffset, out.size() - ap::kPackedBodyOffset));
  return out;
}

}  // namespace pelmix::kbtools
