#include "tools/mail/structure_budget.h"

#include <algorithm>
#include <cstring>

namespace pelmix::mail {
namespace {

// A field name of printable characters, optional blanks, then ':'.
bool IsHeaderField(std::string_view line) {
  std::size_t i = 0;
  while (i < line.size() && line[i] > ' ' && line[i] < 0x7F && line[i] != ':') ++i;
  if (i == 0) return false;
  while (i < line.size() && (line[i] == ' ' || line[i] == '\t')) ++i;
  return i < line.size() && line[i] == ':';
}

}  // namespace

StructureCut MeasureStructure(std::string_view message, const MailLimits& limits) {
  StructureCut cut;
  std::size_t headerLines = 0;
  std::size_t headerBytes = 0;
  std::size_t headerParams = 0;
  std::size_t delimiterLines = 0;
  bool headerPossible = true;  // a header block may start or go on at this line
  bool inField = false;        // the previous line was a counted header line
  std::size_t pos = 0;
  while (pos < message.size()) {
    const char* start = message.data() + pos;
    const void* lf = std::memchr(start, '\n', message.size() - pos);
    const std::size_t next =
        lf == nullptr ? message.size()
                      : static_cast<std::size_t>(static_cast<const char*>(lf) - message.data()) + 1;
    std::string_view line = message.substr(pos, next - pos);
    while (!line.empty() && (line.back() == '\n' || line.back() == '\r')) line.remove_suffix(1);

    std::uint32_t over = 0;
    if (line.starts_with("--")) {
      if (++delimiterLines > limits.maxDelimiterLines) over = Bit(Limit::kDelimiterLines);
      headerPossible = true;
      inField = false;
    } else if (line.empty()) {
      headerPossible = true;
      inField = false;
    } else if (headerPossible &&
               (IsHeaderField(line) || (inField && (line[0] == ' ' || line[0] == '\t')))) {
      inField = true;
      headerBytes += line.size();
      headerParams += static_cast<std::size_t>(std::count(line.begin(), line.end(), ';'));
      if (++headerLines > limits.maxHeaderLines) {
        over = Bit(Limit::kHeaderLines);
      } else if (headerBytes > limits.maxHeaderBytes) {
        over = Bit(Limit::kHeaderBytes);
      } else if (headerParams > limits.maxHeaderParams) {
        over = Bit(Limit::kHeaderParams);
      }
    } else {
      headerPossible = false;
      inField = false;
    }
    if (over != 0) {
      cut.length = pos;
      cut.limit = over;
      return cut;
    }
    pos = next;
  }
  cut.length = message.size();
  return cut;
}

}  // namespace pelmix::mail
