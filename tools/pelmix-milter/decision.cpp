#include "tools/pelmix-milter/decision.h"

#include <cstdio>

namespace pelmix::milter {

std::string HeaderSafe(const std::string& text, std::size_t limit) {
  std::string out;
  const std::size_t end = std::min(limit, text.size());
  for (std::size_t i = 0; i < end; ++i) {
    const auto c = static_cast<unsigned char>(text[i]);
    if (c > 0x20 && c < 0x7f && c != ';' && c != '%' && c != '"') {
      out += static_cast<char>(c);
    } else if (c == ' ') {
      out += ' ';
    } else {
      char hex[4];
      std::snprintf(hex, sizeof hex, "%%%02X", c);
      out += hex;
    }
  }
  return out;
}

std::string VerdictValue(const cli::Judgement& judgement) {
  if (!judgement.phishing) return "clean";
  char weight[32];
  std::snprintf(weight, sizeof weight, "%.6f", judgement.weight);
  return std::string("phishing; weight=") + weight +
         "; target=" + HeaderSafe(judgement.target, kMaxTargetBytes);
}

Decision Decide(const cli::Judgement& judgement, bool cut, const Options& options) {
  Decision d;
  if (!judgement.error.empty()) {
    const bool unreadable = judgement.error.rfind("unreadable message", 0) == 0;
    d.reason = "not judged: " + HeaderSafe(judgement.error, 512);
    if (options.onError == OnError::kTempfail) {
      d.reply = Reply::kTempfail;
    } else {
      d.header = std::string("unchecked; reason=") + (unreadable ? "unreadable" : "engine-error");
    }
    return d;
  }
  d.judged = true;
  d.header = VerdictValue(judgement);
  if (judgement.phishing) {
    d.reason = "phishing, " + d.header.substr(d.header.find("weight="));
    if (cut) d.reason += ", judged on its first " + std::to_string(options.maxMessage) + " bytes";
    if (options.action == Action::kReject) {
      d.reply = Reply::kReject;
      d.header.clear();
    } else if (options.action == Action::kQuarantine) {
      d.quarantine = true;
    }
  } else if (cut) {
    d.judged = false;
    d.header = "unchecked; reason=too-large";
    d.reason = "larger than max-message (" + std::to_string(options.maxMessage) +
               " bytes): the rest was not judged";
  }
  return d;
}

}  // namespace pelmix::milter
