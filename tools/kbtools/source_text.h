// Reading the text sources of the knowledge-base writers: lines of whitespace-separated
// fields, "#" starting a comment, blank lines skipped, and errors that name file and line.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace pelmix::kbtools {

// "FILE:LINE: message".
class SourceError : public std::runtime_error {
 public:
  SourceError(const std::string& file, std::size_t line, const std::string& message)
      : std::runtime_error(file + ":" + std::to_string(line) + ": " + message) {}
};

struct SourceLine {
  std::size_t number = 0;                // 1-based
  std::vector<std::string_view> fields;  // views into the text
};

// The lines of `text` that hold a field, comments removed. Lines end at LF; a CR before it
// and blanks, tabs and CRs between fields are separators.
std::vector<SourceLine> ReadSourceLines(std::string_view text);

// A decimal number, or (with `hex_allowed`) "0x" and hexadecimal digits, no larger than
// `max`; nothing for any other text.
std::optional<std::uint64_t> ParseNumber(std::string_view text, std::uint64_t max,
                                         bool hex_allowed = false);

// ASCII letters lower-cased, every other byte kept.
std::string LowerAscii(std::string_view text);

}  // namespace pelmix::kbtools
