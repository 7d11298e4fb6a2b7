#include "engine/kb/float_parser.h"

#include <cmath>
#include <limits>

#include "engine/common/error.h"

namespace ap {
namespace {

// The most significant digits a mantissa keeps.
constexpr int kMaxDigits = 15;

constexpr std::uint64_t kPowers[] = {
    1ull,           10ull,           100ull,           1000ull,           10000ull,
    100000ull,      1000000ull,      10000000ull,      100000000ull,      1000000000ull,
    10000000000ull, 100000000000ull, 1000000000000ull, 10000000000000ull, 100000000000000ull};
constexpr int kMaxExactPower = 14;

std::uint64_t Power(int k) {
  if (k < 0 || k > kMaxExactPower) ThrowError("FloatParser: order is too large");
  return kPowers[k];
}

// 16-bit counters wrap rather than overflow.
std::int16_t Add16(std::int16_t a, int b) { return static_cast<std::int16_t>(a + b); }

// m * 10^k as a double.
double Scale(std::uint64_t m, int k) {
  // 0 * 10^400 would be 0 * inf; zero is zero at every scale.
  if (m == 0) return 0.0;
  if (k >= 1 && k <= kMaxExactPower) {
    const std::uint64_t p = kPowers[k];
    // Where the exact product would not fit 64 bits, scale in double instead of wrapping.
    if (m > std::numeric_limits<std::uint64_t>::max() / p) {
      return static_cast<double>(m) * static_cast<double>(p);
    }
    return static_cast<double>(m * p);
  }
  if (k <= 0 && k >= -kMaxExactPower) {
    return static_cast<double>(m) / static_cast<double>(kPowers[-k]);
  }
  return std::pow(10.0, k) * static_cast<double>(m);
}

bool IsDigit(char c) { return c >= '0' && c <= '9'; }

}  // namespace

double FloatParser::Parse(std::string_view text) {
  FloatParser parser;
  for (const char c : text) parser.Feed(c);
  return parser.Value();
}

void FloatParser::IntegerDigit(Part& part, unsigned digit) {
  if (part.digits >= kMaxDigits) {
    part.zeros = Add16(part.zeros, 1);
  } else if (part.mantissa != 0 && digit == 0) {
    part.zeros = Add16(part.zeros, 1);
  } else if (part.zeros == 0) {
    part.mantissa = part.mantissa * 10 + digit;
    if (part.mantissa != 0) part.digits = Add16(part.digits, 1);
  } else {
    part.digits = Add16(part.digits, part.zeros);
    if (part.digits >= kMaxDigits) {
      part.zeros = Add16(part.zeros, 1);
    } else {
      part.mantissa *= Power(part.zeros);
      part.zeros = 0;
      part.mantissa = part.mantissa * 10 + digit;
      part.digits = Add16(part.digits, 1);
    }
  }
}

void FloatParser::FractionDigit(Part& part, unsigned digit) {
  if (part.digits >= kMaxDigits || (part.mantissa != 0 && digit == 0)) {
    part.zeros = Add16(part.zeros, 1);
  } else if (part.zeros == 0) {
    part.mantissa = part.mantissa * 10 + digit;
    part.digits = Add16(part.digits, 1);
  } else if (part.digits + part.zeros >= kMaxDigits) {
    // The digit is dropped. The pending zeros never reached the mantissa, so they must not
    // reach the digit count either: the count scales the mantissa back down at the end.
    part.zeros = Add16(part.zeros, 1);
  } else {
    part.mantissa *= Power(part.zeros);
    part.digits = Add16(part.digits, part.zeros + 1);
    part.zeros = 0;
    part.mantissa = part.mantissa * 10 + digit;
  }
}

void FloatParser::ExponentDigit(unsigned digit) {
  exponent_ = static_cast<std::int16_t>(exponent_ * 10 + static_cast<int>(digit));
}

void FloatParser::Feed(char c) {
  const auto digit = static_cast<unsigned>(c - '0');
  switch (state_) {
    case State::kFirst:
      state_ = State::kInteger;
      if (c == '-') {
        positive_ = false;
        return;
      }
      if (c == '+') return;
      if (!IsDigit(c) && c != '.') ThrowError("FloatParser: wrong first symbol");
      [[fallthrough]];
    case State::kInteger:
      if (IsDigit(c)) {
        IntegerDigit(integer_, digit);
      } else if (c == '.') {
        state_ = State::kFraction;
      } else if (c == 'e' || c == 'E') {
        state_ = State::kExponentFirst;
      } else {
        ThrowError("FloatParser: wrong fraction symbol");
      }
      return;
    case State::kFraction:
      if (IsDigit(c)) {
        if (c == '0' && fraction_.mantissa == 0) {
          leading_zeros_ = Add16(leading_zeros_, 1);
        } else {
          FractionDigit(fraction_, digit);
        }
      } else if (c == 'e' || c == 'E') {
        state_ = State::kExponentFirst;
      } else {
        ThrowError("FloatParser: wrong fraction symbol");
      }
      return;
    case State::kExponentFirst:
      state_ = State::kExponent;
      if (IsDigit(c)) {
        ExponentDigit(digit);
      } else if (c == '-') {
        exponent_positive_ = false;
      } else if (c != '+') {
        ThrowError("FloatParser: wrong first exponenta symbol");
      }
      return;
    case State::kExponent:
      if (!IsDigit(c)) ThrowError("FloatParser: wrong exponenta symbol");
      ExponentDigit(digit);
      return;
  }
}

double FloatParser::Value() const {
  const int e = exponent_positive_ ? exponent_ : -static_cast<int>(exponent_);
  const int id = integer_.digits;
  const int iz = integer_.zeros;
  const int fd = fraction_.digits;
  const int fl = leading_zeros_;
  std::uint64_t i = integer_.mantissa;
  double value;
  if (id + iz + fl >= kMaxDigits) {
    // The integer part alone fills the significant digits: the fraction cannot matter.
    value = Scale(i, e + iz);
  } else if (i == 0) {
    value = Scale(fraction_.mantissa, e - fd - fl);
  } else if (id + iz + fd + fl >= kMaxDigits) {
    i *= Power(iz);
    value = (static_cast<double>(i) + Scale(fraction_.mantissa, -(fd + fl))) * std::pow(10.0, e);
  } else {
    // Both parts fit one exact 15-digit mantissa.
    i = i * Power(iz) * Power(fd + fl);
    value = Scale(fraction_.mantissa + i, e - fd - fl);
  }
  return positive_ ? value : -value;
}

}  // namespace ap
