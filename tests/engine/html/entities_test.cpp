#include "engine/html/entities.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <string_view>

namespace {

// Decodes one UTF-8 sequence of at most three bytes.
std::uint32_t CodePoint(const char* utf8, std::size_t n) {
  const auto* b = reinterpret_cast<const unsigned char*>(utf8);
  if (n == 1) return b[0];
  if (n == 2) return ((b[0] & 0x1Fu) << 6) | (b[1] & 0x3Fu);
  return ((b[0] & 0x0Fu) << 12) | ((b[1] & 0x3Fu) << 6) | (b[2] & 0x3Fu);
}

// Decodes `reference` (the bytes between '&' and ';'); "fail" when decoding fails.
std::string Decode(std::string_view reference) {
  std::string buffer(reference);
  std::size_t count = buffer.size();
  buffer.resize(std::max(count, html::kMaxDecodedReferenceBytes), '?');
  if (!html::decodeReference(buffer.data(), count)) return "fail";
  return buffer.substr(0, count);
}

TEST(EntityTable, HoldsTheHtml4SetsPlusAposSortedByName) {
  const auto table = html::entityTable();
  ASSERT_EQ(table.size(), 253u);
  for (std::size_t i = 0; i < table.size(); ++i) {
    const html::EntityRecord& r = table[i];
    ASSERT_NE(std::memchr(r.name, '\0', sizeof r.name), nullptr);
    EXPECT_LE(std::strlen(r.name), 8u);
    EXPECT_GE(r.length, 1u);
    EXPECT_LE(r.length, html::kMaxDecodedReferenceBytes);
    if (i > 0) {
      EXPECT_LT(std::string_view(table[i - 1].name), std::string_view(r.name)) << r.name;
    }
  }
}

TEST(EntityTable, SampleCodePointsOfEachSet) {
  const std::pair<const char*, std::uint32_t> samples[] = {
      {"nbsp", 0xA0},    {"iquest", 0xBF},  {"AElig", 0xC6},   {"yuml", 0xFF},       // Latin-1
      {"fnof", 0x192},   {"Omega", 0x3A9},  {"sigmaf", 0x3C2}, {"thetasym", 0x3D1},  // symbols
      {"image", 0x2111}, {"crarr", 0x21B5}, {"sdot", 0x22C5},  {"diams", 0x2666},
      {"quot", 0x22},    {"OElig", 0x152},  {"tilde", 0x2DC},  {"euro", 0x20AC},  // special
      {"apos", 0x27}};
  for (const auto& [name, code] : samples) {
    const std::string decoded = Decode(name);
    ASSERT_NE(decoded, "fail") << name;
    EXPECT_EQ(CodePoint(decoded.data(), decoded.size()), code) << name;
  }
}

TEST(EntityTable, NamedReferencesAreCaseSensitiveAndExact) {
  EXPECT_EQ(Decode("lt"), "<");
  EXPECT_EQ(Decode("Lt"), "fail");
  EXPECT_EQ(Decode("ltx"), "fail");
  EXPECT_EQ(Decode("l"), "fail");
  EXPECT_EQ(Decode("Eacute"), "\xC3\x89");
  EXPECT_EQ(Decode("eacute"), "\xC3\xA9");
  EXPECT_EQ(Decode("ne"), "\xE2\x89\xA0");  // a two-byte name decoding to three bytes
  EXPECT_EQ(Decode(""), "fail");
  EXPECT_EQ(Decode(std::string("lt\0", 3)), "fail");
}

TEST(EntityTable, NumericReferences) {
  EXPECT_EQ(Decode("#233"), "\xC3\xA9");
  EXPECT_EQ(Decode("#x20AC"), "\xE2\x82\xAC");
  EXPECT_EQ(Decode("#x20ac"), "\xE2\x82\xAC");
  EXPECT_EQ(Decode("#00060"), "<");
  EXPECT_EQ(Decode("#000060"), "fail");             // six digits
  EXPECT_EQ(Decode("#65601"), "A");                 // 65601 cut to 16 bits is 65
  EXPECT_EQ(Decode("#X41"), std::string(1, '\0'));  // upper-case X reads as decimal: no number
  EXPECT_EQ(Decode("#12a"), std::string(1, '\0'));
  EXPECT_EQ(Decode("#xG1"), std::string(1, '\0'));
  EXPECT_EQ(Decode("#"), std::string(1, '\0'));
  EXPECT_EQ(Decode("#x"), std::string(1, '\0'));
  EXPECT_EQ(Decode("#xD800"), "fail");
  EXPECT_EQ(Decode("#57343"), "fail");  // U+DFFF
  EXPECT_EQ(Decode("#xFFFF"), "\xEF\xBF\xBF");
}

TEST(EntityTable, Utf8Boundaries) {
  char out[3];
  const std::pair<std::uint16_t, std::size_t> cases[] = {
      {0x00, 1},   {0x7F, 1},   {0x80, 2},   {0x7FF, 2},  {0x800, 3},
      {0xD7FF, 3}, {0xD800, 0}, {0xDFFF, 0}, {0xE000, 3}, {0xFFFF, 3}};
  for (const auto& [unit, length] : cases) {
    ASSERT_EQ(html::encodeUtf8(unit, out), length) << unit;
    if (length > 0) {
      EXPECT_EQ(CodePoint(out, length), unit) << unit;
    }
  }
}

}  // namespace
