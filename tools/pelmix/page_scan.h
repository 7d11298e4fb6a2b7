// One page through the module's web-session ABI, as any host would judge it: a session on
// the page URL, the page appended in chunks, then the verdict and the heuristic details. The
// session's own trace lines are taken apart on the calling thread (the failure line that
// explains a refusal, the feature vector when asked for).
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "framework/uvo/anti_phishing.h"
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

Judgement ScanPage(cf::services::anti_phishing::IHttpSessionFactory& sessions,
                   const PageInput& input, const PageScanOptions& options);

}  // namespace pelmix::cli
