// A readable file over bytes in memory, for callers that already hold a whole attachment.
// The bytes are borrowed: they must outlive the file.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "engine/common/file_interfaces.h"

namespace pdf {

class MemoryFile : public ap::ReadableFileI {
 public:
  explicit MemoryFile(std::string_view bytes) : bytes_(bytes) {}

  std::int64_t file_seek(std::int64_t position) override {
    position_ = static_cast<std::size_t>(
        std::clamp<std::int64_t>(position, 0, static_cast<std::int64_t>(bytes_.size())));
    return static_cast<std::int64_t>(position_);
  }
  std::int64_t file_size() override { return static_cast<std::int64_t>(bytes_.size()); }
  std::int64_t file_read(void* buffer, std::uint64_t count) override {
    const std::size_t n =
        static_cast<std::size_t>(std::min<std::uint64_t>(count, bytes_.size() - position_));
    if (n > 0) std::memcpy(buffer, bytes_.data() + position_, n);
    position_ += n;
    return static_cast<std::int64_t>(n);
  }

 private:
  std::string_view bytes_;
  std::size_t position_ = 0;
};

}  // namespace pdf
