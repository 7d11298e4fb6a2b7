#include "engine/ml/simple_perceptron.h"

#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <vector>

#include "engine/common/error.h"
#include "tests/engine/ml/model_test_files.h"
#include "tests/support/error_of.h"

namespace ml {
namespace {

using pelmix::testing::MemoryEntry;

SimplePerceptron LoadNetwork(const std::string& text, int piece = 0) {
  SimplePerceptron network({1, 1});
  TokenReader reader(MemoryEntry(text, piece));
  network.Load(reader);
  return network;
}

std::string LoadError(const std::string& text) {
  return pelmix::testing::ErrorOf([&] { LoadNetwork(text); });
}

std::vector<float> Forward(const SimplePerceptron& network, const std::vector<float>& input) {
  std::vector<float> output{42.0f};
  network.calc(input, output);
  return output;
}

std::vector<std::string> Tokens(const std::string& text, int piece = 0) {
  TokenReader reader(MemoryEntry(text, piece));
  std::vector<std::string> tokens;
  std::uint32_t number = 0;
  while (reader.ReadUnsigned(number)) tokens.push_back(std::to_string(number));
  return tokens;
}

TEST(TokenReader, OnlySpacesSeparateAndRunsCountOnce) {
  EXPECT_EQ(Tokens("1 22   333 4"), (std::vector<std::string>{"1", "22", "333", "4"}));
  // Tabs and line ends belong to tokens; an integer is its leading digits.
  EXPECT_EQ(Tokens("5\t6 7\n8 x9 12ab"), (std::vector<std::string>{"5", "7", "0", "12"}));
  // Trailing spaces leave no token behind; a leading space makes an empty first token.
  EXPECT_EQ(Tokens("3 4   "), (std::vector<std::string>{"3", "4"}));
  EXPECT_EQ(Tokens(" 3"), (std::vector<std::string>{"0", "3"}));
  EXPECT_EQ(Tokens("99999999999 4294967295"),
            (std::vector<std::string>{"4294967295", "4294967295"}));
  EXPECT_TRUE(Tokens("").empty());
}

TEST(TokenReader, LeavesTheTargetAloneAtTheEnd) {
  TokenReader reader(MemoryEntry("1.5"));
  float value = 0;
  ASSERT_TRUE(reader.ReadFloat(value));
  EXPECT_EQ(value, 1.5f);
  value = -3;
  EXPECT_FALSE(reader.ReadFloat(value));
  EXPECT_EQ(value, -3.0f);
}

TEST(TokenReader, SpacesAcrossABufferRefillDoNotMakeAnEmptyToken) {
  // A run of 20 spaces straddling byte 1024, then more tokens.
  std::string text(1010, '1');
  text += std::string(20, ' ') + "2 3";
  EXPECT_EQ(Tokens(text).size(), 3u);
  EXPECT_EQ(Tokens(text).back(), "3");
  // The same with the run starting exactly at the boundary and ending at it.
  for (std::size_t lead : {1023u, 1022u, 1000u}) {
    std::string t(lead, '7');
    t += std::string(30, ' ') + "5 6";
    EXPECT_EQ(Tokens(t), (std::vector<std::string>{"4294967295", "5", "6"})) << lead;
  }
}

TEST(TokenReader, RefusesATokenLongerThanItsBuffer) {
  std::string fits(TokenReader::kBufferSize - 1, '1');
  EXPECT_EQ(Tokens(fits + " 2").size(), 2u);
  try {
    Tokens(std::string(TokenReader::kBufferSize, '1') + " 2");
    FAIL();
  } catch (const ap::Error& e) {
    EXPECT_STREQ(e.what(), "TokenReader: token longer than 1024 bytes");
  }
}

TEST(SimplePerceptron, OneUnitNetwork) {
  const SimplePerceptron network = LoadNetwork("1 3 1 0 1 1");
  ASSERT_EQ(network.layers().size(), 1u);
  EXPECT_EQ(network.layers()[0].stride, 3u);
  EXPECT_EQ(Forward(network, {0, 0}), std::vector<float>{0.5f});
  try {
    Forward(network, {0, 0, 0});
    FAIL();
  } catch (const ap::Error& e) {
    EXPECT_STREQ(e.what(),
                 "SimplePerceptron::calc input size different from upper layer neuron input "
                 "size: 3 != 2");
  }
}

TEST(SimplePerceptron, LevelsConstructor) {
  EXPECT_THROW(SimplePerceptron({3}), std::runtime_error);
  const SimplePerceptron network({2, 3, 1});
  ASSERT_EQ(network.layers().size(), 2u);
  EXPECT_EQ(network.layers()[1].stride, 4u);
  EXPECT_EQ(network.weights().size(), 3u * 3 + 1 * 4);
  EXPECT_EQ(Forward(network, {5, 6}), std::vector<float>{0.5f});  // zero weights
}

TEST(SimplePerceptron, Depth) {
  EXPECT_EQ(LoadError("0 3 1 0 0 0"), "invalid neural network depth0");
  EXPECT_EQ(LoadError("21 2"), "invalid neural network depth21");
  std::string twenty = "20 2";
  for (int i = 0; i < 20; ++i) twenty += " 1";
  for (int i = 0; i < 40; ++i) twenty += " 0";
  const SimplePerceptron network = LoadNetwork(twenty);
  EXPECT_EQ(network.layers().size(), 20u);
  EXPECT_EQ(Forward(network, {1}).size(), 1u);
}

TEST(SimplePerceptron, TwoLayersExactly) {
  // Layer 1: two units over two inputs; layer 2: one unit over them.
  const SimplePerceptron network = LoadNetwork("2 3 2 1 0.5 -1 2 0 1 1 -2 3 -1");
  const auto sigmoid = [](float s) {
    return static_cast<float>(1.0 / (1.0 + std::exp(-static_cast<double>(s))));
  };
  const float x0 = 0.25f, x1 = 1.5f;
  float s0 = 0.5f;
  s0 += x0 * -1.0f;
  s0 += x1 * 2.0f;
  float s1 = 0.0f;
  s1 += x0 * 1.0f;
  s1 += x1 * 1.0f;
  float out = -2.0f;
  out += sigmoid(s0) * 3.0f;
  out += sigmoid(s1) * -1.0f;
  EXPECT_EQ(Forward(network, {x0, x1}), std::vector<float>{sigmoid(out)});
}

TEST(SimplePerceptron, EveryUnitMatchesItselfAlone) {
  // Seven units over nine inputs: units are evaluated in groups, with a remainder.
  std::vector<std::string> units;
  for (int j = 0; j < 7; ++j) {
    std::string unit;
    for (int k = 0; k < 10; ++k) {
      unit += " " + std::to_string((j * 7 + k * 3) % 11 - 5) + "." + std::to_string(k + j);
    }
    units.push_back(unit);
  }
  std::string text = "1 10 7";
  for (const auto& unit : units) text += unit;
  const std::vector<float> x{0.5f, -1.25f, 2, 0.125f, 3, -0.75f, 1, 0.3f, -2};
  const std::vector<float> all = Forward(LoadNetwork(text), x);
  ASSERT_EQ(all.size(), 7u);
  for (int j = 0; j < 7; ++j) {
    EXPECT_EQ(Forward(LoadNetwork("1 10 1" + units[j]), x), std::vector<float>{all[j]}) << j;
  }
}

TEST(SimplePerceptron, SumsStayInSinglePrecision) {
  // 1000 terms of 1e-8 each vanish one by one against a bias of 1 in single precision; a
  // double accumulator would reach 1.00001, whose sigmoid differs in the float result.
  std::string text = "1 1001 1 1";
  for (int i = 0; i < 1000; ++i) text += " 1";
  const SimplePerceptron network = LoadNetwork(text);
  const std::vector<float> output = Forward(network, std::vector<float>(1000, 1e-8f));
  const float single = static_cast<float>(1.0 / (1.0 + std::exp(-1.0)));
  const float wide = static_cast<float>(1.0 / (1.0 + std::exp(-1.00001)));
  ASSERT_NE(single, wide);
  EXPECT_EQ(output, std::vector<float>{single});
}

TEST(SimplePerceptron, SaturatesWithinZeroAndOne) {
  const SimplePerceptron network = LoadNetwork("1 2 2 -1000 0 1000 0");
  EXPECT_EQ(Forward(network, {0}), (std::vector<float>{0.0f, 1.0f}));
  const SimplePerceptron scaled = LoadNetwork("1 2 1 0 1");
  EXPECT_EQ(Forward(scaled, {-INFINITY}), std::vector<float>{0.0f});
  EXPECT_EQ(Forward(scaled, {INFINITY}), std::vector<float>{1.0f});
  EXPECT_TRUE(std::isnan(Forward(scaled, {NAN})[0]));
  // A weight beyond float range loads as infinity and saturates the same way.
  EXPECT_EQ(Forward(LoadNetwork("1 2 1 0 1e400"), {1}), std::vector<float>{1.0f});
}

TEST(SimplePerceptron, LayerWithoutUnitsLeavesBiasOnlyUnits) {
  const SimplePerceptron network = LoadNetwork("2 3 0 2 0 20");
  EXPECT_EQ(network.layers()[1].stride, 1u);
  EXPECT_EQ(Forward(network, {7, 8}), (std::vector<float>{0.5f, 1.0f}));
  EXPECT_TRUE(Forward(LoadNetwork("1 2 0"), {1}).empty());
}

TEST(SimplePerceptron, ReadsTheSameWhateverTheReadSizes) {
  std::string text = "2 11 7 3";
  for (int i = 0; i < 7 * 11 + 3 * 8; ++i)
    text += "  " + std::to_string(i % 13) + ".0" + std::to_string(i);
  const SimplePerceptron whole = LoadNetwork(text);
  for (int piece : {1, 2, 7, 1023, -50}) {
    EXPECT_EQ(LoadNetwork(text, piece).weights(), whole.weights()) << piece;
  }
  std::string single = text;
  for (std::size_t at; (at = single.find("  ")) != std::string::npos;) single.erase(at, 1);
  EXPECT_EQ(LoadNetwork(single).weights(), whole.weights());
}

TEST(SimplePerceptron, RefusesFilesCutShortOrOversized) {
  for (const char* header : {"", "1", "1 3", "2 3 1"}) {
    EXPECT_EQ(LoadError(header), "neural network file ends inside its header") << header;
  }
  EXPECT_EQ(LoadError("1 3 1 0.000 1.000"), "neural network file ends after 2 of 3 weights");
  EXPECT_EQ(LoadError("1 3 1 0 1"), "neural network file too short for 3 weights");
  // 20 layers of 10000 units: refused before anything is allocated.
  std::string huge = "20 10001";
  for (int i = 0; i < 20; ++i) huge += " 10000";
  EXPECT_EQ(LoadError(huge), "neural network too large: more than 16777216 weights");
  EXPECT_EQ(LoadError("2 101 100 100 1 2 3"), "neural network file too short for 20200 weights");
  // Sizes near 2^32 neither wrap to small ones nor overflow the sum.
  std::string wide = "20 4294967295";
  for (int i = 0; i < 20; ++i) wide += " 4294967295";
  EXPECT_EQ(LoadError(wide), "neural network too large: more than 16777216 weights");
  EXPECT_EQ(LoadError("2 1 4294967295 5"), "neural network too large: more than 16777216 weights");
}

TEST(SimplePerceptron, FirstStrideZeroNeverRuns) {
  // S = 0 declares -1 inputs; wrapped strides then declare no weights at all.
  const SimplePerceptron network = LoadNetwork("2 0 4294967295 5");
  EXPECT_TRUE(network.weights().empty());
  try {
    Forward(network, {});
    FAIL();
  } catch (const ap::Error& e) {
    EXPECT_STREQ(e.what(),
                 "SimplePerceptron::calc input size different from upper layer neuron input "
                 "size: 0 != 4294967295");
  }
}

TEST(SimplePerceptron, KeepsItsNetworkWhenALoadFails) {
  SimplePerceptron network = LoadNetwork("1 2 1 0 1");
  TokenReader reader(MemoryEntry("1 3 1 0"));
  EXPECT_THROW(network.Load(reader), ap::Error);
  EXPECT_EQ(network.weights(), (std::vector<float>{0.0f, 1.0f}));
}

TEST(SimplePerceptron, WeightTokensGoThroughTheFloatReader) {
  EXPECT_EQ(LoadNetwork("1 2 1 .5 -2e1").weights(), (std::vector<float>{0.5f, -20.0f}));
  EXPECT_EQ(LoadError("1 2 1 0 1\n"), "FloatParser: wrong fraction symbol");  // line end
  EXPECT_EQ(LoadError("1 2 1 0 abc"), "FloatParser: wrong first symbol");
}

}  // namespace
}  // namespace ml
