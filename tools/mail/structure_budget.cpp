#include "tools/mail/structure_budget.h"

#include <algorithm>
#include <cstring>
#include <string>
#include <vector>

namespace pelmix::mail {
namespace {

// Declared boundaries remembered to tell delimiter lines from text that starts with "--".
// Past this many, or after a longer one, every "--" line counts, which only makes the budget
// stricter.
constexpr std::size_t kTrackedBoundaries = 64;
constexpr std::size_t kMaxBoundaryBytes = 200;

char Lower(char c) { return (c >= 'A' && c <= 'Z') ? static_cast<char>(c + 32) : c; }

bool StartsWithNoCase(std::string_view text, std::string_view prefix) {
  if (text.size() < prefix.size()) return false;
  for (std::size_t i = 0; i < prefix.size(); ++i) {
    if (Lower(text[i]) != prefix[i]) return false;
  }
  return true;
}

std::size_t FindNoCase(std::string_view text, std::string_view needle) {
  for (std::size_t i = 0; i + needle.size() <= text.size(); ++i) {
    if (StartsWithNoCase(text.substr(i), needle)) return i;
  }
  return std::string_view::npos;
}

// Length of the field name when the line is "name:" with optional blanks before ':', else 0.
std::size_t HeaderFieldName(std::string_view line) {
  std::size_t i = 0;
  while (i < line.size() && line[i] > ' ' && line[i] < 0x7F && line[i] != ':') ++i;
  const std::size_t name = i;
  if (name == 0) return 0;
  while (i < line.size() && (line[i] == ' ' || line[i] == '\t')) ++i;
  return i < line.size() && line[i] == ':' ? name : 0;
}

class Boundaries {
 public:
  // Remembers the value of a "boundary=" parameter on the line, if there is one.
  void Collect(std::string_view line) {
    const std::size_t at = FindNoCase(line, "boundary=");
    if (at == std::string_view::npos) return;
    std::string_view value = line.substr(at + 9);
    if (!value.empty() && value[0] == '"') {
      value.remove_prefix(1);
      value = value.substr(0, value.find('"'));
    } else {
      value = value.substr(0, value.find_first_of("; \t"));
    }
    if (value.empty()) return;
    if (std::find(known_.begin(), known_.end(), value) != known_.end()) return;
    if (known_.size() == kTrackedBoundaries || value.size() > kMaxBoundaryBytes) {
      overflow_ = true;
      return;
    }
    known_.emplace_back(value);
  }

  // 0: not a delimiter; 1: a delimiter; 2: a closing delimiter. As for the parser, only
  // blanks may follow the boundary (or "--" and anything, closing).
  int Classify(std::string_view line) const {
    if (!line.starts_with("--")) return 0;
    const std::string_view rest = line.substr(2);
    for (const std::string& boundary : known_) {
      if (!rest.starts_with(boundary)) continue;
      const std::string_view after = rest.substr(boundary.size());
      if (after.starts_with("--")) return 2;
      if (after.find_first_not_of(" \t") == std::string_view::npos) return 1;
    }
    return overflow_ ? 1 : 0;
  }

 private:
  std::vector<std::string> known_;
  bool overflow_ = false;
};

}  // namespace

StructureCut MeasureStructure(std::string_view message, const MailLimits& limits) {
  StructureCut cut;
  std::size_t headerLines = 0;
  std::size_t headerBytes = 0;
  std::size_t headerParams = 0;
  std::size_t delimiterLines = 0;
  Boundaries boundaries;
  bool inHeaders = true;       // GMime reads this line as part of a header block
  bool inField = false;        // the previous line was a counted header line
  bool inContentType = false;  // ... and belongs to a Content-Type field
  bool embedded = false;       // that field names a message/* type: its body starts with headers
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
    if (inHeaders) {
      const std::size_t name = HeaderFieldName(line);
      if (line.empty()) {
        inHeaders = embedded;
        embedded = inField = inContentType = false;
      } else if (name > 0 || (inField && (line[0] == ' ' || line[0] == '\t'))) {
        inField = true;
        headerBytes += line.size();
        headerParams += static_cast<std::size_t>(std::count(line.begin(), line.end(), ';'));
        if (++headerLines > limits.maxHeaderLines) {
          over = Bit(Limit::kHeaderLines);
        } else if (headerBytes > limits.maxHeaderBytes) {
          over = Bit(Limit::kHeaderBytes);
        } else if (headerParams > limits.maxHeaderParams) {
          over = Bit(Limit::kHeaderParams);
        } else {
          // Searched only within the header budget, so the searches stay cheap.
          if (name > 0) inContentType = StartsWithNoCase(line.substr(0, name), "content-type");
          if (inContentType && FindNoCase(line, "message/") != std::string_view::npos) {
            embedded = true;
          }
          boundaries.Collect(line);
        }
      } else {
        // Not a header line: the block is over and this line is body.
        inHeaders = embedded = inField = inContentType = false;
      }
    }
    if (!inHeaders && over == 0) {
      if (const int delimiter = boundaries.Classify(line); delimiter != 0) {
        if (++delimiterLines > limits.maxDelimiterLines) over = Bit(Limit::kDelimiterLines);
        inHeaders = delimiter == 1;  // a part's headers follow; none after the closing one
      }
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
