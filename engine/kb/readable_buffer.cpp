#include "engine/kb/readable_buffer.h"

#include <algorithm>
#include <cstring>

#include "engine/common/error.h"

namespace util {

ReadableBuffer::ReadableBuffer(const void* data, std::uint32_t size)
    : data_(static_cast<const unsigned char*>(data)), size_(size) {
  if (data == nullptr) ap::ThrowError("ReadableBuffer: inited with nullptr");
}

std::int64_t ReadableBuffer::file_seek(std::int64_t position) {
  if (position < 0 || position >= static_cast<std::int64_t>(size_)) return -1;
  position_ = static_cast<std::uint32_t>(position);
  return position_;
}

std::int64_t ReadableBuffer::file_read(void* buffer, std::uint64_t count) {
  if (buffer == nullptr) return 0;
  const auto n = static_cast<std::uint32_t>(std::min<std::uint64_t>(count, size_ - position_));
  if (n != 0) std::memcpy(buffer, data_ + position_, n);
  position_ += n;
  return n;
}

}  // namespace util
