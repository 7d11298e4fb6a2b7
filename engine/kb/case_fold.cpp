#include "engine/kb/case_fold.h"

#include <cstdint>

namespace lex {
namespace {

constexpr char32_t kLatinFirst = 0x00C0;
constexpr char32_t kLatinLast = 0x024F;

constexpr std::int16_t kLatinDeltas[kLatinLast - kLatinFirst + 1] = {
#include "engine/kb/latin_fold_table.inc"
};

// The length of the sequence a byte opens (2 to 4), or 0.
int SequenceLength(unsigned char byte) {
  if (byte >= 0xC0 && byte <= 0xDF) return 2;
  if (byte >= 0xE0 && byte <= 0xEF) return 3;
  if (byte >= 0xF0 && byte <= 0xF7) return 4;
  return 0;
}

}  // namespace

std::optional<char32_t> FoldCodePoint(char32_t cp) {
  if (cp >= 0x0410 && cp <= 0x042F) return cp + 0x20;
  if (cp >= 0x0400 && cp <= 0x040F) return cp + 0x50;
  if (cp >= 0x0391 && cp <= 0x03A9) return cp + 0x20;
  if (cp >= kLatinFirst && cp <= kLatinLast) {
    return static_cast<char32_t>(static_cast<std::int32_t>(cp) + kLatinDeltas[cp - kLatinFirst]);
  }
  return std::nullopt;
}

std::string NormalizeLine(std::string_view line) {
  std::string out;
  out.reserve(line.size());
  for (std::size_t i = 0; i < line.size();) {
    const auto byte = static_cast<unsigned char>(line[i]);
    const int length = SequenceLength(byte);
    if (length == 0) {
      out += (byte >= 'A' && byte <= 'Z') ? static_cast<char>(byte - 'A' + 'a')
                                          : static_cast<char>(byte);
      ++i;
      continue;
    }
    if (line.size() - i < static_cast<std::size_t>(length)) break;  // cut off: dropped
    char32_t cp = byte & (0x7F >> length);
    for (int k = 1; k < length; ++k) {
      cp = (cp << 6) | (static_cast<unsigned char>(line[i + k]) & 0x3F);
    }
    if (const std::optional<char32_t> folded = FoldCodePoint(cp)) {
      AppendUtf8(out, *folded);
    } else {
      out.append(line.substr(i, static_cast<std::size_t>(length)));
    }
    i += static_cast<std::size_t>(length);
  }
  return out;
}

}  // namespace lex
