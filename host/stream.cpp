#include "host/stream.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "framework/uvo/result.h"

namespace pelmix::host {

bool ResolveSeek(std::uint32_t origin, std::int64_t offset, std::uint64_t current,
                 std::uint64_t size, std::uint64_t* position) {
  std::int64_t base;
  switch (origin) {
    case uvo::IStream::kFromStart:
      base = 0;
      break;
    case uvo::IStream::kFromCurrent:
      base = static_cast<std::int64_t>(current);
      break;
    case uvo::IStream::kFromEnd:
      base = static_cast<std::int64_t>(size);
      break;
    default:
      return false;
  }
  if ((offset > 0 && base > INT64_MAX - offset)) return false;
  const std::int64_t target = base + offset;
  if (target < 0 || static_cast<std::uint64_t>(target) > size) return false;
  *position = static_cast<std::uint64_t>(target);
  return true;
}

uvo::Ptr<MemoryStream> MemoryStream::Create(std::vector<std::uint8_t> bytes) {
  return uvo::Ptr<MemoryStream>::Adopt(new MemoryStream(std::move(bytes)));
}

uvo::Ptr<MemoryStream> MemoryStream::Create(const std::string& bytes) {
  return Create(std::vector<std::uint8_t>(bytes.begin(), bytes.end()));
}

uvo::result_t MemoryStream::Read(void* buffer, std::uint32_t count, std::uint32_t* read) {
  if (buffer == nullptr && count != 0) return uvo::kErrInvalidArgument;
  const std::uint64_t left = bytes_.size() - std::min<std::uint64_t>(position_, bytes_.size());
  const auto n = static_cast<std::uint32_t>(std::min<std::uint64_t>(count, left));
  if (n != 0) std::memcpy(buffer, bytes_.data() + position_, n);
  position_ += n;
  if (read != nullptr) *read = n;
  return uvo::kOk;
}

uvo::result_t MemoryStream::Write(const void*, std::uint32_t, std::uint32_t* written) {
  if (written != nullptr) *written = 0;
  return uvo::kErrNotSupported;
}

uvo::result_t MemoryStream::Seek(std::uint32_t origin, std::int64_t offset,
                                 std::uint64_t* position) {
  std::uint64_t target;
  if (!ResolveSeek(origin, offset, position_, bytes_.size(), &target)) {
    return uvo::kErrInvalidArgument;
  }
  position_ = target;
  if (position != nullptr) *position = target;
  return uvo::kOk;
}

uvo::result_t MemoryStream::Tell(std::uint64_t* position) {
  if (position == nullptr) return uvo::kErrInvalidArgument;
  *position = position_;
  return uvo::kOk;
}

uvo::result_t MemoryStream::GetSize(std::uint64_t* size) {
  if (size == nullptr) return uvo::kErrInvalidArgument;
  *size = bytes_.size();
  return uvo::kOk;
}

uvo::Ptr<FileStream> FileStream::Open(const std::string& path, std::string* error) {
  const int fd = ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
  struct stat info {};
  if (fd < 0 || ::fstat(fd, &info) != 0 || !S_ISREG(info.st_mode)) {
    const int code = fd < 0 || errno != 0 ? errno : EINVAL;
    if (error != nullptr) {
      *error =
          path + ": " + (fd >= 0 && S_ISDIR(info.st_mode) ? "is a directory" : std::strerror(code));
    }
    if (fd >= 0) ::close(fd);
    return nullptr;
  }
  return uvo::Ptr<FileStream>::Adopt(new FileStream(fd, static_cast<std::uint64_t>(info.st_size)));
}

FileStream::~FileStream() { ::close(fd_); }

uvo::result_t FileStream::Read(void* buffer, std::uint32_t count, std::uint32_t* read) {
  if (buffer == nullptr && count != 0) return uvo::kErrInvalidArgument;
  std::uint32_t total = 0;
  while (total < count) {
    const ssize_t n = ::pread(fd_, static_cast<char*>(buffer) + total, count - total,
                              static_cast<off_t>(position_ + total));
    if (n < 0) {
      if (errno == EINTR) continue;
      return static_cast<uvo::result_t>(0x80010100);  // unspecified platform error
    }
    if (n == 0) break;
    total += static_cast<std::uint32_t>(n);
  }
  position_ += total;
  if (read != nullptr) *read = total;
  return uvo::kOk;
}

uvo::result_t FileStream::Write(const void*, std::uint32_t, std::uint32_t* written) {
  if (written != nullptr) *written = 0;
  return uvo::kErrAccessDenied;
}

uvo::result_t FileStream::Seek(std::uint32_t origin, std::int64_t offset, std::uint64_t* position) {
  std::uint64_t target;
  if (!ResolveSeek(origin, offset, position_, size_, &target)) return uvo::kErrInvalidArgument;
  position_ = target;
  if (position != nullptr) *position = target;
  return uvo::kOk;
}

uvo::result_t FileStream::Tell(std::uint64_t* position) {
  if (position == nullptr) return uvo::kErrInvalidArgument;
  *position = position_;
  return uvo::kOk;
}

uvo::result_t FileStream::GetSize(std::uint64_t* size) {
  if (size == nullptr) return uvo::kErrInvalidArgument;
  *size = size_;
  return uvo::kOk;
}

}  // namespace pelmix::host
