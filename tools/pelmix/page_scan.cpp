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

PageJudgement::PageJudgement(IHttpSessionFactory& sessions, const std::string& url,
                             const PageScanOptions& options)
    : capture_(options.features ? kVerdictLevel : kFailureLevel), features_(options.features) {
  const SessionSettings settings{options.level};
  const SessionParam asked[] = {{kTraceFeaturesParameter, "1"}};
  const SessionParamList params{asked, asked + (options.features ? 1 : 0)};
  const uvo::result_t code =
      sessions.CreateSession(&settings, url.c_str(), &params, session_.Receive());
  if (code < 0) {
    error_ = Failure("no session", code, capture_.Take());
    session_ = nullptr;
  }
}

bool PageJudgement::Append(std::string_view chunk) {
  if (!error_.empty()) return false;
  const uvo::result_t appended = session_->AppendHtml({chunk.data(), chunk.data() + chunk.size()});
  if (appended < 0) {
    error_ = Failure("AppendHtml", appended, capture_.Take());
    return false;
  }
  return true;
}

PageResult PageJudgement::Finish() {
  PageResult result;
  if (!error_.empty()) {
    result.error = error_;
    return result;
  }
  Verdict verdict{};
  HeuristicVerdictInfo info{};
  uvo::result_t code;
  if ((code = session_->GetVerdict(&verdict)) < 0) {
    result.error = Failure("GetVerdict", code, capture_.Take());
    return result;
  }
  if ((code = session_->GetHeuristicVerdictInfo(&info)) < 0) {
    result.error = Failure("GetHeuristicVerdictInfo", code, capture_.Take());
    return result;
  }
  result.phishing = verdict.phishingDetected;
  result.quiet = info.quiet;
  result.weight = info.weight;
  result.target = std::string(info.target.view());
  result.confidence = info.confidence;
  result.dbstamp = info.dbstamp;
  if (features_) result.features = FeaturesOf(capture_.Take());
  return result;
}

PageResult ScanPage(IHttpSessionFactory& sessions, const PageInput& input,
                    const PageScanOptions& options) {
  if (!input.error.empty()) {
    PageResult result;
    result.error = input.error;
    return result;
  }
  PageJudgement judgement(sessions, input.url, options);
  if (judgement.Failed()) return judgement.Finish();
  std::string readError;
  const bool read = ReadChunks(
      {options.chunk, input.path}, [&](std::string_view chunk) { judgement.Append(chunk); },
      &readError);
  if (!read) {
    PageResult result;
    result.error = readError;
    return result;
  }
  return judgement.Finish();
}

}  // namespace pelmix::cli
