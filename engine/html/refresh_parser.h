// Reads the content of a meta element the way a refresh is written: a delay, ';', "url=" and
// the target. Bytes arrive one at a time as the attribute value streams in. The bytes of the
// target are handed back to the caller (which decodes data URLs); a value that does not read
// as a refresh becomes fallback text.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

namespace html_decrunch {

class RefreshParser {
 public:
  enum class Step {
    kNone,      // the byte belongs to the delay, the "url=" or the fallback text
    kFirstUrl,  // the first byte of the target
    kUrl,       // a later byte of the target
  };

  // Starts on a new value; the fallback text is kept.
  void reset();
  Step feed(std::uint8_t byte);

  // Whether every later byte is a byte of the target (feed answers kUrl), or of the fallback
  // text (feed answers kNone).
  bool inTarget() const { return state_ == State::kTarget; }
  bool gaveUp() const { return state_ == State::kGaveUp; }
  // The same as feed for each byte of a run, up to and including the first byte of the
  // target: answers how many bytes were taken. The last of them was the target's first when
  // inTarget() holds afterwards (and was not before). Takes nothing in the target or after
  // giving up.
  std::size_t feedUpToTarget(const char* data, std::size_t length);
  // After giving up: the same as feed for each byte.
  void addFallback(const char* data, std::size_t length);

  const std::string& fallback() const { return fallback_; }
  void clearFallback() { fallback_.clear(); }

 private:
  enum class State { kStart, kDelay, kAfterDelay, kUrl, kValue, kTarget, kGaveUp };

  void giveUp();
  static void appendBounded(std::string& text, std::uint8_t byte);

  State state_ = State::kStart;
  std::size_t matched_ = 0;  // bytes of "url=" read
  std::string raw_;
  std::string fallback_;
};

}  // namespace html_decrunch
