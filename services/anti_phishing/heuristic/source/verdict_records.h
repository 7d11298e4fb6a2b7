// The two records a session hands the host, filled from a checker's EngineVerdict, and their
// text forms as the sessions' trace lines show them.
#pragma once

#include <cstdint>
#include <string>

#include "engine/checkers/engine_verdict.h"
#include "framework/uvo/anti_phishing.h"

namespace cf::services::anti_phishing::heuristic {

void FillVerdict(const ap::easy2::EngineVerdict& engine, Verdict& out);

// In order: quiet, confidence (an invalid level raises GetConfidence's error), dbstamp,
// target (a copy in memory from `allocator`; std::bad_alloc when refused), weight.
void FillHeuristicVerdictInfo(const ap::easy2::EngineVerdict& engine, std::int32_t protectionLevel,
                              uvo::IAllocator* allocator, HeuristicVerdictInfo& out);

// "Verdict { phishingDetected = 1, confirmedVerdict = 0 }"
std::string TextOf(const Verdict& verdict);
// Empty for a quiet record; otherwise
// "Heuristic {, confidence = 1, weight = 0.500000, target = T, dbstamp = 4294967295 }".
std::string TextOf(const HeuristicVerdictInfo& info);

}  // namespace cf::services::anti_phishing::heuristic
