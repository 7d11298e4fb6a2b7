// The name coder of the white-domain set: a name is lower-cased, written with a fixed
// prefix code (letters, digits, "-" and "."), packed into bytes first bit highest, and keyed
// by the 32-bit SpookyHash V2 of the packed bytes with seed 0.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace wd {

// The coded length is stored in one byte: a longer code cannot be listed.
inline constexpr std::size_t kMaxCodedLength = 255;
// Symbols of the code: "a"-"z" are 0-25, "0"-"9" 26-35, "-" 36, "." 37.
inline constexpr int kSymbolCount = 38;

struct CodedName {
  std::size_t length = 0;  // packed bytes; 0 for the empty name
  std::uint32_t code = 0;  // 0: the name cannot be coded and never matches
};

class HuffmanSpooky {
 public:
  // The symbol of a character, upper-case letters folded; -1 for any other character.
  static int Symbol(char c);
  // The bit string of a symbol (most significant bit first) and its length in bits.
  static std::uint32_t Bits(int symbol);
  static int BitLength(int symbol);

  // Packs the code of `name` into `out`; the number of bytes, or -1 when the name holds a
  // character outside the code or its code would exceed kMaxCodedLength bytes.
  static int Pack(std::string_view name, std::uint8_t (&out)[kMaxCodedLength]);

  // Length and key of `name`. An uncodable or over-long name gives code 0. No allocation.
  static CodedName Code(std::string_view name);
};

}  // namespace wd
