#include "services/anti_phishing/heuristic/source/stream_wrappers.h"

#include <boost/numeric/conversion/cast.hpp>
#include <stdexcept>

namespace cf::services::anti_phishing::heuristic {

ReadableFileStream::ReadableFileStream(uvo::IStream* stream) {
  if (stream == nullptr) {
    throw std::invalid_argument("ReadableFileStream::ReadableFileStream: null stream pointer");
  }
  stream_ = uvo::Ptr<uvo::IStream>::Share(stream);
}

std::int64_t ReadableFileStream::file_seek(std::int64_t position) {
  std::uint64_t reached = 0;
  if (stream_->Seek(uvo::IStream::kFromStart, position, &reached) < 0) {
    throw std::runtime_error("ReadableFileStream::file_seek: invalid seek");
  }
  return boost::numeric_cast<std::int32_t>(reached);
}

std::int64_t ReadableFileStream::file_size() {
  std::uint64_t size = 0;
  if (stream_->GetSize(&size) < 0) {
    throw std::runtime_error("ReadableFileStream::file_size: failed to get stream size");
  }
  return boost::numeric_cast<std::uint32_t>(size);
}

std::int64_t ReadableFileStream::file_read(void* buffer, std::uint64_t count) {
  if (buffer == nullptr || count == 0) return 0;
  const auto wanted = boost::numeric_cast<std::uint32_t>(count);
  std::uint32_t got = 0;
  if (stream_->Read(buffer, wanted, &got) < 0) {
    throw std::runtime_error("ReadableFileStream::file_read: failed to read from stream");
  }
  return got;
}

ImageLoadStream::ImageLoadStream(uvo::IStream* stream) {
  if (stream == nullptr) {
    throw std::invalid_argument("ImageLoadStream::ImageLoadStream: null stream pointer");
  }
  stream_ = uvo::Ptr<uvo::IStream>::Share(stream);
}

int ImageLoadStream::read(void* buffer, int count) {
  if (buffer == nullptr || count == 0) return 0;
  if (count < 0) throw std::runtime_error("ImageLoadStream::read: negative bytes to read value");
  std::uint32_t got = 0;
  if (stream_->Read(buffer, static_cast<std::uint32_t>(count), &got) < 0) {
    throw std::runtime_error("ImageLoadStream::read: failed to read from stream");
  }
  return boost::numeric_cast<int>(got);
}

bool ImageLoadStream::seek(int position) {
  if (position < 0) return false;
  std::uint64_t reached = 0;
  return stream_->Seek(uvo::IStream::kFromStart, position, &reached) >= 0;
}

int ImageLoadStream::tell() {
  std::uint64_t position = 0;
  if (stream_->Tell(&position) < 0) {
    throw std::runtime_error("ImageLoadStream::tell: failed to get stream position");
  }
  return boost::numeric_cast<int>(position);
}

}  // namespace cf::services::anti_phishing::heuristic
