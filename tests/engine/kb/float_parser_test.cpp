#include "engine/kb/float_parser.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <random>

#include "engine/common/error.h"
#include "tests/support/kb_test_support.h"

namespace {

using ap::FloatParser;

TEST(FloatParser, ShortForms) {
  const std::pair<const char*, double> cases[] = {
      {"0.05", 0.05}, {"-0.5", -0.5}, {"1e-3", 0.001}, {"1E+3", 1000.0}, {"+.5", 0.5},
      {"5.", 5.0},    {"5e", 5.0},    {".", 0.0},      {"007", 7.0},     {"123.456e2", 12345.6}};
  for (const auto& [text, value] : cases) EXPECT_EQ(FloatParser::Parse(text), value) << text;
  const double empty = FloatParser::Parse("");
  EXPECT_EQ(empty, 0.0);
  EXPECT_FALSE(std::signbit(empty));
  const double minus = FloatParser::Parse("-");
  EXPECT_EQ(minus, 0.0);
  EXPECT_TRUE(std::signbit(minus));
}

TEST(FloatParser, Messages) {
  const std::pair<const char*, const char*> cases[] = {
      {"1.2.3", "wrong fraction symbol"},     {"12a", "wrong fraction symbol"},
      {"0.05 ", "wrong fraction symbol"},     {"7 ", "wrong fraction symbol"},
      {"--1", "wrong fraction symbol"},       {"e5", "wrong first symbol"},
      {" 1", "wrong first symbol"},           {"1e+-2", "wrong exponenta symbol"},
      {"1e5.", "wrong exponenta symbol"},     {"1ex", "wrong first exponenta symbol"},
      {"1e ", "wrong first exponenta symbol"}};
  for (const auto& [text, message] : cases) {
    EXPECT_EQ(pelmix::testing::ErrorOf([text = text] { FloatParser::Parse(text); }),
              std::string("FloatParser: ") + message)
        << text;
  }
}

TEST(FloatParser, FifteenSignificantDigits) {
  EXPECT_EQ(FloatParser::Parse("123456789012345"), 123456789012345.0);
  EXPECT_EQ(FloatParser::Parse("1234567890123456"), 1234567890123450.0);
  EXPECT_EQ(FloatParser::Parse("12345678901234567"), 12345678901234500.0);
  EXPECT_EQ(FloatParser::Parse("12345678901234567890"), 123456789012345e5);
  EXPECT_EQ(FloatParser::Parse("1000000000000000000001"), 1e21);
  EXPECT_EQ(FloatParser::Parse("100000000000001"), 100000000000001.0);
  EXPECT_DOUBLE_EQ(FloatParser::Parse("1234567890.123456789"), 1234567890.123456789);
  EXPECT_DOUBLE_EQ(FloatParser::Parse("0.123456789012345678"), 0.123456789012345);
  // Fifteen zeros after the point leave no room for the digits behind them.
  EXPECT_EQ(FloatParser::Parse("0.000000000000000123"), 0.0);
  EXPECT_DOUBLE_EQ(FloatParser::Parse("1.23e-16"), 1.23e-16);
}

TEST(FloatParser, DroppedFractionDigitKeepsTheScale) {
  EXPECT_EQ(FloatParser::Parse("0.1000000000000001"), 0.1);
  EXPECT_EQ(FloatParser::Parse("0.10000000000000000009"), 0.1);
  EXPECT_EQ(FloatParser::Parse("0.100000000000001"), 0.100000000000001);
  EXPECT_EQ(FloatParser::Parse("0.0025000000000000000007"), 0.0025);
  EXPECT_DOUBLE_EQ(FloatParser::Parse("3.1000000000000001"), 3.1);
}

TEST(FloatParser, LargeMantissasScaleWithoutWrapping) {
  EXPECT_EQ(FloatParser::Parse("123456789012345e14"), 123456789012345e14);
  EXPECT_EQ(FloatParser::Parse("123456789012345678901"), 123456789012345e6);
  EXPECT_EQ(FloatParser::Parse("999999999999999999999999"), 999999999999999e9);
  EXPECT_EQ(FloatParser::Parse("-18446744073709551617"), -184467440737095e5);
  // Still exact in 64 bits: the integer path is kept.
  EXPECT_EQ(FloatParser::Parse("18446744073709"), 18446744073709.0);
}

TEST(FloatParser, ZeroStaysZeroAtAnyScale) {
  EXPECT_EQ(FloatParser::Parse("0e400"), 0.0);
  EXPECT_EQ(FloatParser::Parse("0.000e999"), 0.0);
  const double negative = FloatParser::Parse("-0e400");
  EXPECT_EQ(negative, 0.0);
  EXPECT_TRUE(std::signbit(negative));
  EXPECT_EQ(FloatParser::Parse("1e400"), HUGE_VAL);
  EXPECT_EQ(FloatParser::Parse("1e-400"), 0.0);
}

TEST(FloatParser, AgreesWithStrtodBelowFifteenDigits) {
  // With at most 14 digits and no exponent both parts meet in one exact integer and a
  // single correctly rounded division by a power of ten.
  std::mt19937 random(7);
  for (int i = 0; i < 20000; ++i) {
    const int digits = 1 + static_cast<int>(random() % 14);
    std::string text;
    for (int d = 0; d < digits; ++d) text += static_cast<char>('0' + random() % 10);
    const int point = static_cast<int>(random() % (digits + 1));
    text.insert(static_cast<std::size_t>(point), ".");
    if (random() % 2) text.insert(0, "-");
    EXPECT_EQ(FloatParser::Parse(text), std::strtod(text.c_str(), nullptr)) << text;
  }
}

}  // namespace
