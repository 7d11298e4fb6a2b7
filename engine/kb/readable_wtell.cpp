#include "engine/kb/readable_wtell.h"

#include "engine/common/error.h"

namespace ap {

ReadableWTell::ReadableWTell(std::shared_ptr<ReadableFileI> readable)
    : readable_(std::move(readable)) {
  if (!readable_) ThrowError("null readable for tell");
  file_seek(0);
}

std::int64_t ReadableWTell::file_seek(std::int64_t position) {
  const std::int64_t reached = readable_->file_seek(position);
  // A refused seek leaves the wrapped file where it was, so the recorded place stays too;
  // taking -1 as the place would send every later relative move astray.
  if (reached >= 0) position_ = reached;
  return reached;
}

std::int64_t ReadableWTell::file_size() { return readable_->file_size(); }

std::int64_t ReadableWTell::file_read(void* buffer, std::uint64_t count) {
  const std::int64_t got = readable_->file_read(buffer, count);
  if (got > 0) position_ += got;
  return got;
}

}  // namespace ap
