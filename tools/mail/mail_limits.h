// Budgets of the mail walk. Every message is hostile: each quantity an attacker controls has a
// named ceiling here, and hitting one is reported (Limit) instead of failing the message.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace pelmix::mail {

// Bytes of one message read from the input; the rest (up to the next mbox separator) is
// skipped. A mail filter's usual ceiling is 10 to 50 MB.
inline constexpr std::size_t kMaxMessageBytes = 32u << 20;

// GMime builds an object per header, parameter and part, at a few hundred bytes to over a
// kilobyte each, so a small message can cost gigabytes. Before parsing, the message is cut at
// the first line where one of these runs out (header lines, their bytes and ';' separators,
// and delimiter lines, which bound the number of parts; see structure_budget.h).
inline constexpr std::size_t kMaxHeaderLines = 20000;
inline constexpr std::size_t kMaxHeaderBytes = 2u << 20;
inline constexpr std::size_t kMaxHeaderParams = 20000;
inline constexpr std::size_t kMaxDelimiterLines = 20000;

// MIME objects (multiparts, messages, leaves) visited per message; the walk stops after it.
inline constexpr std::size_t kMaxParts = 1000;
// Nesting of multiparts and embedded messages; deeper objects are skipped. A forward adds
// about three levels.
inline constexpr int kMaxDepth = 24;
// Decoded bytes handed over per part; the rest is cut.
inline constexpr std::size_t kMaxPartBytes = 32u << 20;
// Subject bytes handed over (cut on a UTF-8 character boundary).
inline constexpr std::size_t kMaxSubjectBytes = 16u << 10;
// Distinct links of the plain-text parts per message, and bytes per link (longer ones are cut).
inline constexpr std::size_t kMaxLinksPerMessage = 1000;
inline constexpr std::size_t kMaxLinkBytes = 4096;

// The budgets of one walk; tests shrink them to reach them cheaply.
struct MailLimits {
  std::size_t maxMessageBytes = kMaxMessageBytes;
  std::size_t maxHeaderLines = kMaxHeaderLines;
  std::size_t maxHeaderBytes = kMaxHeaderBytes;
  std::size_t maxHeaderParams = kMaxHeaderParams;
  std::size_t maxDelimiterLines = kMaxDelimiterLines;
  std::size_t maxParts = kMaxParts;
  int maxDepth = kMaxDepth;
  std::size_t maxPartBytes = kMaxPartBytes;
  std::size_t maxSubjectBytes = kMaxSubjectBytes;
  std::size_t maxLinks = kMaxLinksPerMessage;
  std::size_t maxLinkBytes = kMaxLinkBytes;
};

// Which budgets a message ran into: bits of WalkReport::limits.
enum class Limit : std::uint32_t {
  kMessageSize = 1u << 0,
  kHeaderLines = 1u << 1,
  kHeaderBytes = 1u << 2,
  kHeaderParams = 1u << 3,
  kDelimiterLines = 1u << 4,
  kParts = 1u << 5,
  kDepth = 1u << 6,
  kPartSize = 1u << 7,
  kSubjectSize = 1u << 8,
  kLinks = 1u << 9,
  kLinkSize = 1u << 10,
};
inline constexpr int kLimitCount = 11;

inline constexpr std::uint32_t Bit(Limit limit) { return static_cast<std::uint32_t>(limit); }

// A short stable name for reports: "message size", "parts", ...
std::string_view LimitName(Limit limit);

}  // namespace pelmix::mail
