#include "engine/features/url_splitter.h"

#include <arpa/inet.h>
#include <idn2.h>
#include <libpsl.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>

namespace html_features {
namespace {

constexpr bool IsAsciiAlpha(char c) { return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z'); }
bool IsAsciiDigit(char c) { return c >= '0' && c <= '9'; }
char LowerAscii(char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c + 32) : c; }
bool IsSlash(char c) { return c == '/' || c == '\\'; }
int HexValue(char c) {
  if (IsAsciiDigit(c)) return c - '0';
  const char l = LowerAscii(c);
  return l >= 'a' && l <= 'f' ? l - 'a' + 10 : -1;
}

// What browsers drop before reading a URL: leading and trailing C0 controls and spaces,
// and every tab, CR and LF. The result is a view of `url` itself when it holds no tab, CR
// or LF (the usual case), else of `buffer`.
std::string_view Clean(std::string_view url, std::string& buffer) {
  std::size_t b = 0, e = url.size();
  while (b < e && static_cast<unsigned char>(url[b]) <= 0x20) ++b;
  while (e > b && static_cast<unsigned char>(url[e - 1]) <= 0x20) --e;
  url = url.substr(b, e - b);
  const auto has = [url](char c) { return std::memchr(url.data(), c, url.size()) != nullptr; };
  if (url.empty() || (!has('\t') && !has('\n') && !has('\r'))) return url;
  buffer.clear();
  for (const char c : url)
    if (c != '\t' && c != '\n' && c != '\r') buffer.push_back(c);
  return buffer;
}

// http or https, in any case. Only 'H' and 'h' give 'h' with the 0x20 bit set, and so on
// for the other letters.
bool IsWebScheme(std::string_view scheme) {
  if (scheme.size() != 4 && scheme.size() != 5) return false;
  const auto lower = [scheme](std::size_t i) { return static_cast<char>(scheme[i] | 0x20); };
  return lower(0) == 'h' && lower(1) == 't' && lower(2) == 't' && lower(3) == 'p' &&
         (scheme.size() == 4 || lower(4) == 's');
}

// Browsers refuse a host that holds any of these once percent-decoded.
constexpr bool IsForbiddenHostByte(unsigned char c) {
  if (c <= 0x20 || c == 0x7F) return true;
  switch (c) {
    case '#':
    case '/':
    case ':':
    case '<':
    case '>':
    case '?':
    case '@':
    case '[':
    case '\\':
    case ']':
    case '^':
    case '|':
    case '%':
      return true;
    default:
      return false;
  }
}

// Per byte of an ASCII host: the byte lower-cased, and whether browsers refuse it.
struct HostByteTables {
  std::array<char, 256> lower{};
  std::array<bool, 256> forbidden{};
};
constexpr HostByteTables kHostBytes = [] {
  HostByteTables t;
  for (unsigned c = 0; c < 256; ++c) {
    t.lower[c] = static_cast<char>(c >= 'A' && c <= 'Z' ? c + 32 : c);
    t.forbidden[c] = IsForbiddenHostByte(static_cast<unsigned char>(c));
  }
  return t;
}();

// The bytes that end a URL's authority: '/', '\\', '?' and '#'.
constexpr std::array<bool, 256> kEndsAuthority = [] {
  std::array<bool, 256> t{};
  t['/'] = t['\\'] = t['?'] = t['#'] = true;
  return t;
}();

bool PercentDecode(std::string_view in, std::string& out) {
  out.clear();
  for (std::size_t i = 0; i < in.size(); ++i) {
    if (in[i] == '%' && i + 2 < in.size() && HexValue(in[i + 1]) >= 0 && HexValue(in[i + 2]) >= 0) {
      out.push_back(static_cast<char>(HexValue(in[i + 1]) * 16 + HexValue(in[i + 2])));
      i += 2;
    } else {
      out.push_back(in[i]);
    }
  }
  return true;
}

// One part of an IPv4 host as browsers read it: decimal, 0x hexadecimal or 0-led octal.
bool ParseIPv4Number(std::string_view s, std::uint64_t& value) {
  int base = 10;
  if (s.size() >= 2 && s[0] == '0' && (s[1] == 'x' || s[1] == 'X')) {
    base = 16;
    s.remove_prefix(2);
  } else if (s.size() >= 2 && s[0] == '0') {
    base = 8;
    s.remove_prefix(1);
  }
  value = 0;
  for (char c : s) {
    const int d = HexValue(c);
    if (d < 0 || d >= base) return false;
    value = value * base + d;
    if (value > 0xFFFFFFFFull) value = 0x100000000ull;  // too large either way
  }
  return true;
}

bool EndsInNumber(std::string_view host) {
  if (!host.empty() && host.back() == '.') host.remove_suffix(1);
  const std::size_t dot = host.rfind('.');
  const std::string_view last = dot == std::string_view::npos ? host : host.substr(dot + 1);
  if (last.empty()) return false;
  bool digits = true;
  for (char c : last) digits = digits && IsAsciiDigit(c);
  if (digits) return true;
  if (last.size() >= 2 && last[0] == '0' && (last[1] == 'x' || last[1] == 'X')) {
    for (char c : last.substr(2))
      if (HexValue(c) < 0) return false;
    return true;
  }
  return false;
}

// Browsers turn a host ending in a number into a dotted IPv4 address, or refuse it.
bool ParseIPv4(std::string_view host, std::string& out) {
  if (!host.empty() && host.back() == '.') host.remove_suffix(1);
  std::array<std::uint64_t, 4> parts{};
  std::size_t n = 0;
  while (true) {
    const std::size_t dot = host.find('.');
    const std::string_view part = host.substr(0, dot);
    if (part.empty() || n == 4 || !ParseIPv4Number(part, parts[n])) return false;
    ++n;
    if (dot == std::string_view::npos) break;
    host.remove_prefix(dot + 1);
  }
  for (std::size_t i = 0; i + 1 < n; ++i)
    if (parts[i] > 255) return false;
  if (parts[n - 1] >= (std::uint64_t{1} << (8 * (5 - n)))) return false;
  std::uint64_t address = parts[n - 1];
  for (std::size_t i = 0; i + 1 < n; ++i) address += parts[i] << (8 * (3 - i));
  char text[16];
  std::snprintf(text, sizeof text, "%u.%u.%u.%u", unsigned(address >> 24 & 255),
                unsigned(address >> 16 & 255), unsigned(address >> 8 & 255),
                unsigned(address & 255));
  out = text;
  return true;
}

// "[...]" in the compressed lower-case form browsers print.
bool ParseIPv6(std::string_view literal, std::string& out) {
  if (literal.size() < 2 || literal.back() != ']') return false;
  const std::string inner(literal.substr(1, literal.size() - 2));
  unsigned char bytes[16];
  if (inet_pton(AF_INET6, inner.c_str(), bytes) != 1) return false;
  std::array<unsigned, 8> pieces{};
  for (int i = 0; i < 8; ++i) pieces[i] = bytes[2 * i] << 8 | bytes[2 * i + 1];
  int best = -1, bestLength = 1;
  for (int i = 0; i < 8;) {
    if (pieces[i] != 0) {
      ++i;
      continue;
    }
    int j = i;
    while (j < 8 && pieces[j] == 0) ++j;
    if (j - i > bestLength) best = i, bestLength = j - i;
    i = j;
  }
  out = "[";
  for (int i = 0; i < 8; ++i) {
    if (i == best) {
      out += i == 0 ? "::" : ":";
      i += bestLength - 1;
      continue;
    }
    char piece[8];
    std::snprintf(piece, sizeof piece, "%x", pieces[i]);
    out += piece;
    if (i != 7) out += ':';
  }
  out += ']';
  return true;
}

struct IdnFree {
  void operator()(char* p) const { idn2_free(p); }
};

// The ASCII form of a host (lower case; IDN labels as punycode) and its Unicode form.
bool ToAsciiHost(std::string_view decoded, std::string& ascii, std::string& unicode) {
  bool nonAscii = false;
  for (char c : decoded) {
    if (static_cast<unsigned char>(c) >= 0x80) {
      nonAscii = true;
      break;
    }
  }
  if (!nonAscii) {
    // Lower-cased and checked in one pass; the host is written whole even when refused
    // (the extractor counts its length and dots either way).
    ascii.resize(decoded.size());
    bool forbidden = false;
    for (std::size_t i = 0; i < decoded.size(); ++i) {
      const auto c = static_cast<unsigned char>(decoded[i]);
      ascii[i] = kHostBytes.lower[c];
      forbidden |= kHostBytes.forbidden[c];
    }
    if (forbidden) return false;
  } else {
    const std::string input(decoded);
    char* converted = nullptr;
    if (idn2_lookup_u8(reinterpret_cast<const std::uint8_t*>(input.c_str()),
                       reinterpret_cast<std::uint8_t**>(&converted),
                       IDN2_NFC_INPUT | IDN2_NONTRANSITIONAL) != IDN2_OK) {
      return false;
    }
    const std::unique_ptr<char, IdnFree> owned(converted);
    ascii = converted;
    for (char c : ascii)
      if (IsForbiddenHostByte(static_cast<unsigned char>(c))) return false;
  }
  unicode = ascii;
  if (!nonAscii && ascii.find("xn--") != std::string::npos) {
    // A punycode label must decode, and encode back to itself, as browsers require.
    char* back = nullptr;
    if (idn2_to_unicode_8z8z(ascii.c_str(), &back, 0) != IDN2_OK || back == nullptr) return false;
    const std::unique_ptr<char, IdnFree> owned(back);
    char* again = nullptr;
    if (idn2_lookup_u8(reinterpret_cast<const std::uint8_t*>(back),
                       reinterpret_cast<std::uint8_t**>(&again),
                       IDN2_NFC_INPUT | IDN2_NONTRANSITIONAL) != IDN2_OK) {
      return false;
    }
    const std::unique_ptr<char, IdnFree> ownedAgain(again);
    if (ascii != again) return false;
    unicode = back;
  } else if (nonAscii) {
    unicode.assign(decoded);
    for (char& c : unicode) c = LowerAscii(c);
  }
  return true;
}

const psl_ctx_t* SuffixList() {
  static const psl_ctx_t* const list = psl_builtin();
  return list;
}

}  // namespace

void SplitUrl(std::string_view url, UrlParts& parts) {
  parts.linkClass = LinkClass::kNone;
  parts.relative = false;
  parts.hasHost = false;
  parts.host.clear();
  parts.unicodeHost.clear();
  parts.path.clear();

  // A URL of another scheme is refused on its scheme alone, without cleaning it whole (a
  // data: URL can be megabytes long): cleaning keeps every ':', so the cleaned text up to
  // the first ':' is the start of the cleaned URL.
  if (const std::size_t colon = url.find(':'); colon != std::string_view::npos) {
    const std::string_view head = Clean(url.substr(0, colon + 1), parts.cleaned);
    bool scheme = head.size() >= 2 && IsAsciiAlpha(head[0]);
    for (std::size_t i = 1; scheme && i + 1 < head.size(); ++i) {
      const char c = head[i];
      scheme = IsAsciiAlpha(c) || IsAsciiDigit(c) || c == '+' || c == '-' || c == '.';
    }
    if (scheme && !IsWebScheme(head.substr(0, head.size() - 1))) return;  // no web link
  }
  const std::string_view s = Clean(url, parts.cleaned);
  std::size_t pos = 0;
  if (!s.empty() && IsAsciiAlpha(s[0])) {
    std::size_t i = 1;
    while (i < s.size() &&
           (IsAsciiAlpha(s[i]) || IsAsciiDigit(s[i]) || s[i] == '+' || s[i] == '-' || s[i] == '.'))
      ++i;
    if (i < s.size() && s[i] == ':') {
      if (!IsWebScheme(s.substr(0, i))) return;  // no web link
      parts.linkClass = LinkClass::kAbsolute;
      pos = i + 1;
    }
  }
  if (parts.linkClass == LinkClass::kNone) {
    if (s.size() >= 2 && IsSlash(s[0]) && IsSlash(s[1])) {
      parts.linkClass = LinkClass::kSchemeRelative;
    } else {
      parts.relative = true;
      return;
    }
  }
  while (pos < s.size() && IsSlash(s[pos])) ++pos;

  std::size_t end = pos;
  while (end < s.size() && !kEndsAuthority[static_cast<unsigned char>(s[end])]) ++end;
  std::string_view authority(s.data() + pos, end - pos);
  const std::size_t at = authority.rfind('@');
  if (at != std::string_view::npos) authority.remove_prefix(at + 1);
  std::string_view host = authority;
  std::string_view port;
  if (!host.empty() && host[0] == '[') {
    const std::size_t close = host.find(']');
    if (close == std::string_view::npos) return;
    port = host.substr(close + 1);
    host = host.substr(0, close + 1);
    if (!port.empty() && port[0] != ':') return;
  } else {
    const std::size_t colon = host.find(':');
    if (colon != std::string_view::npos) {
      port = host.substr(colon);
      host = host.substr(0, colon);
    }
  }
  if (!port.empty()) {
    unsigned value = 0;
    for (char c : port.substr(1)) {
      if (!IsAsciiDigit(c)) return;
      value = std::min(value * 10 + (c - '0'), 65536u);
    }
    if (value > 65535) return;
  }

  // Backslashes before the query and the fragment read as slashes.
  parts.path.assign(s.substr(end));
  char* const path = parts.path.data();
  std::size_t stop = parts.path.size();
  if (const void* q = std::memchr(path, '?', stop)) stop = static_cast<const char*>(q) - path;
  if (const void* f = std::memchr(path, '#', stop)) stop = static_cast<const char*>(f) - path;
  for (char* b = path; (b = static_cast<char*>(std::memchr(b, '\\', stop - (b - path))));)
    *b++ = '/';

  if (host.empty() || host.size() > kMaxHostBytes) return;
  if (host[0] == '[') {
    if (!ParseIPv6(host, parts.host)) return;
    parts.unicodeHost = parts.host;
    parts.hasHost = true;
    return;
  }
  // A host without '%' is its own decoding (the usual case): read in place.
  std::string_view decoded = host;
  if (std::memchr(host.data(), '%', host.size()) != nullptr) {
    PercentDecode(host, parts.decoded);
    decoded = parts.decoded;
  }
  if (!ToAsciiHost(decoded, parts.host, parts.unicodeHost)) return;
  if (EndsInNumber(parts.host)) {
    if (!ParseIPv4(parts.host, parts.host)) return;
    parts.unicodeHost = parts.host;
  }
  if (!parts.host.empty() && parts.host.back() == '.') parts.host.pop_back();
  if (!parts.unicodeHost.empty() && parts.unicodeHost.back() == '.') parts.unicodeHost.pop_back();
  parts.hasHost = !parts.host.empty();
}

bool IsDottedIPv4(std::string_view host) {
  int groups = 0;
  while (true) {
    const std::size_t dot = host.find('.');
    const std::string_view group = host.substr(0, dot);
    if (group.empty() || group.size() > 3) return false;
    unsigned value = 0;
    for (char c : group) {
      if (!IsAsciiDigit(c)) return false;
      value = value * 10 + (c - '0');
    }
    if (value > 255) return false;
    ++groups;
    if (dot == std::string_view::npos) break;
    host.remove_prefix(dot + 1);
  }
  return groups == 4;
}

bool IsSpecialAddress(std::string_view host) {
  if (!IsDottedIPv4(host)) return false;
  const std::string text(host);
  const std::uint32_t address = ntohl(inet_addr(text.c_str()));
  return (address >> 24) == 10 || (address >> 20) == (172u << 4 | 1u) ||
         (address >> 16) == (192u << 8 | 168u) || address == 0x7F000001u;
}

std::string_view RegistrableDomain(const std::string& host) {
  const psl_ctx_t* list = SuffixList();
  if (list == nullptr || host.empty() || host[0] == '[' || IsDottedIPv4(host)) return host;
  const char* domain = psl_registrable_domain(list, host.c_str());
  if (domain == nullptr) return host;
  return std::string_view(host).substr(static_cast<std::size_t>(domain - host.c_str()));
}

bool IsTopLevelDomain(std::string_view label) {
  const psl_ctx_t* list = SuffixList();
  if (list == nullptr || label.empty() || label.find('.') != std::string_view::npos) return false;
  const std::string text(label);
  return psl_is_public_suffix2(list, text.c_str(), PSL_TYPE_ANY | PSL_TYPE_NO_STAR_RULE) != 0;
}

}  // namespace html_features
