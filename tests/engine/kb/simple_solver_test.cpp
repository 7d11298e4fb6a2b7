#include "engine/kb/simple_solver.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <string>
#include <vector>

#include "engine/common/error.h"
#include "engine/ml/deep_solver.h"
#include "tests/engine/ml/model_test_files.h"

namespace loaders_misc {
namespace {

using Decision = WebCheckerV3Data::Decision;
using pelmix::testing::PieceFileSystem;

// A model that answers with fixed outputs, whatever the features.
class FixedModel final : public WebCheckerV3Data::AbstractNetI {
 public:
  explicit FixedModel(std::vector<float> outputs) : outputs_(std::move(outputs)) {}
  void calc(const std::vector<float>&, std::vector<float>& output) const override {
    output = outputs_;
  }

 private:
  std::vector<float> outputs_;
};

Decision Decide(std::vector<float> outputs, float threshold, float threshold_loud) {
  const SimpleSolver solver(std::make_unique<FixedModel>(std::move(outputs)));
  ap::ChannelConfig thresholds;
  thresholds.threshold = threshold;
  thresholds.threshold_loud = threshold_loud;
  return solver.Solve({}, thresholds);
}

float DefaultThreshold() {
  const std::uint32_t bits = 0x3C23D70A;
  float value;
  std::memcpy(&value, &bits, sizeof value);
  return value;
}

TEST(SimpleSolver, DetectionWithinTheRadius) {
  Decision d = Decide({0.999f, 0.999f}, 0.01f, 0.0f);
  EXPECT_TRUE(d.detected);
  EXPECT_TRUE(d.outside_loud);
  EXPECT_EQ(d.weight, 0.999f);
  EXPECT_EQ(d.annotation, "1 1");

  d = Decide({0.999f, 0.999f}, 0.01f, 0.01f);
  EXPECT_TRUE(d.detected);
  EXPECT_FALSE(d.outside_loud);

  d = Decide({0.9f, 0.9f}, DefaultThreshold(), 0.0f);
  EXPECT_FALSE(d.detected);
  EXPECT_FALSE(d.outside_loud);
  EXPECT_EQ(d.weight, 0.9f);
  EXPECT_EQ(d.annotation, ".89 .89");  // 0.9f is just below 0.9

  d = Decide({0.1f, 0.0f}, 0.2f, 0.0f);
  EXPECT_FALSE(d.detected);
  EXPECT_FALSE(d.outside_loud);
  EXPECT_EQ(d.weight, 0.1f);

  d = Decide({0.5f, 1.0f}, 10.0f, 0.0f);
  EXPECT_FALSE(d.detected);  // exactly one half is not phishing
  EXPECT_EQ(d.weight, 0.5f);

  d = Decide({1.0f, 1.0f}, 0.0f, 0.0f);
  EXPECT_TRUE(d.detected);  // at the corner itself, radius 0 still holds
  EXPECT_FALSE(d.outside_loud);
}

TEST(SimpleSolver, FewerThanTwoOutputsDecideNothing) {
  for (const std::vector<float>& outputs : {std::vector<float>{0.99f}, std::vector<float>{}}) {
    const Decision d = Decide(outputs, 1.0f, 0.0f);
    EXPECT_FALSE(d.detected);
    EXPECT_FALSE(d.outside_loud);
    EXPECT_EQ(d.weight, 0.0f);
    EXPECT_EQ(d.annotation, "");
  }
}

TEST(SimpleSolver, AnnotatesEveryOutput) {
  const Decision d = Decide({1.0f, 0.0004f, 0.005f, 0.25f}, 0.01f, 0.0f);
  EXPECT_EQ(d.annotation, "1 0 .0 .25");
  EXPECT_FALSE(d.detected);  // (1, 0.0004) is far from (1, 1)
  EXPECT_EQ(d.weight, 1.0f);
}

TEST(SimpleSolver, RendersOutputs) {
  const struct {
    float value;
    const char* text;
  } cases[] = {
      {0.5f, ".5"},   {0.75f, ".75"}, {0.05f, ".05"},  {0.987f, ".98"},  {0.57f, ".56"},
      {0.99f, "1"},   {1.5f, "1"},    {0.989f, ".98"}, {0.01f, ".0"},    {0.0099f, ".0"},
      {0.001f, ".0"}, {0.0009f, "0"}, {0.0f, "0"},     {-3.0f, "0"},     {0.1f, ".1"},
      {0.104f, ".1"}, {0.2f, ".2"},   {INFINITY, "1"}, {-INFINITY, "0"}, {NAN, "nan"},
  };
  for (const auto& c : cases) EXPECT_EQ(RenderOutput(c.value), c.text) << c.value;
}

TEST(SimpleSolver, NaNOutputsAreNotADetection) {
  const Decision d = Decide({NAN, NAN}, 1.0f, 0.0f);
  EXPECT_FALSE(d.detected);
  EXPECT_FALSE(d.outside_loud);
  EXPECT_EQ(d.annotation, "nan nan");
}

const char kFlow[] =
    R"({"convs":{"s":{"type":"sqrtboost"}},"flow":[{"name":"a","input":[[0,2]],"conv":"s"}]})";

TEST(SimpleSolver, LoadsItsModelFromAnEntry) {
  auto files =
      std::make_shared<PieceFileSystem>(std::map<std::string, std::string>{{"web.flow", kFlow}}, 3);
  const SimpleSolver solver("web.flow", files);
  const ap::ChannelConfig thresholds;  // 0.01 and 0
  const Decision d = solver.Solve({0.9999f, 0.99999f}, thresholds);
  EXPECT_TRUE(d.detected);
  EXPECT_TRUE(d.outside_loud);
  EXPECT_EQ(d.annotation, "1 1");
  EXPECT_FALSE(solver.Solve({0.2f, 0.3f}, thresholds).detected);
  // A model fault reaches the caller.
  EXPECT_THROW(solver.Solve({0.5f}, thresholds), std::runtime_error);
}

TEST(SimpleSolver, RefusesMissingBrokenAndOversizedEntries) {
  const auto failure = [](std::map<std::string, std::string> files) -> std::string {
    try {
      SimpleSolver("mail.flow", std::make_shared<PieceFileSystem>(std::move(files)));
    } catch (const std::exception& e) {
      return e.what();
    }
    return "(built)";
  };
  EXPECT_EQ(failure({{"web.flow", kFlow}}), "Absent flow file mail.flow");
  EXPECT_EQ(failure({{"mail.flow", "{}"}}),
            "Deep solver config error: Exact 2 elements expected in hash");
  EXPECT_EQ(failure({{"mail.flow", std::string(kMaxFlowFileSize + 1, '[')}}),
            "Flow file mail.flow is larger than 1048576 bytes");
  EXPECT_THROW(SimpleSolver("web.flow", nullptr), ap::Error);
}

TEST(SimpleSolver, RefusesAModelReadingPastItsChannelsVector) {
  const std::string flow =
      R"({"convs":{"s":{"type":"sqrtboost"}},"flow":[{"name":"a","input":[[0,2]],"conv":"s"},)"
      R"({"name":"7","input":["a",[200,215]],"conv":"s"}]})";
  auto files = std::make_shared<PieceFileSystem>(
      std::map<std::string, std::string>{{"web.flow", flow}, {"fits.flow", kFlow}});
  // The message is the one every decision would otherwise fail with, naming the flow.
  try {
    SimpleSolver("web.flow", files, 214);
    ADD_FAILURE() << "a flow reading features up to 215 loaded for a vector of 214";
  } catch (const std::runtime_error& e) {
    EXPECT_STREQ(e.what(), "Deep solver flow 7 reads features [200, 215) of an input of 214");
  }
  EXPECT_NO_THROW(SimpleSolver("web.flow", files, 215));
  EXPECT_NO_THROW(SimpleSolver("web.flow", files));  // no channel: no check
  EXPECT_THROW(SimpleSolver("fits.flow", files, 1), std::runtime_error);
  EXPECT_NO_THROW(SimpleSolver("fits.flow", files, 2));
}

}  // namespace
}  // namespace loaders_misc
