// Byte classes shared by the markup scanners. Bytes are unsigned values: nothing at or
// above 0x80 is ever whitespace, and only ASCII letters change case.
#pragma once

#include <cstdint>
#include <string_view>

namespace html {

constexpr bool isWhitespace(std::uint8_t b) { return (b >= 9 && b <= 13) || b == 32; }

constexpr std::uint8_t toLowerAscii(std::uint8_t b) {
  return (b >= 'A' && b <= 'Z') ? static_cast<std::uint8_t>(b + ('a' - 'A')) : b;
}

constexpr bool isAsciiDigit(std::uint8_t b) { return b >= '0' && b <= '9'; }

constexpr bool isAsciiLetter(std::uint8_t b) {
  return (b >= 'a' && b <= 'z') || (b >= 'A' && b <= 'Z');
}

// Value of a hexadecimal digit of either case, or -1.
constexpr int hexDigitValue(std::uint8_t b) {
  if (b >= '0' && b <= '9') return b - '0';
  if (b >= 'a' && b <= 'f') return b - 'a' + 10;
  if (b >= 'A' && b <= 'F') return b - 'A' + 10;
  return -1;
}

// A name of at most 7 bytes packed into one integer (its length in the top bits), so that looking a
// tag name up in a short table costs integer comparisons instead of string comparisons. Longer
// names give 0, which no packed name equals.
constexpr std::uint64_t packName(std::string_view name) {
  if (name.empty() || name.size() > 7) return 0;
  std::uint64_t key = 0;
  for (const char c : name) key = (key << 8) | static_cast<std::uint8_t>(c);
  return key | (std::uint64_t{name.size()} << 60);
}

}  // namespace html
