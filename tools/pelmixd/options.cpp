#include "tools/pelmixd/options.h"

#include <charconv>
#include <fstream>
#include <iterator>

namespace pelmix::pelmixd {
namespace {

template <typename T>
bool ParseNumber(const std::string& text, T min, T max, T& out) {
  T value{};
  const auto [end, ec] = std::from_chars(text.data(), text.data() + text.size(), value);
  if (ec != std::errc() || end != text.data() + text.size() || value < min || value > max) {
    return false;
  }
  out = value;
  return true;
}

std::string Trim(const std::string& text) {
  const std::size_t begin = text.find_first_not_of(" \t\r");
  if (begin == std::string::npos) return {};
  return text.substr(begin, text.find_last_not_of(" \t\r") - begin + 1);
}

std::string Range(const char* what, long long min, long long max) {
  return std::string(what) + " needs a whole number from " + std::to_string(min) + " to " +
         std::to_string(max);
}

}  // namespace

bool ParseListen(const std::string& text, std::string& host, int& port) {
  const std::size_t colon = text.rfind(':');
  if (colon == std::string::npos || colon == 0) return false;
  std::string name = text.substr(0, colon);
  if (name.front() == '[') {
    if (name.size() < 3 || name.back() != ']') return false;
    name = name.substr(1, name.size() - 2);
  } else if (name.find(':') != std::string::npos) {
    return false;  // a bare IPv6 address is ambiguous
  }
  int number = 0;
  if (!ParseNumber(text.substr(colon + 1), 0, 65535, number)) return false;
  host = name;
  port = number;
  return true;
}

std::string ApplySetting(const std::string& name, const std::string& value, Options& options) {
  if (name == "kb") {
    if (value.empty()) return "kb needs a file";
    options.kb = value;
  } else if (name == "module") {
    if (value.empty()) return "module needs a file";
    options.module = value;
  } else if (name == "listen") {
    if (!ParseListen(value, options.host, options.port)) {
      return "listen needs HOST:PORT (port 0 to 65535), not \"" + value + "\"";
    }
  } else if (name == "threads") {
    if (!ParseNumber(value, 1u, kMaxThreads, options.threads)) {
      return Range("threads", 1, kMaxThreads);
    }
  } else if (name == "max-body") {
    if (!ParseNumber(value, std::size_t{1}, kMaxMaxBody, options.maxBody)) {
      return Range("max-body", 1, static_cast<long long>(kMaxMaxBody));
    }
  } else if (name == "read-timeout" || name == "write-timeout" || name == "keep-alive-timeout") {
    int& into = name == "read-timeout"    ? options.readTimeout
                : name == "write-timeout" ? options.writeTimeout
                                          : options.keepAliveTimeout;
    if (!ParseNumber(value, 1, kMaxTimeoutSeconds, into)) {
      return Range(name.c_str(), 1, kMaxTimeoutSeconds);
    }
  } else if (name == "keep-alive-requests") {
    if (!ParseNumber(value, 1u, kMaxKeepAliveRequests, options.keepAliveRequests)) {
      return Range("keep-alive-requests", 1, kMaxKeepAliveRequests);
    }
  } else if (name == "level") {
    if (!ParseNumber(value, 1, 3, options.level)) return "level needs 1, 2 or 3";
  } else {
    return "unknown setting " + name;
  }
  return {};
}

std::string ApplyConfigText(const std::string& text, Options& options) {
  std::size_t number = 0;
  for (std::size_t begin = 0; begin < text.size();) {
    std::size_t end = text.find('\n', begin);
    if (end == std::string::npos) end = text.size();
    std::string line = text.substr(begin, end - begin);
    begin = end + 1;
    ++number;
    if (const std::size_t hash = line.find('#'); hash != std::string::npos) line.resize(hash);
    line = Trim(line);
    if (line.empty()) continue;
    const std::size_t equals = line.find('=');
    if (equals == std::string::npos) {
      return "line " + std::to_string(number) + ": expected name = value";
    }
    const std::string error =
        ApplySetting(Trim(line.substr(0, equals)), Trim(line.substr(equals + 1)), options);
    if (!error.empty()) return "line " + std::to_string(number) + ": " + error;
  }
  return {};
}

std::string ParseOptions(const std::vector<std::string>& args, Options& options) {
  // The config file first, so that the command line wins over it.
  for (std::size_t i = 0; i < args.size(); ++i) {
    if (args[i] != "--config") continue;
    if (i + 1 >= args.size()) return "--config needs a file";
    options.config = args[i + 1];
  }
  if (!options.config.empty()) {
    std::ifstream in(options.config, std::ios::binary);
    if (!in) return options.config + ": cannot be read";
    std::string text;
    text.resize(kMaxConfigBytes + 1);
    in.read(text.data(), static_cast<std::streamsize>(text.size()));
    text.resize(static_cast<std::size_t>(in.gcount()));
    if (text.size() > kMaxConfigBytes) {
      return options.config + ": larger than " + std::to_string(kMaxConfigBytes) + " bytes";
    }
    if (const std::string error = ApplyConfigText(text, options); !error.empty()) {
      return options.config + ": " + error;
    }
  }
  for (std::size_t i = 0; i < args.size(); ++i) {
    const std::string& arg = args[i];
    if (arg == "--help" || arg == "-h") {
      options.help = true;
      continue;
    }
    if (arg.rfind("--", 0) != 0) return "unexpected argument " + arg;
    const std::string name = arg.substr(2);
    if (i + 1 >= args.size()) return arg + " needs a value";
    const std::string& value = args[++i];
    if (name == "config") continue;
    if (const std::string error = ApplySetting(name, value, options); !error.empty()) {
      return error.rfind("unknown setting", 0) == 0 ? "unknown option " + arg : "--" + error;
    }
  }
  return {};
}

std::string Usage() {
  return "usage: pelmixd [--kb FILE] [--listen HOST:PORT] [--threads N] [--max-body BYTES]\n"
         "               [--read-timeout S] [--write-timeout S] [--keep-alive-timeout S]\n"
         "               [--keep-alive-requests N] [--level 1|2|3] [--module FILE]\n"
         "               [--config FILE]\n\n"
         "Serves the anti-phishing module over HTTP (default 127.0.0.1:8639):\n"
         "  POST /v1/web?url=URL[&level=1|2|3]   body: the page's HTML\n"
         "  GET  /v1/white?domain=D\n"
         "  GET  /healthz, GET /metrics\n"
         "The config file holds the same settings as \"name = value\" lines.\n"
         "SIGHUP loads the knowledge base again; SIGTERM finishes the requests and stops.\n";
}

}  // namespace pelmix::pelmixd
