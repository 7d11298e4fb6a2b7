// Bytes already in memory, read as an ap::ReadableFileI. The buffer does not own the bytes:
// whoever builds it keeps them alive.
#pragma once

#include <cstdint>

#include "engine/common/file_interfaces.h"

namespace util {

class ReadableBuffer final : public ap::ReadableFileI {
 public:
  // A null `data` raises ap::Error "ReadableBuffer: inited with nullptr".
  ReadableBuffer(const void* data, std::uint32_t size);

  // -1 and no move for a position below 0 or at or past the size.
  std::int64_t file_seek(std::int64_t position) override;
  std::int64_t file_size() override { return size_; }
  // Copies what is left up to `count`; 0 at the end.
  std::int64_t file_read(void* buffer, std::uint64_t count) override;

 private:
  const unsigned char* data_;
  std::uint32_t size_;
  std::uint32_t position_ = 0;
};

}  // namespace util
