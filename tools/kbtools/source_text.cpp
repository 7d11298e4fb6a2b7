#include "tools/kbtools/source_text.h"

namespace pelmix::kbtools {
namespace {

bool IsSeparator(char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\v' || c == '\f'; }

int DigitValue(char c, int base) {
  int value = -1;
  if (c >= '0' && c <= '9') value = c - '0';
  if (c >= 'a' && c <= 'f') value = c - 'a' + 10;
  if (c >= 'A' && c <= 'F') value = c - 'A' + 10;
  return value < base ? value : -1;
}

}  // namespace

std::vector<SourceLine> ReadSourceLines(std::string_view text) {
  std::vector<SourceLine> lines;
  std::size_t number = 0;
  while (!text.empty()) {
    const std::size_t end = text.find('\n');
    std::string_view line = text.substr(0, end);
    text = end == std::string_view::npos ? std::string_view() : text.substr(end + 1);
    ++number;
    line = line.substr(0, line.find('#'));
    SourceLine parsed;
    parsed.number = number;
    for (std::size_t i = 0; i < line.size();) {
      if (IsSeparator(line[i])) {
        ++i;
        continue;
      }
      std::size_t j = i;
      while (j < line.size() && !IsSeparator(line[j])) ++j;
      parsed.fields.push_back(line.substr(i, j - i));
      i = j;
    }
    if (!parsed.fields.empty()) lines.push_back(std::move(parsed));
  }
  return lines;
}

std::optional<std::uint64_t> ParseNumber(std::string_view text, std::uint64_t max,
                                         bool hex_allowed) {
  int base = 10;
  if (hex_allowed && text.size() > 2 && text[0] == '0' && (text[1] == 'x' || text[1] == 'X')) {
    base = 16;
    text.remove_prefix(2);
  }
  if (text.empty()) return std::nullopt;
  std::uint64_t value = 0;
  for (const char c : text) {
    const int digit = DigitValue(c, base);
    if (digit < 0) return std::nullopt;
    if (value > (max - static_cast<std::uint64_t>(digit)) / static_cast<std::uint64_t>(base)) {
      return std::nullopt;
    }
    value = value * static_cast<std::uint64_t>(base) + static_cast<std::uint64_t>(digit);
  }
  return value;
}

std::string LowerAscii(std::string_view text) {
  std::string lower(text);
  for (char& c : lower) {
    if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
  }
  return lower;
}

}  // namespace pelmix::kbtools
