// The knowledge-base file the service is created with, seen by the engine as an ap::FileIO.
//
// The adapter trusts nothing about the host file except its result codes: the size is taken
// once, every position is checked against it, and reading past the end is an error rather
// than a short read. Clones share the host file but keep their own positions, so every read
// seeks first.
#pragma once

#include <cstdint>
#include <memory>

#include "engine/common/file_interfaces.h"
#include "framework/uvo/interfaces.h"
#include "framework/uvo/object.h"

namespace cf::adapters {

class AntiphishingIOAdapter final : public ap::FileIO {
 public:
  // Takes its own reference to `hostFile`. Raises uvo::CheckFailedException for a null file
  // or a seek to 0 that lands elsewhere, uvo::CheckResultFailedException when the host's
  // size or seek fails.
  explicit AntiphishingIOAdapter(uvo::IStream* hostFile);

  // `position` must lie in [0, size): a position equal to the size is refused.
  std::int64_t file_seek(std::int64_t position) override;
  std::int64_t file_size() override;
  // Reads exactly from the current position; asking for bytes past the end raises
  // uvo::CheckFailedException. Returns the count the host delivered.
  std::int64_t file_read(void* buffer, std::uint64_t count) override;

  std::int64_t tell() override;
  // A fresh adapter on the same host file, positioned at 0.
  std::shared_ptr<ap::FileIO> clone() override;

  // The adapter is read-only; these raise std::runtime_error.
  void open_for_reading() override;
  std::int64_t file_write(const void* buffer, std::uint64_t count) override;
  void file_truncate(std::int64_t size) override;

 private:
  uvo::Ptr<uvo::IStream> file_;
  std::uint64_t size_ = 0;
  std::uint64_t position_ = 0;
};

}  // namespace cf::adapters
