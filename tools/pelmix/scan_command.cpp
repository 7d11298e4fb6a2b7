// pelmix scan: judges web pages through the module's web sessions, as a proxy would, one
// line (or one JSON object) per page, in input order whatever --jobs says.
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <charconv>
#include <cmath>
#include <condition_variable>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <mutex>
#include <optional>
#include <sstream>
#include <thread>

#include "framework/uvo/anti_phishing.h"
#include "host/stream.h"
#include "tools/pelmix/chunked_input.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/json_lines.h"
#include "tools/pelmix/module_host.h"
#include "tools/pelmix/page_scan.h"
#include "tools/pelmix/progress_bar.h"

namespace pelmix::cli {
namespace {

namespace fs = std::filesystem;
using namespace cf::services::anti_phishing;

// More threads than this buy nothing on any machine we run on and would let a typo spawn
// thousands.
constexpr unsigned kMaxJobs = 256;
// Exit status when some page was judged phishing (and nothing failed).
constexpr int kExitPhishing = 3;

struct ScanArgs {
  std::string kb;
  std::string url;
  PageScanOptions page;
  bool json = false;
  unsigned jobs = 1;
  std::string list;
  std::vector<std::string> inputs;
};

bool ParseNumber(const std::string& text, std::size_t min, std::size_t max, std::size_t& out) {
  const auto [end, ec] = std::from_chars(text.data(), text.data() + text.size(), out);
  return ec == std::errc() && end == text.data() + text.size() && out >= min && out <= max;
}

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
  std::error_code error;
  if (path == "-" || !fs::is_directory(path, error)) {
    pages.push_back({path, url, {}});
    return;
  }
  std::vector<std::string> files;
  fs::recursive_directory_iterator it(path, fs::directory_options::skip_permission_denied, error);
  for (; !error && it != fs::recursive_directory_iterator(); it.increment(error)) {
    std::error_code statError;
    if (it->is_regular_file(statError)) files.push_back(it->path().string());
  }
  if (error) {
    pages.push_back({path, url, path + ": " + error.message()});
    return;
  }
  std::sort(files.begin(), files.end());
  for (auto& file : files) pages.push_back({std::move(file), url, {}});
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

std::string Number(double value) {
  char text[32];
  std::snprintf(text, sizeof text, "%.9g", value);
  return text;
}

// A float as the module wrote it, or null when JSON has no such number (nan, inf).
std::string JsonNumber(const std::string& value) {
  double parsed = 0;
  const auto [end, ec] = std::from_chars(value.data(), value.data() + value.size(), parsed);
  if (ec != std::errc() || end != value.data() + value.size() || !std::isfinite(parsed)) {
    return "null";
  }
  return value;
}

std::string Format(const PageInput& input, const PageResult& result, const ScanArgs& scan) {
  if (!scan.json) {
    if (!result.error.empty()) return input.path + ": error " + result.error + "\n";
    if (!result.phishing) return input.path + ": clean\n";
    char weight[32];
    std::snprintf(weight, sizeof weight, "%.6f", result.weight);
    return input.path + ": PHISHING weight=" + weight + " target=" + result.target + "\n";
  }
  std::ostringstream out;
  JsonLine line;
  line.Bytes("file", input.path).Bytes("url", input.url);
  if (!result.error.empty()) {
    line.Bytes("error", result.error).Write(out);
    return out.str();
  }
  line.Bool("phishing", result.phishing)
      .Bool("quiet", result.quiet)
      .Raw("weight", JsonNumber(Number(result.weight)))
      .Bytes("target", result.target)
      .Int("confidence", result.confidence)
      .Int("dbstamp", result.dbstamp);
  if (scan.page.features) {
    std::string array = "null";
    if (result.features) {
      array = "[";
      for (std::size_t i = 0; i < result.features->size(); ++i) {
        if (i != 0) array += ',';
        array += JsonNumber((*result.features)[i]);
      }
      array += ']';
    }
    line.Raw("features", array);
  }
  line.Write(out);
  return out.str();
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

  std::string error;
  uvo::Ptr<host::FileStream> file = host::FileStream::Open(scan.kb, &error);
  if (!file) {
    std::cerr << "pelmix scan: the knowledge base cannot be read: " << error << "\n";
    return kExitModule;
  }
  std::unique_ptr<ModuleHost> moduleHost;
  try {
    moduleHost = std::make_unique<ModuleHost>(options);
  } catch (const std::exception& e) {
    std::cerr << "pelmix scan: " << e.what() << "\n";
    return kExitModule;
  }
  uvo::Ptr<IAntiPhishingServiceFactory> factory;
  uvo::result_t result = moduleHost->CreateServiceFactory(&factory);
  uvo::Ptr<IAntiPhishingService> service;
  if (result >= 0) result = factory->CreateAntiPhishingService(file.Get(), service.Receive());
  uvo::Ptr<IHttpSessionFactory> sessions;
  if (result >= 0) result = service->GetHttpSessionFactory(sessions.Receive());
  if (result < 0) {
    std::cerr << "pelmix scan: the service failed to load from " << scan.kb << ": "
              << DescribeResult(result) << "\n";
    for (const host::TraceLine& line : moduleHost->Host().tracer->Lines()) {
      if (line.level == 300) std::cerr << line.text << "\n";
    }
    return kExitModule;
  }

  // Workers take pages in order; results are printed in input order as they complete.
  std::vector<std::optional<std::string>> lines(pages.size());
  std::mutex mutex;
  std::condition_variable ready;
  std::atomic<std::size_t> next{0};
  std::atomic<bool> failed{false}, phishing{false};
  ProgressBar progress(std::cerr, pages.size(), pages.size() > 1 && isatty(STDERR_FILENO));
  const auto work = [&] {
    for (std::size_t i; (i = next.fetch_add(1)) < pages.size();) {
      const PageResult page = ScanPage(*sessions.Get(), pages[i], scan.page);
      if (!page.error.empty()) failed = true;
      if (page.error.empty() && page.phishing) phishing = true;
      std::string text = Format(pages[i], page, scan);
      {
        std::lock_guard<std::mutex> lock(mutex);
        lines[i] = std::move(text);
      }
      ready.notify_one();
      progress.Advance();
    }
  };
  std::vector<std::thread> workers;
  const unsigned jobs = static_cast<unsigned>(std::min<std::size_t>(scan.jobs, pages.size()));
  for (unsigned j = 1; j < jobs; ++j) workers.emplace_back(work);
  std::thread printer([&] {
    for (std::size_t i = 0; i < pages.size(); ++i) {
      std::unique_lock<std::mutex> lock(mutex);
      ready.wait(lock, [&] { return lines[i].has_value(); });
      std::string text = std::move(*lines[i]);
      lines[i].reset();
      lock.unlock();
      std::cout << text;
    }
    std::cout.flush();
  });
  work();
  for (std::thread& worker : workers) worker.join();
  printer.join();

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
