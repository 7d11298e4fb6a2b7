#include "engine/html/entities.h"

#include <algorithm>
#include <cstring>
#include <string_view>

#include "engine/html/char_class.h"

namespace html {
namespace {

constexpr EntityRecord kEntities[] = {
#include "engine/html/entity_table.inc"
};

// A decimal reference has at most five digits after the '#'.
constexpr std::size_t kMaxNumericReference = 6;

std::uint32_t parseNumber(const char* digits, std::size_t n, bool hex) {
  std::uint32_t value = 0;
  for (std::size_t i = 0; i < n; ++i) {
    const auto b = static_cast<std::uint8_t>(digits[i]);
    const int digit = hex ? hexDigitValue(b) : (isAsciiDigit(b) ? b - '0' : -1);
    if (digit < 0) return 0;
    value = value * (hex ? 16 : 10) + static_cast<std::uint32_t>(digit);
  }
  return value;
}

}  // namespace

std::span<const EntityRecord> entityTable() { return kEntities; }

std::size_t encodeUtf8(std::uint16_t unit, char* out) {
  if (unit >= 0xD800 && unit <= 0xDFFF) return 0;
  if (unit < 0x80) {
    out[0] = static_cast<char>(unit);
    return 1;
  }
  if (unit < 0x800) {
    out[0] = static_cast<char>(0xC0 | (unit >> 6));
    out[1] = static_cast<char>(0x80 | (unit & 0x3F));
    return 2;
  }
  out[0] = static_cast<char>(0xE0 | (unit >> 12));
  out[1] = static_cast<char>(0x80 | ((unit >> 6) & 0x3F));
  out[2] = static_cast<char>(0x80 | (unit & 0x3F));
  return 3;
}

bool decodeReference(char* buffer, std::size_t& count) {
  if (count == 0) return false;
  if (buffer[0] != '#') {
    const std::string_view key(buffer, count);
    const auto* end = std::end(kEntities);
    const auto* it = std::lower_bound(std::begin(kEntities), end, key,
                                      [](const EntityRecord& record, std::string_view k) {
                                        return std::string_view(record.name) < k;
                                      });
    if (it == end || std::string_view(it->name) != key) return false;
    std::memcpy(buffer, it->utf8, it->length);
    count = it->length;
    return true;
  }
  if (count > kMaxNumericReference) return false;
  std::uint32_t value = 0;
  if (count > 1) {
    value = buffer[1] == 'x' ? parseNumber(buffer + 2, count - 2, true)
                             : parseNumber(buffer + 1, count - 1, false);
  }
  char utf8[kMaxDecodedReferenceBytes];
  const std::size_t n = encodeUtf8(static_cast<std::uint16_t>(value & 0xFFFF), utf8);
  if (n == 0) return false;
  std::memcpy(buffer, utf8, n);
  count = n;
  return true;
}

}  // namespace html
