// The engine's own file interfaces. Everything the engine reads (the knowledge-base
// container, its entries, mail attachments) arrives behind these.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

namespace ap {

class ReadableFileI {
 public:
  virtual std::int64_t file_seek(std::int64_t position) = 0;  // the position reached
  virtual std::int64_t file_size() = 0;
  // The count read: 0 at the end, negative on failure.
  virtual std::int64_t file_read(void* buffer, std::uint64_t count) = 0;
  virtual ~ReadableFileI() = default;
};

class FileIO : public virtual ReadableFileI {
 public:
  virtual void open_for_reading() = 0;
  virtual std::int64_t file_write(const void* buffer, std::uint64_t count) = 0;
  virtual std::int64_t tell() = 0;
  virtual void file_truncate(std::int64_t size) = 0;
  // A new, independently positioned handle on the same file.
  virtual std::shared_ptr<FileIO> clone() = 0;
};

class FileSystemI {
 public:
  // An empty pointer when there is no such file.
  virtual std::shared_ptr<ReadableFileI> open(const std::string& name) = 0;
  // Calls callback(name, size) once for every file, in the file system's own order.
  virtual void enumerate(
      const std::function<void(const std::string& name, std::uint64_t size)>& callback) = 0;
  virtual ~FileSystemI() = default;
};

namespace logo {

class ImageDataProviderI {
 public:
  virtual int read(void* buffer, int count) = 0;
  virtual bool seek(int position) = 0;
  virtual int tell() = 0;
  virtual ~ImageDataProviderI() = default;
};

}  // namespace logo
}  // namespace ap
