// The engine's reader of decimal numbers. Every floating-point number in the text knowledge
// bases and the model files goes through it, so they all read the same way.
//
// Grammar (no blanks anywhere): an optional sign, integer digits, optionally "." and
// fraction digits, optionally "e" or "E" with an optional sign and exponent digits. Every
// part may be empty: "", "-", ".", "5e" are accepted and read as 0, -0, 0 and 5.
//
// At most 15 significant digits enter the value; later digits only keep their place value,
// so "12345678901234567890" reads as 123456789012345e5. Powers of ten up to 14 are exact.
// Counters and the exponent are 16-bit and wrap, as the stored files were written for.
//
// Faults raise ap::Error with one of these texts:
//   "FloatParser: wrong first symbol"            a character that cannot start a number
//   "FloatParser: wrong fraction symbol"         a stray character after digits or "."
//   "FloatParser: wrong first exponenta symbol"  neither sign nor digit right after "e"
//   "FloatParser: wrong exponenta symbol"        a non-digit later in the exponent
//   "FloatParser: order is too large"            a power of ten outside the exact table
//
// The parser allocates nothing; its state is the object, fresh for every number.
#pragma once

#include <cstdint>
#include <string_view>

namespace ap {

class FloatParser {
 public:
  // Reads the whole of `text`; every character must belong to the number.
  static double Parse(std::string_view text);
  static double Parse(const char* begin, const char* end) {
    return Parse(std::string_view(begin, static_cast<std::size_t>(end - begin)));
  }

  // Character-at-a-time use: Feed every character of the number, then take Value().
  void Feed(char c);
  double Value() const;

 private:
  enum class State : std::uint8_t { kFirst, kInteger, kFraction, kExponentFirst, kExponent };

  // One decimal of the mantissa being built (integer or fraction part).
  struct Part {
    std::uint64_t mantissa = 0;
    std::int16_t digits = 0;  // significant digits that entered the mantissa
    std::int16_t zeros = 0;   // zeros or dropped digits not multiplied in (place values)
  };

  static void IntegerDigit(Part& part, unsigned digit);
  static void FractionDigit(Part& part, unsigned digit);
  void ExponentDigit(unsigned digit);

  Part integer_;
  Part fraction_;
  std::int16_t leading_zeros_ = 0;  // zeros between the point and the first non-zero digit
  std::int16_t exponent_ = 0;
  bool positive_ = true;
  bool exponent_positive_ = true;
  State state_ = State::kFirst;
};

}  // namespace ap
