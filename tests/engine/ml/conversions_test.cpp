#include "engine/ml/conversions.h"

#include <gtest/gtest.h>

#include <cmath>
#include <stdexcept>
#include <string>
#include <vector>

#include "engine/common/error.h"
#include "tests/engine/ml/model_test_files.h"
#include "tests/support/error_of.h"

namespace ml {
namespace {

using pelmix::testing::MemoryEntry;

std::vector<float> Encode(const VectorRules& rules, const std::vector<float>& input) {
  std::vector<float> output(5, 42.0f);
  rules.calc(input, output);
  return output;
}

std::string RulesError(const std::string& text) {
  return pelmix::testing::ErrorOf<std::exception>([&] { VectorRules rules(MemoryEntry(text)); });
}

TEST(SqrtBoost, SharpensAroundOneHalf) {
  const flow::SqrtBoost boost;
  std::vector<float> output(7, 3.0f);
  boost.calc({0.25f, 0.5f, 0.81f, 1.0f}, output);
  EXPECT_EQ(output, (std::vector<float>{0.0625f, 0.25f, 0.9f, 1.0f}));
  boost.calc({0.6f, -2.0f, INFINITY}, output);
  EXPECT_EQ(output[0], static_cast<float>(std::sqrt(static_cast<double>(0.6f))));
  EXPECT_EQ(output[1], 4.0f);
  EXPECT_EQ(output[2], INFINITY);
  boost.calc({NAN}, output);
  EXPECT_TRUE(std::isnan(output[0]));
  boost.calc({}, output);
  EXPECT_TRUE(output.empty());
}

TEST(VectorRules, EncodesAgainstAscendingLevels) {
  const VectorRules rules(MemoryEntry("3 1 2 3"));
  EXPECT_EQ(rules.output_size(), 3u);
  EXPECT_EQ(Encode(rules, {0.5f}), (std::vector<float>{0.5f, 0, 0}));
  EXPECT_EQ(Encode(rules, {1.5f}), (std::vector<float>{0.5f, 0.5f, 0}));
  EXPECT_EQ(Encode(rules, {2.0f}), (std::vector<float>{0, 1, 0}));
  EXPECT_EQ(Encode(rules, {1.0f}), (std::vector<float>{1, 0, 0}));  // ties go low
  EXPECT_EQ(Encode(rules, {3.0f}), (std::vector<float>{0, 0, 1}));
  EXPECT_EQ(Encode(rules, {5.0f}), (std::vector<float>{0, 0, 1}));
  EXPECT_EQ(Encode(rules, {-1.0f}), (std::vector<float>{0, 0, 1}));
  EXPECT_EQ(Encode(rules, {0.0f}), (std::vector<float>{0, 0, 0}));
  EXPECT_EQ(Encode(rules, {NAN}), (std::vector<float>{0, 0, 1}));
  EXPECT_EQ(Encode(rules, {-INFINITY}), (std::vector<float>{0, 0, 1}));
}

TEST(VectorRules, ComputesInDoubleAndStoresFloat) {
  // 0.1f widened is 0.100000001490116..., so x / 0.3 in double is not the float quotient.
  const VectorRules rules(MemoryEntry("2 0.3 0.7"));
  const double x = 0.1f;
  EXPECT_EQ(Encode(rules, {0.1f}), (std::vector<float>{static_cast<float>(x / 0.3), 0}));
  const double y = 0.45f;
  const double low = (0.7 - y) / (0.7 - 0.3);
  EXPECT_EQ(Encode(rules, {0.45f}),
            (std::vector<float>{static_cast<float>(low), static_cast<float>(1.0 - low)}));
}

TEST(VectorRules, EmptyRulesDropTheirInput) {
  const VectorRules rules(MemoryEntry("1 0 2 10 20"));
  EXPECT_EQ(rules.rule_count(), 2u);
  EXPECT_EQ(rules.output_size(), 2u);
  EXPECT_EQ(Encode(rules, {123.0f, 15.0f}), (std::vector<float>{0.5f, 0.5f}));

  const VectorRules single(MemoryEntry("1 4\n1 0\t1 8"));
  EXPECT_EQ(Encode(single, {2.0f, 9.0f, 8.0f}), (std::vector<float>{0.5f, 1.0f}));
  EXPECT_EQ(Encode(single, {5.0f, 0.0f, -1.0f}), (std::vector<float>{1.0f, 1.0f}));
}

TEST(VectorRules, InputMustMatchTheRules) {
  const VectorRules rules(MemoryEntry("1 0 2 10 20"));
  for (const std::vector<float>& input : {std::vector<float>{1, 2, 3}, std::vector<float>{1}}) {
    try {
      Encode(rules, input);
      FAIL();
    } catch (const std::runtime_error& e) {
      EXPECT_STREQ(e.what(), "Input size for rules != rules size");
    }
  }
}

TEST(VectorRules, RefusesBadFiles) {
  // The file ends right after its last level; a line end there reads as a missing count.
  for (const char* text : {"3 1 2 3\n", "0 1", "x 1", ""}) {
    EXPECT_EQ(RulesError(text), "VectorRules: invalid size of rule") << text;
  }
  // A count promising more levels than the file holds.
  for (const char* text : {"3 1 2", "2 1 5 1", "4294967295 1 2"}) {
    EXPECT_EQ(RulesError(text), "VectorRules: missing level") << text;
  }
  // Levels the encoding would divide by zero with, or that never ascend.
  for (const char* text : {"2 0 1", "1 -1", "2 1 1", "3 1 3 2", "1 1e400", "2 -2 -1"}) {
    EXPECT_EQ(RulesError(text), "VectorRules: levels must be finite, above 0 and ascending")
        << text;
  }
  EXPECT_EQ(RulesError("2 1 2,5"), "FloatParser: wrong fraction symbol");
  EXPECT_EQ(RulesError("1 e"), "FloatParser: wrong first symbol");
}

TEST(VectorRules, ReadsTheSameWhateverTheReadSizes) {
  std::string text;
  for (int rule = 0; rule < 300; ++rule) {
    if (rule != 0) text += rule % 3 ? " " : "\n";
    if (rule % 7 == 0) {
      text += "1 0";
      continue;
    }
    text += "3 " + std::to_string(rule) + ".5 " + std::to_string(rule + 1) + " " +
            std::to_string(rule + 2) + "e0";
  }
  const VectorRules whole(MemoryEntry(text));
  std::vector<float> input(whole.rule_count());
  for (std::size_t i = 0; i < input.size(); ++i) input[i] = static_cast<float>(i) + 0.75f;
  const std::vector<float> expected = Encode(whole, input);
  EXPECT_EQ(expected.size(), whole.output_size());
  for (int piece : {1, 3, 4095, -100}) {
    const VectorRules pieces(MemoryEntry(text, piece));
    EXPECT_EQ(Encode(pieces, input), expected) << piece;
  }
}

TEST(NeuroConv, RunsItsNetworkAndSizesTheOutput) {
  const flow::NeuroConv conv(MemoryEntry("1 3 2 0 1 1 0 -1 -1"));
  std::vector<float> output(9, 1.0f);
  conv.calc({0, 0}, output);
  EXPECT_EQ(output, (std::vector<float>{0.5f, 0.5f}));
  EXPECT_THROW(conv.calc({0}, output), ap::Error);
  EXPECT_THROW(flow::NeuroConv(nullptr), ap::Error);
  EXPECT_THROW(VectorRules(nullptr), ap::Error);
}

}  // namespace
}  // namespace ml
