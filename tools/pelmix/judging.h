// What the judging commands (scan, mail) share: their inputs (files, directories walked in
// name order, stdin), the service they load through the module, the judgement of one input
// and how it is printed, and the pool of sessions that judges inputs on N threads while the
// output keeps the input order.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "framework/uvo/anti_phishing.h"
#include "host/tracer.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/module_host.h"

namespace pelmix::cli {

// More threads than this buy nothing on any machine we run on and would let a typo spawn
// thousands.
inline constexpr unsigned kMaxJobs = 256;
// Exit status when some input was judged phishing (and nothing failed).
inline constexpr int kExitPhishing = 3;

// Whole decimal `text` within [min, max].
bool ParseNumber(const std::string& text, std::size_t min, std::size_t max, std::size_t& out);

struct InputFile {
  std::string path;   // "-" for stdin
  std::string error;  // set when the input was refused before reading (a bad directory)
};
// A file, "-", or a directory expanded (recursively, in name order) into its regular files.
void AddInput(const std::string& path, std::vector<InputFile>& inputs);

// The verdict of one input, or why there is none.
struct Judgement {
  std::string error;  // empty when the input was judged
  bool phishing = false;
  bool quiet = true;
  double weight = 0;
  std::string target;
  int confidence = 0;
  std::int64_t dbstamp = 0;
  // The vector the model judged, as the module wrote it (%.9g each); none when it judged none.
  std::optional<std::vector<std::string>> features;
};

// "WHAT: 0x8000004B (Unspecified error)" and, when the module said why, its failure line.
std::string Failure(const std::string& what, uvo::result_t code,
                    const std::vector<host::TraceLine>& lines);
// The numbers of the first features line traced at `level`.
std::optional<std::vector<std::string>> FeaturesOf(const std::vector<host::TraceLine>& lines,
                                                   int level);
// Fills the judgement from a session's two records.
void Record(const cf::services::anti_phishing::Verdict& verdict,
            const cf::services::anti_phishing::HeuristicVerdictInfo& info, Judgement& out);

// Asks a session (web or mail) for its verdict and its details and fills `out`; on a failing
// call, `out.error` names it with the module's failure line from `capture`.
template <class Session>
bool AskRecords(Session& session, host::Tracer::ThreadCapture& capture, Judgement& out) {
  cf::services::anti_phishing::Verdict verdict{};
  cf::services::anti_phishing::HeuristicVerdictInfo info{};
  uvo::result_t code = session.GetVerdict(&verdict);
  if (code < 0) {
    out.error = Failure("GetVerdict", code, capture.Take());
    return false;
  }
  if ((code = session.GetHeuristicVerdictInfo(&info)) < 0) {
    out.error = Failure("GetHeuristicVerdictInfo", code, capture.Take());
    return false;
  }
  Record(verdict, info, out);
  return true;
}

// One line: "NAME: clean", "NAME: PHISHING weight=W target=T" or "NAME: error REASON"; with
// `json` one object with "file" (and "url" when given), the records' fields and, with
// `features`, the vector.
std::string FormatJudgement(const std::string& name, const std::string* url, const Judgement& j,
                            bool json, bool features);

// The module and a service on a knowledge base, loaded as every host loads them.
struct LoadedService {
  std::unique_ptr<ModuleHost> host;
  uvo::Ptr<cf::services::anti_phishing::IAntiPhishingService> service;
};
// Returns 0, or kExitModule after saying on stderr (as "pelmix COMMAND: ...") what failed.
int LoadService(const std::string& command, const std::string& kb, const GlobalOptions& options,
                LoadedService& out);

// Runs work(i) for i in [0, count) on `jobs` threads and prints each result to stdout in
// order of i as soon as it and all before it are done; a progress bar on a terminal.
void RunInOrder(std::size_t count, unsigned jobs,
                const std::function<std::string(std::size_t)>& work);

}  // namespace pelmix::cli
