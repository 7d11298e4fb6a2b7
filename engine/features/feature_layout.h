// The one registry of the feature vector: every position the web vector (214 floats) and
// the mail vector (179 page floats, then the mail checker's 81 link floats) hold, named
// once. Code that fills the vector and tests that read it use these names.
//
// Web layout:
//   [0, 147)    three segments (thirds of the page by position) of 49 event bins each
//   [147, 156)  per segment: items of completed phrases, items of script phrases and nested
//               words, each per position of the segment
//   [156, 160)  style sheet of an organisation, title names one, description names one,
//               title missing (1) or shorter than 3 bytes (0.5)
//   [160, 162)  an organisation of the title / description also named in the page text
//   [162, 164)  some domain with kinds (text, resource) / (text, script text)
//   164         completed phrase items per word of the title
//   [165, 168)  some domain with kinds (text, own) / (resource, own) / (script text, own)
//   [168, 173)  page URL: host has lexemes, host is an IP address, path length, host
//               length, dots in host (web only)
//   173         bytes fed
//   [174, 180)  the three most-hit domains' link classes: (financial, account) each
//   [180, 184)  page on a white domain, then whether each of the three is the page's own
//   [184, 214)  page host: 10 values each of plain lexeme cover, organisation lexeme
//               cover and character-class changes (web only)
// The mail vector drops the two web-only ranges (179 floats) and appends the link block.
#pragma once

#include <array>
#include <cstddef>
#include <string>
#include <string_view>

namespace html_features {

// The event codes.
enum EventCode : int {
  kEvLinkClass0 = 0,  // 0, 1, 3: anchor to a foreign organisation's domain by link class
  kEvLinkClass1 = 1,
  kEvUrlPlainLexeme = 2,  // anchor or frame URL with lexemes, none of an organisation
  kEvLinkClass3 = 3,
  kEvScriptSrcFinancial = 4,
  kEvLinkDomain = 5,        // 5 + domain index (0..7): anchor or script src to that domain
  kEvUrlOrgLexeme = 13,     // 13 + domain index: URL or anchor text naming that domain
  kEvScriptUrlDomain = 21,  // 21 + domain index: URL in script text of that domain
  kEvScriptUrlOther = 28,
  kEvScriptUrlUnknown = 29,
  kEvAnchorTextOrg = 30,
  kEvAnchorTextUrl = 31,
  kEvAnchorUnknownHost = 32,
  kEvAnchorTextHost = 33,
  kEvResource = 34,
  kEvResourceForeignOrg = 35,
  kEvResourceOwn = 36,
  kEvFormForeign = 37,
  kEvNestedWord = 38,
  kEvLexeme = 39,  // 39..41 by weight band
  kEvPhrase = 42,  // 42..44 by weight band
  kEvPhraseItems = 45,
  kEvTitleLexemes = 46,
  kEvTitlePhrases = 47,
  kEvTextOrg = 49,       // 49 + domain index
  kEvScriptLexeme = 57,  // 57..59 by weight band
  kEvScriptPhrase = 60,
  kEvScriptPhraseItems = 61,
  kEvFrame = 62,
  kEvInputAfterSensitive = 63,
  kEvInput = 64,
};
inline constexpr int kDomainSlots = 8;  // 7 domains and "other"

inline constexpr std::size_t kCodesPerSegment = 65;
inline constexpr std::size_t kBinsPerSegment = 49;  // after the per-domain re-ordering
inline constexpr std::size_t kSegmentCount = 3;

// Positions of the web vector.
inline constexpr std::size_t kSegmentsBegin = 0;
inline constexpr std::size_t kSegmentRatiosBegin = 147;  // 3 per segment
inline constexpr std::size_t kStyleSheetOrg = 156;
inline constexpr std::size_t kTitleNamesOrg = 157;
inline constexpr std::size_t kDescriptionNamesOrg = 158;
inline constexpr std::size_t kTitleMissing = 159;
inline constexpr std::size_t kTitleOrgInText = 160;
inline constexpr std::size_t kDescriptionOrgInText = 161;
inline constexpr std::size_t kKindsTextResource = 162;
inline constexpr std::size_t kKindsTextScript = 163;
inline constexpr std::size_t kTitlePhraseItemsPerWord = 164;
inline constexpr std::size_t kKindsTextOwn = 165;
inline constexpr std::size_t kKindsResourceOwn = 166;
inline constexpr std::size_t kKindsScriptOwn = 167;
inline constexpr std::size_t kUrlRecordBegin = 168;  // 5 floats, web only
inline constexpr std::size_t kUrlRecordSize = 5;
inline constexpr std::size_t kByteCount = 173;
inline constexpr std::size_t kDomainClassesBegin = 174;  // 3 x (financial, account)
inline constexpr std::size_t kWhitePage = 180;
inline constexpr std::size_t kOwnDomainBegin = 181;   // 3 floats
inline constexpr std::size_t kHostFloatsBegin = 184;  // 30 floats, web only
inline constexpr std::size_t kHostChannelSize = 10;
inline constexpr std::size_t kWebVectorSize = 214;

// The mail vector: the page part without the two web-only ranges, then the link block.
inline constexpr std::size_t kMailPageVectorSize = kWebVectorSize - kUrlRecordSize - 30;
inline constexpr std::size_t kMailLinkBlockSize = 81;
inline constexpr std::size_t kMailVectorSize = kMailPageVectorSize + kMailLinkBlockSize;
static_assert(kMailPageVectorSize == 179 && kMailVectorSize == 260);

// Where a web position lies in the mail vector (positions before the URL record keep their
// place, those between it and the host floats move 5 down); npos for the web-only ranges.
constexpr std::size_t MailPosition(std::size_t web) {
  if (web < kUrlRecordBegin) return web;
  if (web < kUrlRecordBegin + kUrlRecordSize || web >= kHostFloatsBegin) return std::size_t(-1);
  return web - kUrlRecordSize;
}

// The codes a segment keeps, in vector order: the per-domain bins of indexes 3 to 6 are
// dropped; slots 5..7, 13..15, 21..23 and 49..51 then hold the three most-hit domains.
inline constexpr std::array<int, kBinsPerSegment> kKeptCodes = {
    0,  1,  2,  3,  4,  5,  6,  7,  12, 13, 14, 15, 20, 21, 22, 23, 28,
    29, 30, 31, 32, 33, 34, 35, 36, 37, 38, 39, 40, 41, 42, 43, 44, 45,
    46, 47, 48, 49, 50, 51, 56, 57, 58, 59, 60, 61, 62, 63, 64};

// The vector position of `code` in segment `segment` (0..2); npos for a dropped code.
constexpr std::size_t SegmentBin(std::size_t segment, int code) {
  for (std::size_t i = 0; i < kBinsPerSegment; ++i)
    if (kKeptCodes[i] == code) return kSegmentsBegin + segment * kBinsPerSegment + i;
  return std::size_t(-1);
}

// One line's meaning of every position: `index` of the web vector (mail = false) or of
// the mail vector (mail = true; positions from 179 on are the link block).
std::string FeatureName(std::size_t index, bool mail);

}  // namespace html_features
