// Test doubles and helpers for the knowledge-base tests: a host stream with injectable
// faults, containers opened through the real adapter stack, and byte patching that keeps a
// container's body checksum valid so that hostile structure reaches the parser.
#pragma once

#include <zlib.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "engine/kb/packed_file.h"
#include "framework/uvo/object.h"
#include "framework/uvo/result.h"
#include "host/stream.h"
#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"
#include "tests/support/error_of.h"
#include "tools/kbtools/container_writer.h"

namespace pelmix::testing {

// A host stream over bytes whose answers can be bent: seeks that land elsewhere, failing
// calls, and sizes or positions that the bytes do not have.
class FaultStream final : public uvo::ObjectImpl<FaultStream, uvo::IStream> {
 public:
  static uvo::Ptr<FaultStream> Create(std::string bytes) {
    return uvo::Ptr<FaultStream>::Adopt(new FaultStream(std::move(bytes)));
  }
  explicit FaultStream(std::string bytes) : bytes_(std::move(bytes)) {}
  ~FaultStream() = default;

  uvo::result_t fail_read = 0, fail_seek = 0, fail_tell = 0, fail_size = 0;
  std::optional<std::uint64_t> seek_lands_at;  // reported by every successful seek
  std::optional<std::uint64_t> reported_size;  // reported by GetSize
  std::optional<std::uint64_t> reported_tell;  // reported by Tell
  int seeks = 0, reads = 0;

  uvo::result_t Read(void* buffer, std::uint32_t count, std::uint32_t* read) override {
    ++reads;
    if (fail_read < 0) return fail_read;
    const std::uint64_t left = bytes_.size() - std::min<std::uint64_t>(position_, bytes_.size());
    const auto n = static_cast<std::uint32_t>(std::min<std::uint64_t>(count, left));
    if (n != 0) std::memcpy(buffer, bytes_.data() + position_, n);
    position_ += n;
    *read = n;
    return uvo::kOk;
  }
  uvo::result_t Write(const void*, std::uint32_t, std::uint32_t*) override {
    return uvo::kErrNotSupported;
  }
  uvo::result_t Seek(std::uint32_t origin, std::int64_t offset, std::uint64_t* position) override {
    ++seeks;
    if (fail_seek < 0) return fail_seek;
    if (origin != kFromStart || offset < 0) return uvo::kErrInvalidArgument;
    position_ = seek_lands_at.value_or(static_cast<std::uint64_t>(offset));
    *position = position_;
    return uvo::kOk;
  }
  uvo::result_t Tell(std::uint64_t* position) override {
    if (fail_tell < 0) return fail_tell;
    *position = reported_tell.value_or(position_);
    return uvo::kOk;
  }
  uvo::result_t GetSize(std::uint64_t* size) override {
    if (fail_size < 0) return fail_size;
    *size = reported_size.value_or(bytes_.size());
    return uvo::kOk;
  }

 private:
  std::string bytes_;
  std::uint64_t position_ = 0;
};

// The service's stack: a host memory stream behind the io adapter.
inline std::shared_ptr<ap::FileIO> AdapterOver(const std::string& bytes) {
  const auto stream = host::MemoryStream::Create(bytes);
  return std::make_shared<cf::adapters::AntiphishingIOAdapter>(stream.Get());
}

inline std::shared_ptr<ap::PackedFile> OpenPacked(const std::string& bytes) {
  return std::make_shared<ap::PackedFile>(AdapterOver(bytes));
}

// A container made by the writer from (name, data) pairs, opened through the adapter.
inline std::shared_ptr<ap::PackedFile> PackedOf(
    const std::vector<std::pair<std::string, std::string>>& entries) {
  kbtools::ContainerWriter writer;
  for (const auto& [name, data] : entries) writer.Add(name, data);
  return OpenPacked(writer.Build());
}

// A lenient ap::FileIO over bytes: reads stop short at the end and seeks outside the
// bytes report -1, as a file that does not raise would.
class MemoryFile final : public ap::FileIO {
 public:
  explicit MemoryFile(std::shared_ptr<const std::string> bytes) : bytes_(std::move(bytes)) {}
  std::int64_t file_seek(std::int64_t position) override {
    if (position < 0 || static_cast<std::uint64_t>(position) > bytes_->size()) return -1;
    position_ = static_cast<std::uint64_t>(position);
    return position;
  }
  std::int64_t file_size() override { return static_cast<std::int64_t>(bytes_->size()); }
  std::int64_t file_read(void* buffer, std::uint64_t count) override {
    const std::uint64_t n = std::min<std::uint64_t>(count, bytes_->size() - position_);
    if (n != 0) std::memcpy(buffer, bytes_->data() + position_, n);
    position_ += n;
    return static_cast<std::int64_t>(n);
  }
  void open_for_reading() override {}
  std::int64_t file_write(const void*, std::uint64_t) override { return -1; }
  std::int64_t tell() override { return static_cast<std::int64_t>(position_); }
  void file_truncate(std::int64_t) override {}
  std::shared_ptr<ap::FileIO> clone() override { return std::make_shared<MemoryFile>(bytes_); }

 private:
  std::shared_ptr<const std::string> bytes_;
  std::uint64_t position_ = 0;
};

inline std::uint32_t GetLe32(const std::string& bytes, std::size_t at) {
  std::uint32_t value = 0;
  for (int i = 3; i >= 0; --i) value = (value << 8) | static_cast<std::uint8_t>(bytes[at + i]);
  return value;
}

inline void PutLe(std::string& bytes, std::size_t at, std::uint64_t value, int width) {
  for (int i = 0; i < width; ++i) bytes[at + i] = static_cast<char>((value >> (8 * i)) & 0xFF);
}

// CRC-32 from zlib: an implementation independent of the engine's.
inline std::uint32_t ZlibCrc(const char* data, std::size_t size) {
  return static_cast<std::uint32_t>(
      ::crc32(0L, reinterpret_cast<const Bytef*>(data), static_cast<uInt>(size)));
}

// Rewrites body_crc over bytes 11 .. end, so that only the structure is hostile.
inline void Reseal(std::string& bytes) {
  PutLe(bytes, 7, ZlibCrc(bytes.data() + 11, bytes.size() - 11), 4);
}

// Absolute position of the record in table slot `index`.
inline std::size_t RecordAt(const std::string& bytes, std::uint32_t index) {
  const std::uint32_t count = GetLe32(bytes, 11);
  return 15 + 4 * static_cast<std::size_t>(count) + GetLe32(bytes, 15 + 4 * index);
}

}  // namespace pelmix::testing
