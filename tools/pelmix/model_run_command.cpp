// pelmix model run: builds a decision model from a flow file and runs it on feature vectors
// read from stdin, one per line, printing the outputs and the decision for each.
#include <algorithm>
#include <cctype>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <limits>
#include <memory>
#include <sstream>
#include <string_view>

#include "engine/kb/float_parser.h"
#include "engine/kb/readable_buffer.h"
#include "engine/kb/simple_solver.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/kb_container.h"

namespace pelmix::cli {
namespace {

namespace fs = std::filesystem;

// A feature line longer than this is refused (the rest of it is skipped).
constexpr std::size_t kMaxFeatureLine = std::size_t{1} << 20;

// A whole file in memory, read through the engine's buffer reader.
class OwnedFile final : public ap::ReadableFileI {
 public:
  explicit OwnedFile(std::string bytes)
      : bytes_(std::move(bytes)), view_(bytes_.data(), static_cast<std::uint32_t>(bytes_.size())) {}
  std::int64_t file_seek(std::int64_t position) override { return view_.file_seek(position); }
  std::int64_t file_size() override { return view_.file_size(); }
  std::int64_t file_read(void* buffer, std::uint64_t count) override {
    return view_.file_read(buffer, count);
  }

 private:
  std::string bytes_;
  util::ReadableBuffer view_;
};

// The files under a directory as entries named by their relative paths ('/' separated).
// Names that would leave the directory are absent.
class DirectoryFiles final : public ap::FileSystemI {
 public:
  explicit DirectoryFiles(fs::path root) : root_(std::move(root)) {}

  std::shared_ptr<ap::ReadableFileI> open(const std::string& name) override {
    const fs::path relative(name);
    if (name.empty() || relative.is_absolute() || relative.has_root_name()) return nullptr;
    for (const auto& part : relative) {
      if (part == "..") return nullptr;
    }
    const fs::path path = root_ / relative;
    std::error_code error;
    if (!fs::is_regular_file(path, error)) return nullptr;
    const auto size = fs::file_size(path, error);
    if (error || size > 0xFFFFFFFFu) return nullptr;
    std::ifstream in(path, std::ios::binary);
    if (!in) return nullptr;
    std::ostringstream bytes;
    bytes << in.rdbuf();
    if (in.bad()) return nullptr;
    return std::make_shared<OwnedFile>(std::move(bytes).str());
  }

  void enumerate(
      const std::function<void(const std::string& name, std::uint64_t size)>& callback) override {
    for (const auto& entry : fs::recursive_directory_iterator(root_)) {
      if (!entry.is_regular_file()) continue;
      callback(entry.path().lexically_relative(root_).generic_string(), entry.file_size());
    }
  }

 private:
  fs::path root_;
};

std::string Single(float value) {
  char text[32];
  std::snprintf(text, sizeof text, "%.9g", static_cast<double>(value));
  return text;
}

// "nan" and "inf" (any case, optionally signed), which the models must cope with but the
// knowledge-base number reader has no spelling for.
bool ParseSpecial(std::string_view token, float& value) {
  const bool negative = !token.empty() && token[0] == '-';
  if (!token.empty() && (token[0] == '-' || token[0] == '+')) token.remove_prefix(1);
  const auto is = [&](std::string_view word) {
    return token.size() == word.size() &&
           std::equal(token.begin(), token.end(), word.begin(), [](char a, char b) {
             return std::tolower(static_cast<unsigned char>(a)) == b;
           });
  };
  if (is("nan")) {
    value = std::numeric_limits<float>::quiet_NaN();
  } else if (is("inf") || is("infinity")) {
    value = std::numeric_limits<float>::infinity();
  } else {
    return false;
  }
  if (negative) value = -value;
  return true;
}

// Blank-separated numbers, read as the engine reads the numbers of its knowledge bases
// (ap::FloatParser), so that a vector reads here as it would there.
bool ParseFeatures(const std::string& line, std::vector<float>& features, std::string& error) {
  features.clear();
  std::size_t at = 0;
  while (at < line.size()) {
    if (line[at] == ' ' || line[at] == '\t' || line[at] == '\r') {
      ++at;
      continue;
    }
    std::size_t end = at;
    while (end < line.size() && line[end] != ' ' && line[end] != '\t' && line[end] != '\r') ++end;
    const std::string_view token(line.data() + at, end - at);
    float value = 0;
    if (!ParseSpecial(token, value)) {
      try {
        value = static_cast<float>(ap::FloatParser::Parse(token));
      } catch (const std::exception&) {
        error = "not a number: " + std::string(token);
        return false;
      }
    }
    features.push_back(value);
    at = end;
  }
  return true;
}

// One line of `in` into `line`; false at the end. A line over the limit is cut and flagged.
bool ReadLine(std::istream& in, std::string& line, bool& tooLong) {
  line.clear();
  tooLong = false;
  std::streambuf* buffer = in.rdbuf();
  int c = buffer->sbumpc();
  if (c == std::char_traits<char>::eof()) return false;
  for (; c != std::char_traits<char>::eof() && c != '\n'; c = buffer->sbumpc()) {
    if (line.size() < kMaxFeatureLine) {
      line.push_back(static_cast<char>(c));
    } else {
      tooLong = true;
    }
  }
  return true;
}

bool ParseThreshold(const std::string& text, float& value) {
  if (text.empty()) return false;
  try {
    value = static_cast<float>(ap::FloatParser::Parse(text));
  } catch (const std::exception&) {
    return false;
  }
  return true;
}

int RunModelRun(const std::vector<std::string>& args, const GlobalOptions&) {
  std::string kb, dir, flow;
  ap::ChannelConfig thresholds;  // threshold 0.01, threshold_loud 0
  for (std::size_t i = 0; i < args.size(); ++i) {
    const std::string& arg = args[i];
    const bool takesValue =
        arg == "--kb" || arg == "--dir" || arg == "--threshold" || arg == "--threshold-loud";
    if (takesValue) {
      if (i + 1 == args.size()) return UsageError("model run: " + arg + " needs a value");
      const std::string& value = args[++i];
      if (arg == "--kb") kb = value;
      if (arg == "--dir") dir = value;
      if ((arg == "--threshold" && !ParseThreshold(value, thresholds.threshold)) ||
          (arg == "--threshold-loud" && !ParseThreshold(value, thresholds.threshold_loud))) {
        return UsageError("model run: " + arg + " needs a decimal number, not " + value);
      }
    } else if (!arg.empty() && arg[0] == '-') {
      return UsageError("model run: unknown option " + arg);
    } else if (flow.empty()) {
      flow = arg;
    } else {
      return UsageError("model run takes one FLOW");
    }
  }
  if (kb.empty() == dir.empty()) return UsageError("model run needs one of --kb FILE or --dir DIR");
  if (flow.empty()) return UsageError("model run needs the FLOW entry");

  std::unique_ptr<loaders_misc::SimpleSolver> solver;
  try {
    std::shared_ptr<ap::FileSystemI> files;
    if (!kb.empty()) {
      files = OpenContainer(kb);
    } else {
      if (!fs::is_directory(dir)) throw KbFileError(dir + ": not a directory");
      files = std::make_shared<DirectoryFiles>(dir);
    }
    solver = std::make_unique<loaders_misc::SimpleSolver>(flow, std::move(files));
  } catch (const std::exception& e) {
    std::cerr << "pelmix: model run: " << DescribeFailure(e) << "\n";
    return kExitFailure;
  }

  const auto& model = solver->model();
  int status = kExitOk;
  std::string line, error;
  std::vector<float> features, outputs;
  bool tooLong = false;
  while (ReadLine(std::cin, line, tooLong)) {
    // Errors stay in line with the input so that output line n answers input line n.
    if (tooLong) {
      std::cout << "error\tfeature line longer than " << kMaxFeatureLine << " bytes\n";
      status = kExitFailure;
      continue;
    }
    if (!ParseFeatures(line, features, error)) {
      std::cout << "error\t" << error << "\n";
      status = kExitFailure;
      continue;
    }
    try {
      model.calc(features, outputs);
      const WebCheckerV3Data::Decision decision = solver->Solve(features, thresholds);
      std::string text;
      for (std::size_t i = 0; i < outputs.size(); ++i) {
        if (i != 0) text += ' ';
        text += Single(outputs[i]);
      }
      std::cout << text << '\t' << (decision.detected ? 1 : 0) << '\t'
                << (decision.outside_loud ? 1 : 0) << '\t' << Single(decision.weight) << '\t'
                << decision.annotation << '\n';
    } catch (const std::exception& e) {
      std::cout << "error\t" << e.what() << "\n";
      status = kExitFailure;
    }
  }
  std::cout.flush();
  return status;
}

}  // namespace

PELMIX_COMMAND({"model run",
                "(--kb FILE | --dir DIR) FLOW [--threshold T] [--threshold-loud L] < FEATURES",
                "run a decision model on feature vectors, one per stdin line", RunModelRun})

}  // namespace pelmix::cli
