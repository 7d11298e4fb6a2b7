// Host files and streams over a memory buffer or a path. The module sees both through
// uvo::IStream: read, seek from the start, tell and size.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "framework/uvo/interfaces.h"
#include "framework/uvo/object.h"

namespace pelmix::host {

// Seeks within 0..size; reads stop at the end.
class MemoryStream final : public uvo::ObjectImpl<MemoryStream, uvo::IStream> {
 public:
  static uvo::Ptr<MemoryStream> Create(std::vector<std::uint8_t> bytes);
  static uvo::Ptr<MemoryStream> Create(const std::string& bytes);
  explicit MemoryStream(std::vector<std::uint8_t> bytes) : bytes_(std::move(bytes)) {}
  ~MemoryStream() = default;

  uvo::result_t Read(void* buffer, std::uint32_t count, std::uint32_t* read) override;
  uvo::result_t Write(const void* buffer, std::uint32_t count, std::uint32_t* written) override;
  uvo::result_t Seek(std::uint32_t origin, std::int64_t offset, std::uint64_t* position) override;
  uvo::result_t Tell(std::uint64_t* position) override;
  uvo::result_t GetSize(std::uint64_t* size) override;

  const std::vector<std::uint8_t>& Bytes() const { return bytes_; }

 private:
  std::vector<std::uint8_t> bytes_;
  std::uint64_t position_ = 0;
};

// A read-only file opened by path; the descriptor is closed with the object.
class FileStream final : public uvo::ObjectImpl<FileStream, uvo::IStream> {
 public:
  // Returns null and fills `error` when the file cannot be opened.
  static uvo::Ptr<FileStream> Open(const std::string& path, std::string* error = nullptr);
  FileStream(int fd, std::uint64_t size) : fd_(fd), size_(size) {}
  ~FileStream();

  uvo::result_t Read(void* buffer, std::uint32_t count, std::uint32_t* read) override;
  uvo::result_t Write(const void* buffer, std::uint32_t count, std::uint32_t* written) override;
  uvo::result_t Seek(std::uint32_t origin, std::int64_t offset, std::uint64_t* position) override;
  uvo::result_t Tell(std::uint64_t* position) override;
  uvo::result_t GetSize(std::uint64_t* size) override;

 private:
  int fd_;
  std::uint64_t size_;
  std::uint64_t position_ = 0;
};

// The new position of a seek within 0..size, or false.
bool ResolveSeek(std::uint32_t origin, std::int64_t offset, std::uint64_t current,
                 std::uint64_t size, std::uint64_t* position);

}  // namespace pelmix::host
