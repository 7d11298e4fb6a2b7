#include "tools/pelmix-milter/message_collector.h"

#include <algorithm>
#include <cctype>
#include <string>

namespace pelmix::milter {
namespace {

bool SameName(std::string_view a, std::string_view b) {
  return a.size() == b.size() && std::equal(a.begin(), a.end(), b.begin(), [](char x, char y) {
           return std::tolower(static_cast<unsigned char>(x)) ==
                  std::tolower(static_cast<unsigned char>(y));
         });
}

}  // namespace

MessageCollector::MessageCollector(std::size_t maxBytes) : maxBytes_(maxBytes) {
  message_.index = 1;
}

void MessageCollector::Header(std::string_view name, std::string_view value) {
  if (SameName(name, kVerdictHeader)) ++verdictHeaders_;
  if (inBody_) return;  // a field after the body began cannot belong to the header
  Keep(name);
  Keep(": ");
  bool cr = false;
  KeepLines(value, cr);
  if (cr) Keep("\r");
  Keep("\n");
}

void MessageCollector::EndOfHeaders() {
  if (inBody_) return;
  inBody_ = true;
  Keep("\n");
}

void MessageCollector::Body(std::string_view chunk) {
  EndOfHeaders();
  KeepLines(chunk, bodyCr_);
}

void MessageCollector::Finish() {
  if (bodyCr_) Keep("\r");
  bodyCr_ = false;
}

void MessageCollector::KeepLines(std::string_view bytes, bool& pendingCr) {
  if (bytes.empty()) return;
  if (pendingCr) {
    pendingCr = false;
    if (bytes.front() != '\n') Keep("\r");
  }
  std::size_t start = 0;
  for (std::size_t cr = bytes.find('\r'); cr != std::string_view::npos;
       cr = bytes.find('\r', cr + 1)) {
    if (cr + 1 == bytes.size()) {
      Keep(bytes.substr(start, cr - start));
      pendingCr = true;
      return;
    }
    if (bytes[cr + 1] == '\n') {
      Keep(bytes.substr(start, cr - start));
      start = cr + 1;
    }
  }
  Keep(bytes.substr(start));
}

void MessageCollector::Keep(std::string_view bytes) {
  message_.inputBytes += bytes.size();
  const std::size_t room = maxBytes_ - std::min(maxBytes_, message_.size());
  if (bytes.size() > room) message_.cut = true;
  message_.Append(bytes.substr(0, std::min(room, bytes.size())));
}

}  // namespace pelmix::milter
