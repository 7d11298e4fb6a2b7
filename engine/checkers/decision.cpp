#include "engine/checkers/decision.h"

#include <cmath>
#include <random>
#include <stdexcept>

#include "platform/system_time.h"

namespace easy3_impl {

std::uint64_t SystemFileTime() { return platform::GetSystemTimeAsFileTime(); }

ap::easy2::EngineVerdict Decide(const DecisionInputs& inputs) {
  ap::easy2::EngineVerdict verdict;
  verdict.stampWords = {0, inputs.dbstamp, 0, 0};
  if (inputs.trusted) return verdict;

  std::vector<float> vector;
  inputs.features(verdict.target, vector);
  if (inputs.extra != nullptr)
    vector.insert(vector.end(), inputs.extra->begin(), inputs.extra->end());
  try {
    if (inputs.solver == nullptr) throw std::runtime_error("solver unset");
    const WebCheckerV3Data::Decision decision = inputs.solver->Solve(vector, inputs.channel);
    verdict.phishing = decision.detected;
    verdict.quiet = decision.outside_loud;
    verdict.weight = decision.weight;
    if (!decision.annotation.empty()) verdict.target += "|" + decision.annotation;
  } catch (const std::runtime_error&) {
    // A broken decision must not fail the host's session: the verdict stays quiet and clean.
    verdict.quiet = true;
    verdict.phishing = false;
    verdict.weight = 0.0f;
  }
  return verdict;
}

std::uint32_t LoudSeed(std::uint64_t fileTime, std::uint32_t n) {
  const auto low = static_cast<std::uint32_t>(fileTime);
  const auto high = static_cast<std::uint32_t>(fileTime >> 32);
  std::uint32_t seed = low + high;
  if (n != 0) seed ^= n;
  return seed;
}

float LoudDrawValue(std::uint32_t seed) {
  std::mt19937 twister(seed);
  for (;;) {
    const float r = static_cast<float>(twister()) * 0x1p-32f;
    if (r < 1.0f) return r;
  }
}

bool LoudDrawSaysQuiet(const ap::ChannelConfig& channel, std::uint32_t n, FileTimeClock clock) {
  if (!channel.loud) return true;
  if (channel.loud_probability == 0.0f) return true;
  if (!(channel.loud_probability < 1.0f)) return false;
  const float r = LoudDrawValue(LoudSeed(clock(), n));
  return r > channel.loud_probability;
}

}  // namespace easy3_impl
