#include "services/anti_phishing/heuristic/source/verdict_records.h"

#include <boost/format.hpp>

#include "services/anti_phishing/heuristic/source/anti_phishing.h"

namespace cf::services::anti_phishing::heuristic {

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

std::string TextOf(const Verdict& verdict) {
  return (boost::format("Verdict { phishingDetected = %d, confirmedVerdict = %d }") %
          static_cast<int>(verdict.phishingDetected) % static_cast<int>(verdict.confirmedVerdict))
      .str();
}

std::string TextOf(const HeuristicVerdictInfo& info) {
  if (info.quiet) return {};
  std::string text = "Heuristic {, confidence = ";
  text += std::to_string(static_cast<unsigned>(info.confidence));
  text += ", weight = ";
  text += (boost::format("%.6f") % info.weight).str();
  text += ", target = ";
  text += info.target.view();
  text += ", dbstamp = ";
  text += std::to_string(info.dbstamp);
  text += " }";
  return text;
}

}  // namespace cf::services::anti_phishing::heuristic
