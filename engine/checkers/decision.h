// The last steps of every check, shared by the web and the mail checker: the decision step,
// which runs the channel's decision model over the feature vector and shapes the outcome
// into an EngineVerdict, and the loud draw, which decides at random whether a verdict is
// reported in detail. The draw reads the time through one clock that tests can replace.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "engine/checkers/engine_verdict.h"
#include "engine/kb/engine_config.h"
#include "engine/kb/web_checker_v3_data.h"

namespace easy3_impl {

// The system time as a Windows file time (100-ns units since 1601).
using FileTimeClock = std::uint64_t (*)();
// The platform's clock.
std::uint64_t SystemFileTime();

// Yields the target text and the feature vector of what a checker was fed.
using FeatureSource = std::function<void(std::string& target, std::vector<float>& vector)>;

struct DecisionInputs {
  const ap::ChannelConfig& channel;
  const WebCheckerV3Data::Solver* solver;  // null: no decision object
  std::uint32_t dbstamp;
  bool trusted;  // the page is on a white domain: nothing is judged
  const FeatureSource& features;
  const std::vector<float>* extra = nullptr;  // mail: appended to the vector
};

// Runs the decision step. A standard runtime error of the decision object (a missing one
// included: "solver unset") gives a quiet, non-phishing verdict that keeps the target text;
// other exceptions propagate.
ap::easy2::EngineVerdict Decide(const DecisionInputs& inputs);

// The seed of the loud draw: the file time's two halves summed modulo 2^32, XOR-ed with the
// seed value `n` unless it is 0.
std::uint32_t LoudSeed(std::uint64_t fileTime, std::uint32_t n);
// The draw itself: the first output of a Mersenne Twister seeded with `seed`, scaled into
// [0, 1) as a float (drawn again when rounding reaches 1).
float LoudDrawValue(std::uint32_t seed);
// True when the verdict is to stay quiet: never loud with `loud` off or a probability of 0,
// always loud from a probability of 1 (or NaN), otherwise loud with that probability.
bool LoudDrawSaysQuiet(const ap::ChannelConfig& channel, std::uint32_t n,
                       FileTimeClock clock = SystemFileTime);

}  // namespace easy3_impl
