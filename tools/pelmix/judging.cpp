#include "tools/pelmix/judging.h"

#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <charconv>
#include <cmath>
#include <condition_variable>
#include <cstdio>
#include <filesystem>
#include <iostream>
#include <mutex>
#include <sstream>
#include <thread>

#include "host/stream.h"
#include "tools/pelmix/json_lines.h"
#include "tools/pelmix/progress_bar.h"

namespace pelmix::cli {
namespace {

namespace fs = std::filesystem;
using namespace cf::services::anti_phishing;

constexpr int kFailureLevel = 300;
constexpr char kFeaturesMark[] = ": features:";

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

}  // namespace

bool ParseNumber(const std::string& text, std::size_t min, std::size_t max, std::size_t& out) {
  const auto [end, ec] = std::from_chars(text.data(), text.data() + text.size(), out);
  return ec == std::errc() && end == text.data() + text.size() && out >= min && out <= max;
}

void AddInput(const std::string& path, std::vector<InputFile>& inputs) {
  std::error_code error;
  if (path == "-" || !fs::is_directory(path, error)) {
    inputs.push_back({path, {}});
    return;
  }
  std::vector<std::string> files;
  fs::recursive_directory_iterator it(path, fs::directory_options::skip_permission_denied, error);
  for (; !error && it != fs::recursive_directory_iterator(); it.increment(error)) {
    std::error_code statError;
    if (it->is_regular_file(statError)) files.push_back(it->path().string());
  }
  if (error) {
    inputs.push_back({path, path + ": " + error.message()});
    return;
  }
  std::sort(files.begin(), files.end());
  for (auto& file : files) inputs.push_back({std::move(file), {}});
}

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

std::optional<std::vector<std::string>> FeaturesOf(const std::vector<host::TraceLine>& lines,
                                                   int level) {
  for (const host::TraceLine& line : lines) {
    const std::size_t mark = line.text.find(kFeaturesMark);
    if (line.level != level || mark == std::string::npos) continue;
    std::istringstream numbers(line.text.substr(mark + sizeof kFeaturesMark - 1));
    std::vector<std::string> values;
    for (std::string value; numbers >> value;) values.push_back(std::move(value));
    return values;
  }
  return std::nullopt;
}

void Record(const Verdict& verdict, const HeuristicVerdictInfo& info, Judgement& out) {
  out.phishing = verdict.phishingDetected;
  out.quiet = info.quiet;
  out.weight = info.weight;
  out.target = std::string(info.target.view());
  out.confidence = info.confidence;
  out.dbstamp = info.dbstamp;
}

std::string FormatJudgement(const std::string& name, const std::string* url, const Judgement& j,
                            bool json, bool features) {
  if (!json) {
    if (!j.error.empty()) return name + ": error " + j.error + "\n";
    if (!j.phishing) return name + ": clean\n";
    char weight[32];
    std::snprintf(weight, sizeof weight, "%.6f", j.weight);
    return name + ": PHISHING weight=" + weight + " target=" + j.target + "\n";
  }
  std::ostringstream out;
  JsonLine line;
  line.Bytes("file", name);
  if (url != nullptr) line.Bytes("url", *url);
  if (!j.error.empty()) {
    line.Bytes("error", j.error).Write(out);
    return out.str();
  }
  line.Bool("phishing", j.phishing)
      .Bool("quiet", j.quiet)
      .Raw("weight", JsonNumber(Number(j.weight)))
      .Bytes("target", j.target)
      .Int("confidence", j.confidence)
      .Int("dbstamp", j.dbstamp);
  if (features) {
    std::string array = "null";
    if (j.features) {
      array = "[";
      for (std::size_t i = 0; i < j.features->size(); ++i) {
        if (i != 0) array += ',';
        array += JsonNumber((*j.features)[i]);
      }
      array += ']';
    }
    line.Raw("features", array);
  }
  line.Write(out);
  return out.str();
}

int LoadService(const std::string& command, const std::string& kb, const GlobalOptions& options,
                LoadedService& out) {
  std::string error;
  uvo::Ptr<host::FileStream> file = host::FileStream::Open(kb, &error);
  if (!file) {
    std::cerr << "pelmix " << command << ": the knowledge base cannot be read: " << error << "\n";
    return kExitModule;
  }
  try {
    out.host = std::make_unique<ModuleHost>(options);
  } catch (const std::exception& e) {
    std::cerr << "pelmix " << command << ": " << e.what() << "\n";
    return kExitModule;
  }
  uvo::Ptr<IAntiPhishingServiceFactory> factory;
  uvo::result_t result = out.host->CreateServiceFactory(&factory);
  if (result >= 0) result = factory->CreateAntiPhishingService(file.Get(), out.service.Receive());
  if (result < 0) {
    std::cerr << "pelmix " << command << ": the service failed to load from " << kb << ": "
              << DescribeResult(result) << "\n";
    for (const host::TraceLine& line : out.host->Host().tracer->Lines()) {
      if (line.level == kFailureLevel) std::cerr << line.text << "\n";
    }
    return kExitModule;
  }
  return kExitOk;
}

void RunInOrder(std::size_t count, unsigned jobs,
                const std::function<std::string(std::size_t)>& work) {
  std::vector<std::optional<std::string>> lines(count);
  std::mutex mutex;
  std::condition_variable ready;
  std::atomic<std::size_t> next{0};
  ProgressBar progress(std::cerr, count, count > 1 && isatty(STDERR_FILENO));
  const auto worker = [&] {
    for (std::size_t i; (i = next.fetch_add(1)) < count;) {
      std::string text = work(i);
      {
        std::lock_guard<std::mutex> lock(mutex);
        lines[i] = std::move(text);
      }
      ready.notify_one();
      progress.Advance();
    }
  };
  std::vector<std::thread> workers;
  const unsigned n = static_cast<unsigned>(std::min<std::size_t>(jobs, count));
  for (unsigned j = 1; j < n; ++j) workers.emplace_back(worker);
  std::thread printer([&] {
    for (std::size_t i = 0; i < count; ++i) {
      std::unique_lock<std::mutex> lock(mutex);
      ready.wait(lock, [&] { return lines[i].has_value(); });
      std::string text = std::move(*lines[i]);
      lines[i].reset();
      lock.unlock();
      std::cout << text;
    }
    std::cout.flush();
  });
  worker();
  for (std::thread& w : workers) w.join();
  printer.join();
}

}  // namespace pelmix::cli
