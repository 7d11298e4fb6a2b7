#include "tools/pelmix/page_scan.h"

#include <sstream>

#include "host/tracer.h"
#include "tools/pelmix/chunked_input.h"
#include "tools/pelmix/module_host.h"

namespace pelmix::cli {
namespace {

using namespace cf::services::anti_phishing;

constexpr int kFailureLevel = 300;
constexpr int kVerdictLevel = 700;
constexpr char kFeaturesMark[] = ": features:";

// "0x8000004B (Unspecified error)" and, when the module said why, its failure line.
std::string Failure(const std::string& what, uvo::result_t code,
                    const std::vector<host::TraceLine>& lines) {
  std::string text = what + ": " + DescribeResult(code);
  for (auto it = lines.rbegin(); it != lines.rend(); ++it) {
    if (it->level == kFailureLevel) {
      // Drop the module's line prefix; keep "place: reason".
      const std::size_t tab = it->text.find('\t');
      text += ": " + (tab == std::string::npos ? it->text : it->text.substr(tab + 1));
      break;
    }
  }
  return text;
}

std::optional<std::vector<std::string>> FeaturesOf(const std::vector<host::TraceLine>& lines) {
  for (const host::TraceLine& line : lines) {
    const std::size_t mark = line.text.find(kFeaturesMark);
    if (line.level != kVerdictLevel || mark == std::string::npos) continue;
    std::istringstream numbers(line.text.substr(mark + sizeof kFeaturesMark - 1));
    std::vector<std::string> values;
    for (std::string value; numbers >> value;) values.push_back(std::move(value));
    return values;
  }
  return std::nullopt;
}

}  // namespace

PageResult ScanPage(IHttpSessionFactory& sessions, const PageInput& input,
                    const PageScanOptions& options) {
  PageResult result;
  if (!input.error.empty()) {
    result.error = input.error;
    return result;
  }
  host::Tracer::ThreadCapture capture(options.features ? kVerdictLevel : kFailureLevel);

  const SessionSettings settings{options.level};
  const SessionParam asked[] = {{kTraceFeaturesParameter, "1"}};
  const SessionParamList params{asked, asked + (options.features ? 1 : 0)};
  uvo::Ptr<IHttpSession> session;
  uvo::result_t code =
      sessions.CreateSession(&settings, input.url.c_str(), &params, session.Receive());
  if (code < 0) {
    result.error = Failure("no session", code, capture.Take());
    return result;
  }

  uvo::result_t appendFailure = 0;
  std::string readError;
  const bool read = ReadChunks(
      {options.chunk, input.path},
      [&](std::string_view chunk) {
        if (appendFailure < 0) return;
        const uvo::result_t appended =
            session->AppendHtml({chunk.data(), chunk.data() + chunk.size()});
        if (appended < 0) appendFailure = appended;
      },
      &readError);
  if (!read) {
    result.error = readError;
    return result;
  }
  if (appendFailure < 0) {
    result.error = Failure("AppendHtml", appendFailure, capture.Take());
    return result;
  }

  Verdict verdict{};
  HeuristicVerdictInfo info{};
  if ((code = session->GetVerdict(&verdict)) < 0) {
    result.error = Failure("GetVerdict", code, capture.Take());
    return result;
  }
  if ((code = session->GetHeuristicVerdictInfo(&info)) < 0) {
    result.error = Failure("GetHeuristicVerdictInfo", code, capture.Take());
    return result;
  }
  result.phishing = verdict.phishingDetected;
  result.quiet = info.quiet;
  result.weight = info.weight;
  result.target = std::string(info.target.view());
  result.confidence = info.confidence;
  result.dbstamp = info.dbstamp;
  if (options.features) result.features = FeaturesOf(capture.Take());
  return result;
}

}  // namespace pelmix::cli
