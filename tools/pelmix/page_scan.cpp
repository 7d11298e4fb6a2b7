#include "tools/pelmix/page_scan.h"

#include "host/tracer.h"
#include "tools/pelmix/chunked_input.h"
#include "tools/pelmix/module_host.h"

namespace pelmix::cli {
namespace {

using namespace cf::services::anti_phishing;

constexpr int kFailureLevel = 300;
constexpr int kVerdictLevel = 700;

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

Judgement PageJudgement::Finish() {
  Judgement result;
  if (!error_.empty()) {
    result.error = error_;
    return result;
  }
  if (!AskRecords(*session_.Get(), capture_, result)) return result;
  if (features_) result.features = FeaturesOf(capture_.Take(), kVerdictLevel);
  return result;
}

Judgement ScanPage(IHttpSessionFactory& sessions, const PageInput& input,
                   const PageScanOptions& options) {
  if (!input.error.empty()) {
    Judgement result;
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
    Judgement result;
    result.error = readError;
    return result;
  }
  return judgement.Finish();
}

}  // namespace pelmix::cli
