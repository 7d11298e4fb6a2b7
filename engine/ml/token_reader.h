// Reads the space-delimited tokens of a network file through a fixed 1024-byte buffer.
// Only the space character (0x20) separates tokens: tabs and line ends belong to them. A run
// of spaces separates like a single one, even when it straddles a buffer refill.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "engine/common/file_interfaces.h"

namespace ml {

class TokenReader {
 public:
  static constexpr std::size_t kBufferSize = 1024;

  explicit TokenReader(std::shared_ptr<ap::ReadableFileI> source);

  // Each returns false, leaving `value` alone, when no token is left.
  // An unsigned token is the value of its leading decimal digits (0 when there are none),
  // saturated at 2^32 - 1.
  bool ReadUnsigned(std::uint32_t& value);
  // A float token goes through ap::FloatParser; its faults propagate.
  bool ReadFloat(float& value);

  // Bytes of the source not yet handed out as tokens, when the source tells its size. Loaders
  // use it to refuse declared sizes that the rest of the file cannot hold.
  std::optional<std::uint64_t> RemainingBytes() const;

 private:
  bool NextToken();
  bool Refill();

  std::shared_ptr<ap::ReadableFileI> source_;
  char buffer_[kBufferSize];
  std::size_t begin_ = 0;   // first unread byte
  std::size_t unread_ = 0;  // unread bytes from begin_
  bool end_ = false;        // a read of the source gave nothing
  bool skipping_ = false;   // spaces after the last token may continue in the next fill
  std::int64_t size_ = -1;  // the source's size, -1 when unknown
  std::uint64_t fetched_ = 0;
  std::string token_;
};

}  // namespace ml
