#include "tools/pelmix-milter/options.h"

#include "tools/pelmix/judging.h"

namespace pelmix::milter {
namespace {

// A whole decimal number within [min, max], for settings of any integer type.
template <typename T>
bool WholeNumber(const std::string& text, T min, T max, T& out) {
  std::size_t value = 0;
  if (!cli::ParseNumber(text, static_cast<std::size_t>(min), static_cast<std::size_t>(max),
                        value)) {
    return false;
  }
  out = static_cast<T>(value);
  return true;
}

std::string Needs(const std::string& option, long long min, long long max) {
  return option + " needs a whole number from " + std::to_string(min) + " to " +
         std::to_string(max);
}

bool StartsWith(const std::string& text, const char* prefix) { return text.rfind(prefix, 0) == 0; }

std::string Apply(const std::string& name, const std::string& value, Options& options) {
  if (name == "--kb" || name == "--module") {
    if (value.empty()) return name + " needs a file";
    (name == "--kb" ? options.kb : options.module) = value;
  } else if (name == "--socket") {
    if (!ValidSocket(value)) {
      return "--socket needs inet:PORT@HOST, inet6:PORT@HOST or unix:PATH, not \"" + value + "\"";
    }
    options.socket = value;
  } else if (name == "--action") {
    if (value == "tag") {
      options.action = Action::kTag;
    } else if (value == "reject") {
      options.action = Action::kReject;
    } else if (value == "quarantine") {
      options.action = Action::kQuarantine;
    } else {
      return "--action needs tag, reject or quarantine";
    }
  } else if (name == "--on-error") {
    if (value == "accept") {
      options.onError = OnError::kAccept;
    } else if (value == "tempfail") {
      options.onError = OnError::kTempfail;
    } else {
      return "--on-error needs accept or tempfail";
    }
  } else if (name == "--max-message") {
    if (!WholeNumber(value, std::size_t{1}, kMaxMaxMessage, options.maxMessage)) {
      return Needs(name, 1, kMaxMaxMessage);
    }
  } else if (name == "--timeout") {
    if (!WholeNumber(value, 1, kMaxTimeoutSeconds, options.timeout)) {
      return Needs(name, 1, kMaxTimeoutSeconds);
    }
  } else if (name == "--max-connections") {
    if (!WholeNumber(value, 1u, kMaxMaxConnections, options.maxConnections)) {
      return Needs(name, 1, kMaxMaxConnections);
    }
  } else if (name == "--level") {
    if (!WholeNumber(value, 1, 3, options.level)) return "--level needs 1, 2 or 3";
  } else {
    return "unknown option " + name;
  }
  return {};
}

}  // namespace

bool ValidSocket(const std::string& text) {
  for (const char* prefix : {"unix:", "local:"}) {
    if (StartsWith(text, prefix)) return text.size() > std::string(prefix).size();
  }
  std::string rest;
  if (StartsWith(text, "inet:")) {
    rest = text.substr(5);
  } else if (StartsWith(text, "inet6:")) {
    rest = text.substr(6);
  } else {
    return false;
  }
  const std::size_t at = rest.find('@');
  int port = 0;
  return at != std::string::npos && at + 1 < rest.size() &&
         WholeNumber(rest.substr(0, at), 1, 65535, port);
}

std::string ParseOptions(const std::vector<std::string>& args, Options& options) {
  for (std::size_t i = 0; i < args.size(); ++i) {
    const std::string& arg = args[i];
    if (arg == "--help" || arg == "-h") {
      options.help = true;
      continue;
    }
    if (!StartsWith(arg, "--")) return "unexpected argument \"" + arg + "\"";
    std::string name = arg, value;
    if (const std::size_t eq = arg.find('='); eq != std::string::npos) {
      name = arg.substr(0, eq);
      value = arg.substr(eq + 1);
    } else {
      if (i + 1 == args.size()) return arg + " needs a value";
      value = args[++i];
    }
    if (std::string error = Apply(name, value, options); !error.empty()) return error;
  }
  return {};
}

std::string Usage() {
  return "usage: pelmix-milter [--kb FILE] [--socket inet:PORT@127.0.0.1|unix:PATH]\n"
         "                     [--action tag|reject|quarantine] [--on-error accept|tempfail]\n"
         "                     [--max-message BYTES] [--timeout S] [--max-connections N]\n"
         "                     [--level 1|2|3] [--module FILE] [--help]\n"
         "Judges every message the MTA hands over and adds X-Pelmix-Verdict; phishing can be\n"
         "rejected or quarantined instead. SIGHUP reloads the knowledge base, SIGTERM stops.\n"
         "Defaults: --socket inet:8640@127.0.0.1 --action tag --on-error accept\n"
         "          --max-message 16777216 (up to 33554432) --timeout 300\n"
         "          --max-connections 64 --level 2\n";
}

}  // namespace pelmix::milter
