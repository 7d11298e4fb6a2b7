// Case folding and the normalisation of lexeme-database lines.
#include "engine/kb/case_fold.h"

#include <gtest/gtest.h>

namespace {

constexpr char32_t kOutside = 0xFFFFFFFF;

char32_t Fold(char32_t cp) { return lex::FoldCodePoint(cp).value_or(kOutside); }

TEST(CaseFold, RangesAndTheirEdges) {
  const std::pair<char32_t, char32_t> cases[] = {
      // Cyrillic: U+0410..U+042F add 0x20, U+0400..U+040F add 0x50.
      {0x0410, 0x0430},
      {0x042F, 0x044F},
      {0x0400, 0x0450},
      {0x040F, 0x045F},
      {0x0430, kOutside},
      {0x0460, kOutside},
      // Greek: U+0391..U+03A9 add 0x20, the unassigned U+03A2 included.
      {0x0391, 0x03B1},
      {0x03A9, 0x03C9},
      {0x03A2, 0x03C2},
      {0x0390, kOutside},
      {0x03AA, kOutside},
      // Latin: the simple lower-case mapping of U+00C0..U+024F.
      {0x00C0, 0x00E0},
      {0x00DE, 0x00FE},
      {0x00D7, 0x00D7},
      {0x00DF, 0x00DF},
      {0x00E0, 0x00E0},
      {0x0100, 0x0101},
      {0x0178, 0x00FF},
      {0x0186, 0x0254},
      {0x01C4, 0x01C6},
      {0x01C5, 0x01C6},
      {0x023A, 0x2C65},
      {0x0243, 0x0180},
      {0x024E, 0x024F},
      {0x00BF, kOutside},
      {0x0250, kOutside},
      {'A', kOutside},
  };
  for (const auto& [from, to] : cases)
    EXPECT_EQ(Fold(from), to) << std::hex << static_cast<std::uint32_t>(from);
}

TEST(CaseFold, LatinTableExceptions) {
  EXPECT_EQ(Fold(0x0130), 0x0131u);
  EXPECT_EQ(Fold(0x018E), 0x0258u);
  EXPECT_EQ(Fold(0x023C), 0x02C4u);
  for (const char32_t kept : {0x0181, 0x0189, 0x018F, 0x0190, 0x0196, 0x019F, 0x01A6, 0x01A9,
                              0x01AE, 0x01B1, 0x01B7, 0x01F6, 0x01F7, 0x0220}) {
    EXPECT_EQ(Fold(kept), kept) << std::hex << static_cast<std::uint32_t>(kept);
  }
}

TEST(CaseFold, NormalizeLine) {
  const std::pair<std::string, std::string> cases[] = {
      {"PayPal 50 101", "paypal 50 101"},
      {"\xD0\x9F\xD0\x90\xD0\xA0\xD0\x9E\xD0\x9B\xD0\xAC",  // ПАРОЛЬ
       "\xD0\xBF\xD0\xB0\xD1\x80\xD0\xBE\xD0\xBB\xD1\x8C"},
      {"\xCE\xA3\xCE\xA9", "\xCF\x83\xCF\x89"},  // ΣΩ
      {"\xC3\x80\xC4\xB0", "\xC3\xA0\xC4\xB1"},  // Àİ
      // A lead byte takes the next bytes whatever they are: 0xD0 'A' is U+0401, folded.
      {"\xD0"
       "AB",
       "\xD1\x91"
       "b"},
      {"\xC3\x17", "\xC3\x97"},            // U+00D7 is in the Latin range: re-encoded
      {"\xC1\x81x", "\xC1\x81x"},          // U+0041 written long: outside the ranges, copied
      {"\xE4\xB8\xAD!", "\xE4\xB8\xAD!"},  // U+4E2D: copied
      {"\xF0\x9F\x98\x80", "\xF0\x9F\x98\x80"},
      {"ab\xD0", "ab"},  // cut off by the end of the line: dropped
      {"ab\xE4\xB8", "ab"},
      {"\x80Z\xBF", "\x80z\xBF"},  // stray continuation bytes stay
      {"\xF8Q\xFF", "\xF8q\xFF"},
      {"", ""},
  };
  for (const auto& [line, normalised] : cases) EXPECT_EQ(lex::NormalizeLine(line), normalised);
}

TEST(CaseFold, Utf8Encoding) {
  std::string out;
  for (const char32_t cp : {0x24u, 0xA2u, 0x20ACu, 0x10348u}) lex::AppendUtf8(out, cp);
  EXPECT_EQ(out, "\x24\xC2\xA2\xE2\x82\xAC\xF0\x90\x8D\x88");
}

}  // namespace
