// What every checker answers: the verdict the sessions turn into the host's records.
#pragma once

#include <array>
#include <cstdint>
#include <string>

namespace ap::easy2 {

struct EngineVerdict {
  // Not to be reported in detail: sessions neither trace it nor fill their heuristic block.
  bool quiet = true;
  bool phishing = false;
  float weight = 0.0f;  // the decision model's first output
  // The feature extractor's target text, then annotations each introduced by '|'.
  std::string target;
  // Word 1 holds the knowledge base's dbstamp, the others 0; words 1 and 2 read together
  // (low word first) give the 64-bit stamp.
  std::array<std::uint32_t, 4> stampWords{};

  std::uint64_t stamp() const {
    return std::uint64_t{stampWords[1]} | (std::uint64_t{stampWords[2]} << 32);
  }
};

}  // namespace ap::easy2
