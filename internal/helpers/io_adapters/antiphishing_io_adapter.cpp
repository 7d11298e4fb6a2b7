#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"

#include <algorithm>
#include <limits>
#include <stdexcept>

#include "framework/uvo/exception.h"

namespace cf::adapters {

AntiphishingIOAdapter::AntiphishingIOAdapter(uvo::IStream* hostFile) {
  UVO_CHECK(hostFile != nullptr);
  file_ = uvo::Ptr<uvo::IStream>::Share(hostFile);
  UVO_CHECK_RESULT(file_->GetSize(&size_));
  std::uint64_t reached = 0;
  UVO_CHECK_RESULT(file_->Seek(uvo::IStream::kFromStart, 0, &reached));
  UVO_CHECK(reached == 0);
  position_ = 0;
}

std::int64_t AntiphishingIOAdapter::file_seek(std::int64_t position) {
  UVO_CHECK(position >= 0 && static_cast<std::uint64_t>(position) < size_);
  std::uint64_t reached = 0;
  UVO_CHECK_RESULT(file_->Seek(uvo::IStream::kFromStart, position, &reached));
  position_ = reached;
  return static_cast<std::int64_t>(reached);
}

std::int64_t AntiphishingIOAdapter::file_size() { return static_cast<std::int64_t>(size_); }

std::int64_t AntiphishingIOAdapter::file_read(void* buffer, std::uint64_t count) {
  UVO_CHECK(buffer != nullptr);
  UVO_CHECK(position_ <= size_ && count <= size_ - position_);
  std::uint64_t reached = 0;
  UVO_CHECK_RESULT(
      file_->Seek(uvo::IStream::kFromStart, static_cast<std::int64_t>(position_), &reached));
  // The host reads at most 2^32 - 1 bytes per call; a larger request is served in pieces
  // rather than cut to its low 32 bits.
  auto* out = static_cast<unsigned char*>(buffer);
  std::uint64_t total = 0;
  while (total < count) {
    const auto piece = static_cast<std::uint32_t>(
        std::min<std::uint64_t>(count - total, std::numeric_limits<std::uint32_t>::max()));
    std::uint32_t got = 0;
    UVO_CHECK_RESULT(file_->Read(out + total, piece, &got));
    total += std::min(got, piece);
    if (got < piece) break;
  }
  position_ += total;
  return static_cast<std::int64_t>(total);
}

std::int64_t AntiphishingIOAdapter::tell() { return static_cast<std::int64_t>(position_); }

std::shared_ptr<ap::FileIO> AntiphishingIOAdapter::clone() {
  return std::make_shared<AntiphishingIOAdapter>(file_.Get());
}

void AntiphishingIOAdapter::open_for_reading() {
  throw std::runtime_error("AntiphishingIOAdapter::open_for_reading must not be called");
}

std::int64_t AntiphishingIOAdapter::file_write(const void*, std::uint64_t) {
  throw std::runtime_error("AntiphishingIOAdapter::file_write must not be called");
}

void AntiphishingIOAdapter::file_truncate(std::int64_t) {
  throw std::runtime_error("AntiphishingIOAdapter::file_truncate must not be called");
}

}  // namespace cf::adapters
