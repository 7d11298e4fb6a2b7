// An ap::ReadableFileI that remembers where it is, so that a stream over it can be
// positioned relative to the current place. It forwards everything to the wrapped file.
#pragma once

#include <cstdint>
#include <memory>

#include "engine/common/file_interfaces.h"

namespace ap {

class ReadableWTell final : public ReadableFileI {
 public:
  // A null `readable` raises ap::Error "null readable for tell". Seeks the wrapped file to 0
  // and takes the position it reports (0 stays recorded when an empty file refuses it).
  explicit ReadableWTell(std::shared_ptr<ReadableFileI> readable);

  // Forwards and returns the position reported; records it unless the seek was refused (-1),
  // in which case the wrapped file has not moved either.
  std::int64_t file_seek(std::int64_t position) override;
  std::int64_t file_size() override;
  // Forwards; a positive count advances the recorded position.
  std::int64_t file_read(void* buffer, std::uint64_t count) override;

  // The position recorded by the last seek and the reads since.
  std::int64_t tell() const { return position_; }

 private:
  std::shared_ptr<ReadableFileI> readable_;
  std::int64_t position_ = 0;
};

}  // namespace ap
