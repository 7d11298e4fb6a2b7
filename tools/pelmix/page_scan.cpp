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

Judgement ScanPage(IHttpSessionFactory& sessions, const PageInput& input,
                   const PageScanOptions& options) {
  Judgement result;
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

  if (!AskRecords(*session.Get(), capture, result)) return result;
  if (options.features) result.features = FeaturesOf(capture.Take(), kVerdictLevel);
  return result;
}

}  // namespace pelmix::cli
