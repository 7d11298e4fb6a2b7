// One page through the module's web-session ABI, as any host would judge it: a session on
// the page URL, the page appended in chunks, then the verdict and the heuristic details. The
// session's own trace lines are taken apart on the calling thread (the failure line that
// explains a refusal, the feature vector when asked for).
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "framework/uvo/anti_phishing.h"
#include "host/tracer.h"
#include "tools/pelmix/judging.h"

namespace pelmix::cli {

struct PageInput {
  std::string path;  // "-" for stdin
  std::string url;
  std::string error;  // set when the input was refused before reading (a bad directory entry)
};

struct PageScanOptions {
  std::int32_t level = 2;
  std::size_t chunk = 4096;
  bool features = false;
};

// One page judged as its bytes arrive, for hosts that do not hold the page whole (a file read
// in chunks, an HTTP body as it is received). All calls must come from the thread that made
// it: the session's trace lines are captured on that thread.
class PageJudgement {
 public:
  PageJudgement(cf::services::anti_phishing::IHttpSessionFactory& sessions, const std::string& url,
                const PageScanOptions& options);
  PageJudgement(const PageJudgement&) = delete;
  PageJudgement& operator=(const PageJudgement&) = delete;

  // Hands the next bytes to the session; false once the session has failed (later chunks
  // are dropped, Finish() reports why).
  bool Append(std::string_view chunk);
  bool Failed() const { return !error_.empty(); }
  // The verdict, or the first failure. Call once, after the last chunk.
  Judgement Finish();

 private:
  host::Tracer::ThreadCapture capture_;
  bool features_;
  uvo::Ptr<cf::services::anti_phishing::IHttpSession> session_;
  std::string error_;  // the first failure, if any
};

Judgement ScanPage(cf::services::anti_phishing::IHttpSessionFactory& sessions,
                   const PageInput& input, const PageScanOptions& options);

}  // namespace pelmix::cli
