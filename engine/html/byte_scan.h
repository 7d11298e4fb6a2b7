// Finding the end of a run of bytes that a scanner state takes without a transition: the next
// occurrence of one or two given bytes (memchr does the work), or of any byte of a small class.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

namespace html {

using ScanByte = unsigned char;

// The first `c` in [p, end), or end.
inline const ScanByte* findByte(const ScanByte* p, const ScanByte* end, ScanByte c) {
  const void* hit = std::memchr(p, c, static_cast<std::size_t>(end - p));
  return hit != nullptr ? static_cast<const ScanByte*>(hit) : end;
}

// The first `a` or `b` in [p, end), or end. Looks through windows of kScanWindow bytes, so
// that a run full of `b` costs no more than its length (one memchr for `a` over the whole
// rest on every stop would cost the square of it).
inline constexpr std::size_t kScanWindow = 256;
inline const ScanByte* findEither(const ScanByte* p, const ScanByte* end, ScanByte a, ScanByte b) {
  while (p < end) {
    const ScanByte* windowEnd =
        end - p > static_cast<std::ptrdiff_t>(kScanWindow) ? p + kScanWindow : end;
    const ScanByte* stop = findByte(p, findByte(p, windowEnd, a), b);
    if (stop != windowEnd) return stop;
    p = windowEnd;
  }
  return end;
}

// A set of bytes, for runs that end at any byte of a class (whitespace, '>' ...).
class ByteSet {
 public:
  constexpr explicit ByteSet(std::string_view bytes, bool whitespace = false) : in_{} {
    for (const char c : bytes) in_[static_cast<ScanByte>(c)] = true;
    if (whitespace) {
      for (ScanByte b = 9; b <= 13; ++b) in_[b] = true;
      in_[32] = true;
    }
  }
  constexpr bool contains(ScanByte b) const { return in_[b]; }

  // The first byte of the set in [p, end), or end.
  const ScanByte* find(const ScanByte* p, const ScanByte* end) const {
    while (p < end && !in_[*p]) ++p;
    return p;
  }

 private:
  std::array<bool, 256> in_;
};

}  // namespace html
