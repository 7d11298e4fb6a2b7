#include "engine/kb/packed_file.h"

#include <algorithm>
#include <boost/function/function_base.hpp>
#include <cstring>
#include <stdexcept>

#include "engine/common/error.h"
#include "engine/kb/crc32.h"

namespace ap {
namespace {

// A 2-, 4- or 8-byte little-endian field, read with one call that must deliver all of it.
template <class T>
T ReadField(FileIO& file) {
  unsigned char bytes[sizeof(T)];
  if (file.file_read(bytes, sizeof(T)) != static_cast<std::int64_t>(sizeof(T))) {
    ThrowError("Failed to read type");
  }
  T value = 0;
  for (std::size_t i = sizeof(T); i-- > 0;) value = static_cast<T>((value << 8) | bytes[i]);
  return value;
}

struct Checksum {
  std::uint32_t crc = 0;
  std::uint64_t summed = 0;  // bytes actually fed to the CRC
};

// CRC-32 of up to `count` bytes from the file's current position; stops at the first read
// that delivers nothing.
Checksum ChecksumFrom(FileIO& file, std::uint64_t count) {
  unsigned char chunk[kPackedChecksumChunk];
  Crc32 crc;
  Checksum result;
  while (result.summed < count) {
    const std::uint64_t want = std::min<std::uint64_t>(count - result.summed, sizeof chunk);
    const std::int64_t got = file.file_read(chunk, want);
    if (got <= 0) break;
    const auto used = std::min<std::uint64_t>(static_cast<std::uint64_t>(got), want);
    crc.Update(chunk, used);
    result.summed += used;
  }
  result.crc = crc.Value();
  return result;
}

}  // namespace

PackedFile::PackedFile(std::shared_ptr<FileIO> handle) : handle_(std::move(handle)) {
  if (!handle_) ThrowError("PackedFile: null container handle");
  FileIO& file = *handle_;

  unsigned char marker[3];
  file.file_read(marker, sizeof marker);
  total_length_ = ReadField<std::uint32_t>(file);
  const auto body_crc = ReadField<std::uint32_t>(file);

  // A total_length below 11 wraps and asks for almost 4 GiB; the sum then fails at the end
  // of the file. A container shorter than it claims fails even when the stored sum happens
  // to match the bytes that are there.
  const std::int64_t body = file.tell();
  const std::uint64_t body_length = static_cast<std::uint32_t>(total_length_ - kPackedBodyOffset);
  const Checksum sum = ChecksumFrom(file, body_length);
  file.file_seek(body);
  if (sum.crc != body_crc || sum.summed != body_length) ThrowError("Control summ is invalid");

  entry_count_ = ReadField<std::uint32_t>(file);
  // The table is sized from entry_count only once the verified length can hold it.
  const std::uint64_t table_end =
      static_cast<std::uint64_t>(file.tell()) + 4 * static_cast<std::uint64_t>(entry_count_);
  if (table_end > total_length_) ThrowError("PackedFile: entry count exceeds the container");

  records_.assign(entry_count_, 0);
  if (entry_count_ != 0) {
    file.file_read(records_.data(), 4 * static_cast<std::uint64_t>(entry_count_));
  }
  const auto base = static_cast<std::uint32_t>(file.tell());
  for (std::uint32_t& slot : records_) {
    unsigned char bytes[4];
    std::memcpy(bytes, &slot, 4);
    const std::uint32_t offset = bytes[0] | (bytes[1] << 8) | (bytes[2] << 16) |
                                 (static_cast<std::uint32_t>(bytes[3]) << 24);
    slot = offset + base;  // 32-bit sum: records lie in the first 4 GiB
  }
}

void PackedFile::ReadRecord(std::uint32_t position, Record& record) {
  FileIO& file = *handle_;
  const std::int64_t back = file.tell();
  file.file_seek(position);
  record.data_size = ReadField<std::uint64_t>(file);
  record.data_offset = ReadField<std::uint64_t>(file);
  record.data_crc = ReadField<std::uint32_t>(file);
  const auto name_length = ReadField<std::uint16_t>(file);
  record.name.resize(name_length);
  if (name_length != 0) {
    const std::int64_t got = file.file_read(record.name.data(), name_length);
    record.name.resize(static_cast<std::size_t>(std::clamp<std::int64_t>(got, 0, name_length)));
  }
  file.file_seek(back);
}

template <class Predicate>
void PackedFile::Walk(Predicate& predicate) {
  Record scratch;
  for (const std::uint32_t position : records_) {
    ReadRecord(position, scratch);
    if (predicate(scratch)) return;
  }
}

std::shared_ptr<ReadableFileI> PackedFile::open(const std::string& name) {
  FilenameHndl finder(name);
  Walk(finder);
  if (!finder.found()) return nullptr;
  return open_record(finder.record());
}

std::shared_ptr<ReadableFileI> PackedFile::open_record(const Record& record) {
  if (record.data_size == 0) return nullptr;
  return std::make_shared<ReadableImpl>(record.data_size, record.data_offset, record.data_crc,
                                        handle_->clone());
}

void PackedFile::enumerate(
    const std::function<void(const std::string& name, std::uint64_t size)>& callback) {
  if (!callback) throw boost::bad_function_call();
  FileFinder finder(callback);
  Walk(finder);
}

PackedFile::Record PackedFile::record(std::uint32_t index) {
  if (index >= records_.size()) throw std::out_of_range("PackedFile::record: no such slot");
  Record result;
  ReadRecord(records_[index], result);
  return result;
}

bool PackedFile::FilenameHndl::operator()(const Record& record) {
  if (record.name.size() != name_.size() || record.name != name_) return false;
  record_ = record;
  found_ = true;
  return true;
}

bool PackedFile::FileFinder::operator()(const Record& record) {
  callback_(record.name, record.data_size);
  return false;
}

PackedFile::ReadableImpl::ReadableImpl(std::uint64_t data_size, std::uint64_t data_offset,
                                       std::uint32_t data_crc, std::shared_ptr<FileIO> handle)
    : data_size_(data_size), data_offset_(data_offset), handle_(std::move(handle)) {
  const std::int64_t reached = handle_->file_seek(static_cast<std::int64_t>(data_offset_));
  if (reached >= 0 && static_cast<std::uint64_t>(reached) != data_offset_) {
    ThrowError("Failed to create ReadableFile");
  }
  // An entry cut short by the end of the file fails like a damaged one, whatever its sum.
  const Checksum sum = ChecksumFrom(*handle_, data_size_);
  handle_->file_seek(static_cast<std::int64_t>(data_offset_));
  if (sum.crc != data_crc || sum.summed != data_size_) {
    ThrowError("Failed to create ReadableFile crc error");
  }
}

std::int64_t PackedFile::ReadableImpl::file_seek(std::int64_t position) {
  if (position < 0 || static_cast<std::uint64_t>(position) >= data_size_) return -1;
  const std::int64_t reached =
      handle_->file_seek(static_cast<std::int64_t>(data_offset_ + position));
  // A handle that failed to move leaves the entry where it was.
  if (reached < 0 || static_cast<std::uint64_t>(reached) < data_offset_) return -1;
  position_ = static_cast<std::uint64_t>(reached) - data_offset_;
  return static_cast<std::int64_t>(position_);
}

std::int64_t PackedFile::ReadableImpl::file_size() { return static_cast<std::int64_t>(data_size_); }

std::int64_t PackedFile::ReadableImpl::file_read(void* buffer, std::uint64_t count) {
  if (count == 0 || position_ >= data_size_) return 0;
  count = std::min(count, data_size_ - position_);
  handle_->file_seek(static_cast<std::int64_t>(data_offset_ + position_));
  const std::int64_t got = handle_->file_read(buffer, count);
  if (got > 0) position_ += static_cast<std::uint64_t>(got);
  return got;
}

}  // namespace ap
