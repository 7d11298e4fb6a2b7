// The two records a session hands the host, filled from a checker's EngineVerdict, and their
// text forms as the sessions' trace lines show them.
#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

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

// The sessions' record line at level 700: PREFIX OPERATION ": protection level: " LEVEL " "
// TEXT.
void TraceRecordLine(uvo::ITracer* tracer, std::string_view prefix, std::string_view operation,
                     std::int32_t protectionLevel, const std::string& recordText);
// The vector a verdict judged, at `traceLevel`: PREFIX OPERATION ": features:" and " %.9g" per
// value. `vectorOf` answers false when there is no vector: then nothing is traced.
void TraceFeatureLine(uvo::ITracer* tracer, int traceLevel, std::string_view prefix,
                      std::string_view operation,
                      const std::function<bool(std::vector<float>&)>& vectorOf);

// The bodies of a session's GetVerdict and GetHeuristicVerdictInfo, for any checker with
// GetVerdict(EngineVerdict&) and LastFeatures(std::vector<float>&). Errors propagate to the
// session's dispatcher.
struct VerdictTrace {
  uvo::ITracer* tracer;
  std::string_view prefix;
  std::string_view operation;
  std::int32_t protectionLevel;
};

// A quiet verdict is not traced.
template <class Checker>
void AnswerVerdict(Checker& checker, const VerdictTrace& trace, Verdict& out) {
  ap::easy2::EngineVerdict engine;
  checker.GetVerdict(engine);
  FillVerdict(engine, out);
  if (!engine.quiet)
    TraceRecordLine(trace.tracer, trace.prefix, trace.operation, trace.protectionLevel,
                    TextOf(out));
}

// The record line always; the judged vector too at `featureTraceLevel` when one is given.
template <class Checker>
void AnswerHeuristicVerdictInfo(Checker& checker, const VerdictTrace& trace,
                                uvo::IAllocator* allocator, std::optional<int> featureTraceLevel,
                                HeuristicVerdictInfo& out) {
  ap::easy2::EngineVerdict engine;
  checker.GetVerdict(engine);
  FillHeuristicVerdictInfo(engine, trace.protectionLevel, allocator, out);
  TraceRecordLine(trace.tracer, trace.prefix, trace.operation, trace.protectionLevel, TextOf(out));
  if (featureTraceLevel) {
    TraceFeatureLine(trace.tracer, *featureTraceLevel, trace.prefix, trace.operation,
                     [&checker](std::vector<float>& v) { return checker.LastFeatures(v); });
  }
}

}  // namespace cf::services::anti_phishing::heuristic
