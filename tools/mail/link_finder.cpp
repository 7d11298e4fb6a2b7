#include "tools/mail/link_finder.h"

namespace pelmix::mail {
namespace {

bool IsAsciiAlnum(unsigned char c) {
  return (c >= '0' && c <= '9') || ((c | 0x20) >= 'a' && (c | 0x20) <= 'z');
}

bool StartsWithNoCase(std::string_view text, std::size_t at, std::string_view prefix) {
  if (text.size() - at < prefix.size()) return false;
  for (std::size_t i = 0; i < prefix.size(); ++i) {
    if ((static_cast<unsigned char>(text[at + i]) | 0x20) != static_cast<unsigned char>(prefix[i]))
      return false;
  }
  return true;
}

// Length of the stop sequence at `at`, or 0 when the byte there may be part of a link.
std::size_t StopAt(std::string_view text, std::size_t at) {
  const auto c = static_cast<unsigned char>(text[at]);
  if (c <= ' ' || c == 0x7F || c == '<' || c == '>' || c == '"') return 1;
  if (c == 0xC2 && at + 1 < text.size() && static_cast<unsigned char>(text[at + 1]) == 0xA0)
    return 2;                                                       // U+00A0
  if (c == 0xE3 && text.substr(at, 3) == "\xE3\x80\x80") return 3;  // U+3000
  return 0;
}

// Drops trailing punctuation, and closing brackets that have no opening one in the link.
// Brackets are counted once, so a run of closers costs linear time.
std::size_t TrimEnd(std::string_view link) {
  static constexpr std::string_view kOpen = "([{";
  static constexpr std::string_view kClose = ")]}";
  std::ptrdiff_t balance[3] = {0, 0, 0};  // openers minus closers, per bracket kind
  for (const char c : link) {
    for (std::size_t k = 0; k < 3; ++k) balance[k] += (c == kOpen[k]) - (c == kClose[k]);
  }
  std::size_t end = link.size();
  while (end > 0) {
    const char c = link[end - 1];
    const std::size_t k = kClose.find(c);
    if (k != std::string_view::npos) {
      if (balance[k] >= 0) break;
      ++balance[k];
      --end;
      continue;
    }
    if (c == '.' || c == ',' || c == ';' || c == ':' || c == '!' || c == '?' || c == '\'' ||
        c == '*') {
      --end;
      continue;
    }
    break;
  }
  return end;
}

}  // namespace

void FindLinks(std::string_view text, const std::function<void(std::string_view)>& onLink,
               std::string& scratch) {
  std::size_t i = 0;
  while (i < text.size()) {
    const auto c = static_cast<unsigned char>(text[i]) | 0x20;
    if (c != 'h' && c != 'w') {
      ++i;
      continue;
    }
    const auto before =
        i == 0 ? static_cast<unsigned char>(' ') : static_cast<unsigned char>(text[i - 1]);
    std::size_t prefix = 0;
    bool www = false;
    if (c == 'h' && !IsAsciiAlnum(before)) {
      if (StartsWithNoCase(text, i, "http://")) prefix = 7;
      if (StartsWithNoCase(text, i, "https://")) prefix = 8;
    } else if (c == 'w' && !IsAsciiAlnum(before) && before < 0x80 && before != '.' &&
               before != '-' && before != '_' && before != '@' && before != '/' && before != ':' &&
               StartsWithNoCase(text, i, "www.")) {
      prefix = 4;
      www = true;
    }
    if (prefix == 0) {
      ++i;
      continue;
    }
    std::size_t end = i + prefix;
    while (end < text.size() && StopAt(text, end) == 0) ++end;
    const std::string_view candidate = text.substr(i, end - i);
    const std::string_view link = candidate.substr(0, TrimEnd(candidate));
    // The host must start right after the prefix: a letter, a digit, an IPv6 '[' or a
    // non-ASCII (internationalised) character.
    if (link.size() > prefix) {
      const auto first = static_cast<unsigned char>(link[prefix]);
      if (IsAsciiAlnum(first) || first >= 0x80 || (!www && first == '[')) {
        if (www) {
          scratch.assign("http://");
          scratch.append(link);
          onLink(scratch);
        } else {
          onLink(link);
        }
      }
    }
    i = end;
  }
}

}  // namespace pelmix::mail
