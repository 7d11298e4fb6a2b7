// HTML character references and the UTF-16-to-UTF-8 encoder. Callers collect the bytes
// between '&' and ';' and ask for them to be decoded in place.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

namespace html {

// One named reference: 20 bytes, as the table is laid out.
struct EntityRecord {
  char name[10];         // NUL-terminated; the longest name has 8 bytes
  char utf8[6];          // the character in UTF-8
  std::uint32_t length;  // number of UTF-8 bytes
};
static_assert(sizeof(EntityRecord) == 20);

// The named references of HTML 4.01 plus "apos", sorted by name in byte order.
std::span<const EntityRecord> entityTable();

// The most bytes decodeReference writes: every reference is one UTF-16 code unit.
inline constexpr std::size_t kMaxDecodedReferenceBytes = 3;

// Decodes the `count` bytes of a reference (a name, or '#' and a decimal number, or "#x" and
// a hexadecimal one). On success the buffer holds the UTF-8 bytes and `count` their number;
// on failure both are unchanged. The buffer must have room for
// max(count, kMaxDecodedReferenceBytes) bytes.
bool decodeReference(char* buffer, std::size_t& count);

// Encodes one UTF-16 code unit into `out` (room for 3 bytes); returns the number of bytes,
// 0 for a surrogate.
std::size_t encodeUtf8(std::uint16_t unit, char* out);

}  // namespace html
