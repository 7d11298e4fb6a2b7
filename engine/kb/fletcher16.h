// Fletcher-16 in its block form: both sums start at 0xFF, are folded back to eight bits
// ((s & 0xFF) + (s >> 8)) after every 20 bytes, and twice at the end. The white-domain set
// reduces a public suffix to this checksum.
#pragma once

#include <cstddef>
#include <cstdint>

namespace ap {

class Fletcher16 {
 public:
  // Bytes between folds: 20 keep both sums within 16 bits.
  static constexpr int kBlock = 20;

  void Add(std::uint8_t byte) {
    sum1_ += byte;
    sum2_ += sum1_;
    if (++in_block_ == kBlock) {
      Fold();
      in_block_ = 0;
    }
  }

  // (second sum << 8) | first sum, both folded to eight bits.
  std::uint16_t Value() const {
    Fletcher16 copy = *this;
    if (copy.in_block_ != 0) copy.Fold();
    copy.Fold();
    return static_cast<std::uint16_t>((copy.sum2_ << 8) | copy.sum1_);
  }

 private:
  void Fold() {
    sum1_ = (sum1_ & 0xFF) + (sum1_ >> 8);
    sum2_ = (sum2_ & 0xFF) + (sum2_ >> 8);
  }

  std::uint32_t sum1_ = 0xFF;
  std::uint32_t sum2_ = 0xFF;
  int in_block_ = 0;
};

inline std::uint16_t Fletcher16Of(const void* data, std::size_t size) {
  Fletcher16 sum;
  const auto* p = static_cast<const std::uint8_t*>(data);
  for (std::size_t i = 0; i < size; ++i) sum.Add(p[i]);
  return sum.Value();
}

}  // namespace ap
