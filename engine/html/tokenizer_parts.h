// Limits, closing literals and the small fixed-size stores the HTML tokenizer's states are
// made of. Nothing here allocates per byte; only BoundedText grows, and only to its limit.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

namespace html {

// Text, comment and script text are handed on in pieces of at most this size.
inline constexpr std::size_t kTextChunkBytes = 1024;
// Bytes of a tag name beyond this are ignored.
inline constexpr std::size_t kMaxTagNameBytes = 1024;
// Bytes of an attribute name beyond this are dropped; no name worth reporting is this long.
inline constexpr std::size_t kMaxAttributeNameBytes = 1024;
// A collected attribute value keeps at most this many bytes (inline data URLs of images are
// the longest real values); the rest is dropped so that a hostile page cannot make us hold it.
inline constexpr std::size_t kMaxAttributeValueBytes = std::size_t{1} << 20;

// Closing literals of the raw-text elements and the name reported when they end.
struct ScriptCloseTrait {
  static constexpr std::string_view kLiteral = "</script>";
  static constexpr std::string_view kName = "script";
  static constexpr bool kDelivers = true;  // the text goes to scriptText
};
struct StyleCloseTrait {
  static constexpr std::string_view kLiteral = "</style>";
  static constexpr std::string_view kName = "style";
  static constexpr bool kDelivers = false;  // read and discarded
};
struct NoscriptCloseTrait {
  static constexpr std::string_view kLiteral = "</noscript>";
  static constexpr std::string_view kName = "noscript";
  static constexpr bool kDelivers = false;
};

// Text of at most Limit bytes in fixed storage; later bytes are ignored.
template <typename Char, std::size_t Limit>
class FixedText {
 public:
  void append(std::uint8_t b) {
    if (size_ < Limit) data_[size_++] = static_cast<Char>(b);
  }
  std::basic_string_view<Char> view() const { return {data_, size_}; }
  bool endsWithSlash() const { return size_ > 0 && data_[size_ - 1] == '/'; }
  void dropLast() { --size_; }

 private:
  Char data_[Limit];
  std::size_t size_ = 0;
};

// An attribute name or value that keeps its first Limit bytes but remembers the last byte
// seen, so that a trailing '/' is noticed even past the limit.
template <typename Char, std::size_t Limit>
class BoundedText {
 public:
  void append(std::uint8_t b) {
    last_ = b;
    if (text_.size() < Limit) {
      text_.push_back(static_cast<Char>(b));
    } else {
      truncated_ = true;
    }
  }
  // The same as append for each byte of a run.
  void appendRun(const std::uint8_t* data, std::size_t n) {
    if (n == 0) return;
    last_ = data[n - 1];
    const std::size_t room = Limit - std::min(Limit, text_.size());
    const std::size_t kept = std::min(n, room);
    text_.append(reinterpret_cast<const Char*>(data), kept);
    if (kept < n) truncated_ = true;
  }
  bool empty() const { return text_.empty(); }
  bool endsWithSlash() const { return !text_.empty() && last_ == '/'; }
  void dropSlash() {
    if (!truncated_) text_.pop_back();
    last_ = text_.empty() ? 0 : static_cast<std::uint8_t>(text_.back());
  }
  std::basic_string_view<Char> view() const { return text_; }
  void clear() {
    text_.clear();
    truncated_ = false;
    last_ = 0;
  }

 private:
  std::basic_string<Char> text_;
  std::uint8_t last_ = 0;
  bool truncated_ = false;
};

// Collects bytes and hands them to `flush` whenever Size of them are held.
template <typename Char, std::size_t Size>
class ChunkBuffer {
 public:
  template <typename Flush>
  void append(std::uint8_t b, Flush&& flush) {
    data_[count_++] = static_cast<Char>(b);
    if (count_ == Size) {
      count_ = 0;
      flush(data_, Size);
    }
  }
  // The same as append for each byte of a run.
  template <typename Flush>
  void appendRun(const std::uint8_t* data, std::size_t n, Flush&& flush) {
    while (n > 0) {
      const std::size_t k = std::min(n, Size - count_);
      std::memcpy(data_ + count_, data, k);
      count_ += k;
      data += k;
      n -= k;
      if (count_ == Size) {
        count_ = 0;
        flush(data_, Size);
      }
    }
  }
  template <typename Flush>
  void flushIfAny(Flush&& flush) {
    if (count_ == 0) return;
    const std::size_t n = count_;
    count_ = 0;
    flush(data_, n);
  }

 private:
  Char data_[Size];
  std::size_t count_ = 0;
};

// Tracks the last two bytes to find the "-->" that ends a comment.
class CommentEnd {
 public:
  bool closes(std::uint8_t b) const { return b == '>' && prev2_ == '-' && prev1_ == '-'; }
  void shift(std::uint8_t b) {
    prev2_ = prev1_;
    prev1_ = b;
  }
  void shiftRun(const std::uint8_t* data, std::size_t n) {
    if (n >= 2) {
      prev2_ = data[n - 2];
      prev1_ = data[n - 1];
    } else if (n == 1) {
      shift(data[0]);
    }
  }

 private:
  std::uint8_t prev1_ = 0;
  std::uint8_t prev2_ = 0;
};

}  // namespace html
