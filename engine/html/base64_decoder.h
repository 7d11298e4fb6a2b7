// A streaming base64 decoder to mix into a machine state: each alphabet byte adds six bits,
// every other byte (padding, blanks, line ends) is ignored, and each full byte is handed to
// Base::output as soon as it is complete.
#pragma once

#include <cstdint>

#include "engine/html/state_machine.h"

namespace utils::base64 {

// Value of a byte of the base64 alphabet, or -1.
constexpr int alphabetValue(std::uint8_t b) {
  if (b >= 'A' && b <= 'Z') return b - 'A';
  if (b >= 'a' && b <= 'z') return b - 'a' + 26;
  if (b >= '0' && b <= '9') return b - '0' + 52;
  if (b == '+') return 62;
  if (b == '/') return 63;
  return -1;
}

// Base is a state with `void output(std::uint8_t)`.
template <typename Base>
class Decoder : public Base {
 public:
  using Base::Base;

  util::Transition process(std::uint8_t b) override {
    const int value = alphabetValue(b);
    if (value < 0) return util::Stay();
    bits_ = (bits_ << 6) | static_cast<std::uint32_t>(value);
    held_ += 6;
    if (held_ >= 8) {
      held_ -= 8;
      this->output(static_cast<std::uint8_t>(bits_ >> held_));
    }
    return util::Stay();
  }
  // No byte ever ends the data.
  static constexpr bool kBulk = true;
  const std::uint8_t* consume(const std::uint8_t* p, const std::uint8_t* end) override {
    for (; p < end; ++p) process(*p);
    return end;
  }

 private:
  std::uint32_t bits_ = 0;  // only the low `held_` bits are pending
  unsigned held_ = 0;
};

}  // namespace utils::base64
