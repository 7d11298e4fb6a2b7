// Byte classes shared by the markup scanners. Bytes are unsigned values: nothing at or
// above 0x80 is ever whitespace, and only ASCII letters change case.
#pragma once

#include <cstdint>

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

}  // namespace html
