// Case folding of the lexeme database and of the word finder that matches page text
// against it, so that both fold a word the same way.
//
// Folded ranges: U+0410-U+042F add 0x20, U+0400-U+040F add 0x50, U+0391-U+03A9 add 0x20,
// U+00C0-U+024F take the delta of the Latin table (latin_fold_table.inc). A code point in
// one of these ranges is "folded" even when its delta is 0: whoever re-encodes folded code
// points re-encodes it too.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "framework/uvo/text.h"

namespace lex {

// The folded code point, or nothing when `cp` lies outside the folded ranges.
std::optional<char32_t> FoldCodePoint(char32_t cp);

// Appends the UTF-8 form of `cp` (at most U+10FFFF is expected; higher values are written
// with the four-byte pattern, keeping their low 21 bits).
using uvo::AppendUtf8;

// The normalisation of one lexeme-database line: ASCII capitals are lower-cased; a byte of
// 0xC0-0xF7 opens a sequence of 2 to 4 bytes whose next bytes are taken as its continuation
// bytes whatever their value (their low six bits count); a complete sequence whose code
// point is in a folded range is replaced by the folded code point in UTF-8, any other is
// copied as it was; a sequence cut off by the end of the line is dropped; every other byte
// is copied unchanged.
std::string NormalizeLine(std::string_view line);

}  // namespace lex
