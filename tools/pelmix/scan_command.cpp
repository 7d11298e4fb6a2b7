// pelmix scan: judges web pages through the module's web sessions, as a proxy would, one
// line (or one JSON object) per page, in input order whatever --jobs says.
#include <algorithm>
#include <atomic>
#include <fstream>
#include <iostream>

#include "framework/uvo/anti_phishing.h"
#include "tools/pelmix/chunked_input.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/judging.h"
#include "tools/pelmix/module_host.h"
#include "tools/pelmix/page_scan.h"

namespace pelmix::cli {
namespace {

using namespace cf::services::anti_phishing;

struct ScanArgs {
  std::string kb;
  std::string url;
  PageScanOptions page;
  bool json = false;
  unsigned jobs = 1;
  std::string list;
  std::vector<std::string> inputs;
};

// Returns 0 or the usage error's exit status.
int Parse(const std::vector<std::string>& args, ScanArgs& scan) {
  scan.kb = DefaultKnowledgeBase();
  for (std::size_t i = 0; i < args.size(); ++i) {
    const std::string& arg = args[i];
    const auto value = [&](std::string& into) {
      if (i + 1 >= args.size()) return false;
      into = args[++i];
      return true;
    };
    std::string text;
    std::size_t number = 0;
    if (arg == "--kb") {
      if (!value(scan.kb)) return UsageError("scan: --kb needs a file");
    } else if (arg == "--url") {
      if (!value(scan.url)) return UsageError("scan: --url needs a URL");
    } else if (arg == "--list") {
      if (!value(scan.list)) return UsageError("scan: --list needs a file");
    } else if (arg == "--level") {
      if (!value(text) || !ParseNumber(text, 1, 3, number)) {
        return UsageError("scan: --level needs 1, 2 or 3");
      }
      scan.page.level = static_cast<std::int32_t>(number);
    } else if (arg == "--chunk") {
      if (!value(text) || !ParseNumber(text, 1, kMaxChunk, number)) {
        return UsageError("scan: --chunk needs a size from 1 to " + std::to_string(kMaxChunk));
      }
      scan.page.chunk = number;
    } else if (arg == "--jobs") {
      if (!value(text) || !ParseNumber(text, 1, kMaxJobs, number)) {
        return UsageError("scan: --jobs needs a count from 1 to " + std::to_string(kMaxJobs));
      }
      scan.jobs = static_cast<unsigned>(number);
    } else if (arg == "--json") {
      scan.json = true;
    } else if (arg == "--features") {
      scan.page.features = true;
    } else if (arg.size() > 1 && arg[0] == '-') {
      return UsageError("scan: unknown option " + arg);
    } else {
      scan.inputs.push_back(arg);
    }
  }
  if (scan.inputs.empty() && scan.list.empty()) {
    return UsageError("scan needs a FILE, - or DIR (or --list FILE)");
  }
  if (scan.page.features && !scan.json) return UsageError("scan: --features needs --json");
  if (std::count(scan.inputs.begin(), scan.inputs.end(), "-") > 1) {
    return UsageError("scan: stdin (-) can be read only once");
  }
  return 0;
}

// Expands directories (recursively, in name order) into their regular files.
void AddInput(const std::string& path, const std::string& url, std::vector<PageInput>& pages) {
  std::vector<InputFile> files;
  pelmix::cli::AddInput(path, files);
  for (InputFile& file : files) pages.push_back({std::move(file.path), url, std::move(file.error)});
}

// Lines "PATH<TAB>URL" (the URL may be left out: --url then holds). Returns false and fills
// `error` when the list cannot be read.
bool ReadList(const ScanArgs& scan, std::vector<PageInput>& pages, std::string& error) {
  std::ifstream in(scan.list);
  if (!in) {
    error = scan.list + ": cannot be read";
    return false;
  }
  for (std::string line; std::getline(in, line);) {
    if (!line.empty() && line.back() == '\r') line.pop_back();
    if (line.empty()) continue;
    const std::size_t tab = line.find('\t');
    if (tab == std::string::npos) {
      AddInput(line, scan.url, pages);
    } else {
      AddInput(line.substr(0, tab), line.substr(tab + 1), pages);
    }
  }
  return true;
}

int RunScan(const std::vector<std::string>& args, const GlobalOptions& options) {
  ScanArgs scan;
  if (const int usage = Parse(args, scan); usage != 0) return usage;

  std::vector<PageInput> pages;
  for (const std::string& input : scan.inputs) AddInput(input, scan.url, pages);
  if (!scan.list.empty()) {
    std::string error;
    if (!ReadList(scan, pages, error)) {
      std::cerr << "pelmix scan: " << error << "\n";
      return kExitFailure;
    }
  }

  LoadedService loaded;
  if (const int status = LoadService("scan", scan.kb, options, loaded); status != kExitOk) {
    return status;
  }
  uvo::Ptr<IHttpSessionFactory> sessions;
  if (const uvo::result_t result = loaded.service->GetHttpSessionFactory(sessions.Receive());
      result < 0) {
    std::cerr << "pelmix scan: no web sessions: " << DescribeResult(result) << "\n";
    return kExitModule;
  }

  // Pages are judged on --jobs threads; the lines come out in input order.
  std::atomic<bool> failed{false}, phishing{false};
  RunInOrder(pages.size(), scan.jobs, [&](std::size_t i) {
    const Judgement page = ScanPage(*sessions.Get(), pages[i], scan.page);
    if (!page.error.empty()) failed = true;
    if (page.error.empty() && page.phishing) phishing = true;
    return FormatJudgement(pages[i].path, &pages[i].url, page, scan.json, scan.page.features);
  });

  if (failed) return kExitFailure;
  return phishing ? kExitPhishing : kExitOk;
}

}  // namespace

PELMIX_COMMAND({"scan",
                "[--kb FILE] [--url URL] [--level 1|2|3] [--chunk N] [--json] [--features] "
                "[--jobs N] [--list FILE] FILE|-|DIR...",
                "judge web pages through the module's web sessions (exit 3: phishing found)",
                RunScan})

}  // namespace pelmix::cli
