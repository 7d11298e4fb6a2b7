// The decision step and the loud draw shared by the web and mail checkers.
#include "engine/checkers/decision.h"

#include <gtest/gtest.h>

#include <cmath>
#include <stdexcept>

namespace easy3_impl {
namespace {

using ap::easy2::EngineVerdict;

// Decides with fixed outputs and remembers the vector it was given.
class FakeSolver final : public WebCheckerV3Data::Solver {
 public:
  enum class Failure { kNone, kRuntime, kLogic };
  WebCheckerV3Data::Decision Solve(const std::vector<float>& features,
                                   const ap::ChannelConfig& thresholds) const override {
    seen = features;
    seenThreshold = thresholds.threshold;
    if (failure == Failure::kRuntime) throw std::runtime_error("model fault");
    if (failure == Failure::kLogic) throw std::logic_error("programming fault");
    return decision;
  }
  WebCheckerV3Data::Decision decision;
  Failure failure = Failure::kNone;
  mutable std::vector<float> seen;
  mutable float seenThreshold = -1;
};

struct Features {
  int asked = 0;
  FeatureSource source() {
    return [this](std::string& target, std::vector<float>& vector) {
      ++asked;
      target = "PayPal";
      vector = {0.25f, 0.5f};
    };
  }
};

TEST(DecisionStep, ShapesTheModelsDecision) {
  ap::ChannelConfig channel;
  channel.threshold = 0.3f;
  FakeSolver solver;
  solver.decision = {true, false, 0.875f, "1 .87"};
  Features features;
  const FeatureSource source = features.source();
  EngineVerdict v = Decide({channel, &solver, 77, false, source});
  EXPECT_TRUE(v.phishing);
  EXPECT_FALSE(v.quiet);
  EXPECT_EQ(v.weight, 0.875f);
  EXPECT_EQ(v.target, "PayPal|1 .87");
  EXPECT_EQ(v.stampWords, (std::array<std::uint32_t, 4>{0, 77, 0, 0}));
  EXPECT_EQ(solver.seenThreshold, 0.3f);  // the channel's block reaches the model
  EXPECT_EQ(solver.seen, (std::vector<float>{0.25f, 0.5f}));

  // outside_loud is what makes a verdict quiet; no annotation adds no '|'.
  solver.decision = {true, true, 0.99f, ""};
  v = Decide({channel, &solver, 77, false, source});
  EXPECT_TRUE(v.quiet);
  EXPECT_TRUE(v.phishing);
  EXPECT_EQ(v.target, "PayPal");
}

TEST(DecisionStep, MailAppendsItsExtraFeatures) {
  const ap::ChannelConfig channel;
  FakeSolver solver;
  Features features;
  const FeatureSource source = features.source();
  const std::vector<float> extra = {1.0f, 0.0f, 0.0f};
  Decide({channel, &solver, 0, false, source, &extra});
  EXPECT_EQ(solver.seen, (std::vector<float>{0.25f, 0.5f, 1.0f, 0.0f, 0.0f}));
}

TEST(DecisionStep, TrustedPagesAreNotJudged) {
  const ap::ChannelConfig channel;
  FakeSolver solver;
  solver.decision = {true, false, 1.0f, "1 1"};
  Features features;
  const FeatureSource source = features.source();
  const EngineVerdict v = Decide({channel, &solver, 5, true, source});
  EXPECT_TRUE(v.quiet);
  EXPECT_FALSE(v.phishing);
  EXPECT_EQ(v.weight, 0.0f);
  EXPECT_EQ(v.target, "");
  EXPECT_EQ(v.stampWords[1], 5u);
  EXPECT_EQ(features.asked, 0);
  EXPECT_TRUE(solver.seen.empty());
}

TEST(DecisionStep, ModelFaultsGiveAQuietCleanVerdict) {
  const ap::ChannelConfig channel;
  Features features;
  const FeatureSource source = features.source();
  // No decision object at all ("solver unset"), and a model that fails.
  EngineVerdict v = Decide({channel, nullptr, 3, false, source});
  EXPECT_TRUE(v.quiet);
  EXPECT_FALSE(v.phishing);
  EXPECT_EQ(v.weight, 0.0f);
  EXPECT_EQ(v.target, "PayPal");
  EXPECT_EQ(v.stampWords[1], 3u);

  FakeSolver solver;
  solver.failure = FakeSolver::Failure::kRuntime;
  v = Decide({channel, &solver, 3, false, source});
  EXPECT_TRUE(v.quiet);
  EXPECT_FALSE(v.phishing);
  EXPECT_EQ(v.target, "PayPal");
  // Anything else is not the model's verdict to hide.
  solver.failure = FakeSolver::Failure::kLogic;
  EXPECT_THROW(Decide({channel, &solver, 3, false, source}), std::logic_error);
}

std::uint64_t fixedTime = 0;
int clockReads = 0;
std::uint64_t FixedClock() {
  ++clockReads;
  return fixedTime;
}

TEST(LoudDraw, Seeds) {
  EXPECT_EQ(LoudSeed(0x0000000100000002ull, 0), 3u);
  EXPECT_EQ(LoudSeed(0xFFFFFFFF00000002ull, 0), 1u);  // the halves wrap round
  EXPECT_EQ(LoudSeed(0x0000000100000002ull, 0x10), 0x13u);
  EXPECT_EQ(LoudSeed(0x0000000000000005ull, 5), 0u);
}

TEST(LoudDraw, DrawsTheTwistersFirstOutput) {
  // 3499211612 is MT19937's first output for its reference seed 5489.
  EXPECT_EQ(LoudDrawValue(5489), static_cast<float>(3499211612.0 / 4294967296.0));
  for (std::uint32_t seed : {0u, 1u, 0xFFFFFFFFu, 20240611u}) {
    const float r = LoudDrawValue(seed);
    EXPECT_GE(r, 0.0f);
    EXPECT_LT(r, 1.0f);
  }
}

TEST(LoudDraw, ProbabilityEdges) {
  fixedTime = 5489;  // low half 5489, high half 0: seed 5489 when n is 0
  const float r = LoudDrawValue(5489);
  const auto channel = [](bool loud, float p) {
    ap::ChannelConfig c;
    c.loud = loud;
    c.loud_probability = p;
    return c;
  };
  clockReads = 0;
  EXPECT_TRUE(LoudDrawSaysQuiet(channel(false, 1.0f), 0, FixedClock));
  EXPECT_TRUE(LoudDrawSaysQuiet(channel(true, 0.0f), 0, FixedClock));
  EXPECT_FALSE(LoudDrawSaysQuiet(channel(true, 1.0f), 0, FixedClock));
  EXPECT_FALSE(LoudDrawSaysQuiet(channel(true, 7.0f), 0, FixedClock));
  EXPECT_FALSE(LoudDrawSaysQuiet(channel(true, NAN), 0, FixedClock));
  EXPECT_EQ(clockReads, 0);  // only a real draw reads the time

  EXPECT_FALSE(LoudDrawSaysQuiet(channel(true, r), 0, FixedClock));  // r not above p: loud
  EXPECT_TRUE(LoudDrawSaysQuiet(channel(true, std::nextafter(r, 0.0f)), 0, FixedClock));
  EXPECT_TRUE(LoudDrawSaysQuiet(channel(true, -0.5f), 0, FixedClock));
  EXPECT_EQ(clockReads, 3);

  // The byte count changes the seed.
  const float withN = LoudDrawValue(5489u ^ 1000u);
  EXPECT_FALSE(LoudDrawSaysQuiet(channel(true, withN), 1000, FixedClock));
  EXPECT_TRUE(LoudDrawSaysQuiet(channel(true, std::nextafter(withN, 0.0f)), 1000, FixedClock));
}

}  // namespace
}  // namespace easy3_impl
