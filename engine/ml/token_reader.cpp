#include "engine/ml/token_reader.h"

#include <cstring>
#include <limits>

#include "engine/common/error.h"
#include "engine/kb/float_parser.h"

namespace ml {

TokenReader::TokenReader(std::shared_ptr<ap::ReadableFileI> source) : source_(std::move(source)) {
  if (source_ == nullptr) {
    end_ = true;
    return;
  }
  size_ = source_->file_size();
}

bool TokenReader::Refill() {
  if (begin_ != 0 && unread_ != 0) std::memmove(buffer_, buffer_ + begin_, unread_);
  begin_ = 0;
  const std::int64_t got = source_->file_read(buffer_ + unread_, kBufferSize - unread_);
  if (got <= 0) {
    end_ = true;
    return false;
  }
  unread_ += static_cast<std::size_t>(got);
  fetched_ += static_cast<std::uint64_t>(got);
  return true;
}

bool TokenReader::NextToken() {
  // The spaces after the previous token, whether or not the buffer ran out among them.
  while (skipping_) {
    while (unread_ != 0 && buffer_[begin_] == ' ') {
      ++begin_;
      --unread_;
    }
    if (unread_ != 0 || end_ || !Refill()) skipping_ = false;
  }
  for (;;) {
    const char* first = buffer_ + begin_;
    const void* space = unread_ == 0 ? nullptr : std::memchr(first, ' ', unread_);
    if (space != nullptr) {
      const std::size_t length = static_cast<const char*>(space) - first;
      token_.assign(first, length);
      begin_ += length + 1;
      unread_ -= length + 1;
      skipping_ = true;
      return true;
    }
    if (end_) break;
    // A full buffer without a separator: the token cannot be seen whole.
    if (unread_ == kBufferSize) {
      ap::ThrowError("TokenReader: token longer than " + std::to_string(kBufferSize) + " bytes");
    }
    Refill();
  }
  if (unread_ == 0) return false;
  token_.assign(buffer_ + begin_, unread_);
  begin_ += unread_;
  unread_ = 0;
  return true;
}

bool TokenReader::ReadUnsigned(std::uint32_t& value) {
  if (!NextToken()) return false;
  constexpr std::uint64_t kMax = std::numeric_limits<std::uint32_t>::max();
  std::uint64_t result = 0;
  for (const char c : token_) {
    if (c < '0' || c > '9') break;
    result = result * 10 + static_cast<unsigned>(c - '0');
    if (result > kMax) result = kMax;
  }
  value = static_cast<std::uint32_t>(result);
  return true;
}

bool TokenReader::ReadFloat(float& value) {
  if (!NextToken()) return false;
  value = static_cast<float>(ap::FloatParser::Parse(token_));
  return true;
}

std::optional<std::uint64_t> TokenReader::RemainingBytes() const {
  const std::uint64_t consumed = fetched_ - unread_;
  if (size_ < 0 || static_cast<std::uint64_t>(size_) < consumed) return std::nullopt;
  return static_cast<std::uint64_t>(size_) - consumed;
}

}  // namespace ml
