#include "services/anti_phishing/heuristic/source/verdict_records.h"

#include <charconv>
#include <cstdio>

#include "internal/helpers/tracer/trace_writer.h"
#include "services/anti_phishing/heuristic/source/anti_phishing.h"

namespace cf::services::anti_phishing::heuristic {

namespace {
constexpr int kRecordTraceLevel = 700;
}  // namespace

void FillVerdict(const ap::easy2::EngineVerdict& engine, Verdict& out) {
  out.phishingDetected = engine.phishing;
  out.confirmedVerdict = false;
}

void FillHeuristicVerdictInfo(const ap::easy2::EngineVerdict& engine, std::int32_t protectionLevel,
                              uvo::IAllocator* allocator, HeuristicVerdictInfo& out) {
  out.quiet = engine.quiet;
  out.confidence = static_cast<std::uint8_t>(GetConfidence(protectionLevel));
  out.dbstamp = static_cast<std::int64_t>(engine.stamp());
  out.target.Assign(allocator, engine.target);
  out.weight = static_cast<double>(engine.weight);
}

// The text forms are composed by hand rather than through Boost.Format, whose parsing fills
// the locale's narrow cache without a lock: sessions trace on many threads at once. The
// weight is "%.6f" in the C locale whatever locale the host runs in.
std::string TextOf(const Verdict& verdict) {
  std::string text = "Verdict { phishingDetected = ";
  text += verdict.phishingDetected ? '1' : '0';
  text += ", confirmedVerdict = ";
  text += verdict.confirmedVerdict ? '1' : '0';
  text += " }";
  return text;
}

std::string TextOf(const HeuristicVerdictInfo& info) {
  if (info.quiet) return {};
  std::string text = "Heuristic {, confidence = ";
  text += std::to_string(static_cast<unsigned>(info.confidence));
  text += ", weight = ";
  char weight[400];  // "%.6f" of the largest double needs 316 characters
  const auto [end, error] =
      std::to_chars(weight, weight + sizeof weight, info.weight, std::chars_format::fixed, 6);
  text.append(weight, error == std::errc() ? end : weight);
  text += ", target = ";
  text += info.target.view();
  text += ", dbstamp = ";
  text += std::to_string(info.dbstamp);
  text += " }";
  return text;
}

void TraceRecordLine(uvo::ITracer* tracer, std::string_view prefix, std::string_view operation,
                     std::int32_t protectionLevel, const std::string& recordText) {
  helpers::TraceWriter line(tracer, kRecordTraceLevel);
  if (!line.Accepted()) return;
  line.Append(prefix)
      .Append(operation)
      .Append(": protection level: ")
      .Append(std::to_string(protectionLevel))
      .Append(" ")
      .Append(recordText);
  line.Commit();
}

void TraceFeatureLine(uvo::ITracer* tracer, int traceLevel, std::string_view prefix,
                      std::string_view operation,
                      const std::function<bool(std::vector<float>&)>& vectorOf) {
  std::vector<float> vector;
  if (!vectorOf(vector)) return;
  helpers::TraceWriter line(tracer, traceLevel);
  if (!line.Accepted()) return;
  line.Append(prefix).Append(operation).Append(": features:");
  char number[32];
  for (const float value : vector) {
    const int n = std::snprintf(number, sizeof number, " %.9g", static_cast<double>(value));
    line.Append(std::string_view(number, static_cast<std::size_t>(n)));
  }
  line.Commit();
}

}  // namespace cf::services::anti_phishing::heuristic
