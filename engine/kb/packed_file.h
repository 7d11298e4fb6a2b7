// The packed knowledge-base container: one file holding many named entries, presented to
// the knowledge-base readers as a read-only ap::FileSystemI.
//
// Layout (all integers little-endian, unsigned):
//   0   3      marker, skipped
//   3   4      total_length of the whole container
//   7   4      body_crc: CRC-32 of bytes 11 .. total_length
//   11  4      entry_count N
//   15  4 * N  record offsets, relative to the first byte after this table
//   then entry records and data in any order. A record is data_size (8), data_offset (8,
//   absolute), data_crc (4), name_length (2) and the name bytes.
//
// Nothing in the file is trusted: the body checksum is verified when the container is
// opened, each entry's checksum every time the entry is opened, and the record table is
// only allocated once total_length has been verified to hold it. Every fault raises
// ap::Error; a PackedFile that exists has passed its checks.
//
// Not safe for concurrent use: record reads move the container handle and put it back.
// Opened entries have their own cloned handles and outlive the PackedFile.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "engine/common/file_interfaces.h"

namespace ap {

// Bytes before the record table: marker, total_length, body_crc, entry_count.
inline constexpr std::uint32_t kPackedHeaderSize = 15;
// The body checksum covers everything from here to total_length.
inline constexpr std::uint32_t kPackedBodyOffset = 11;
// Checksums read the container in chunks of this many bytes through a stack buffer.
inline constexpr std::size_t kPackedChecksumChunk = 4096;

class PackedFile final : public FileSystemI {
 public:
  // One entry record as stored in the container.
  struct Record {
    std::uint64_t data_size = 0;
    std::uint64_t data_offset = 0;  // absolute within the container
    std::uint32_t data_crc = 0;
    std::string name;  // bytes, compared exactly
  };

  class ReadableImpl;
  class FilenameHndl;
  class FileFinder;

  // Reads and verifies the header from the handle's current position (the start of the
  // file). Raises ap::Error on any fault.
  explicit PackedFile(std::shared_ptr<FileIO> handle);

  // The first entry in table order whose name equals `name` byte for byte, its checksum
  // verified. Empty when there is no such entry or the entry holds no bytes.
  std::shared_ptr<ReadableFileI> open(const std::string& name) override;
  // Calls callback(name, data_size) for every record in table order, duplicates included.
  // An empty callback raises boost::bad_function_call.
  void enumerate(
      const std::function<void(const std::string& name, std::uint64_t size)>& callback) override;

  std::uint32_t total_length() const { return total_length_; }
  std::uint32_t entry_count() const { return entry_count_; }

  // The record in table slot `index`; raises std::out_of_range past entry_count().
  Record record(std::uint32_t index);
  // Opens the entry that `record` describes, exactly as open() does once it has found it.
  std::shared_ptr<ReadableFileI> open_record(const Record& record);

 private:
  void ReadRecord(std::uint32_t position, Record& record);
  template <class Predicate>
  void Walk(Predicate& predicate);

  std::shared_ptr<FileIO> handle_;
  std::uint32_t total_length_ = 0;
  std::uint32_t entry_count_ = 0;
  std::vector<std::uint32_t> records_;  // absolute record positions, in table order
};

// One opened entry: positions are relative to the entry, reads never leave it.
class PackedFile::ReadableImpl final : public ReadableFileI {
 public:
  // Positions `handle` (a clone of the container's) on the data and verifies data_crc.
  // Raises "Failed to create ReadableFile" or "Failed to create ReadableFile crc error".
  ReadableImpl(std::uint64_t data_size, std::uint64_t data_offset, std::uint32_t data_crc,
               std::shared_ptr<FileIO> handle);

  // -1 and no move for a negative position or one at or past the entry's size.
  std::int64_t file_seek(std::int64_t position) override;
  std::int64_t file_size() override;
  // At most the bytes left in the entry; 0 at its end.
  std::int64_t file_read(void* buffer, std::uint64_t count) override;

 private:
  std::uint64_t data_size_;
  std::uint64_t data_offset_;
  std::uint64_t position_ = 0;
  std::shared_ptr<FileIO> handle_;
};

// Walk predicate of open(): stops at the first record named `name` and keeps a copy of it.
class PackedFile::FilenameHndl {
 public:
  explicit FilenameHndl(const std::string& name) : name_(name) {}
  bool operator()(const Record& record);
  bool found() const { return found_; }
  const Record& record() const { return record_; }

 private:
  const std::string& name_;
  bool found_ = false;
  Record record_;
};

// Walk predicate of enumerate(): reports every record and never stops the walk.
class PackedFile::FileFinder {
 public:
  explicit FileFinder(const std::function<void(const std::string&, std::uint64_t)>& callback)
      : callback_(callback) {}
  bool operator()(const Record& record);

 private:
  const std::function<void(const std::string&, std::uint64_t)>& callback_;
};

}  // namespace ap
