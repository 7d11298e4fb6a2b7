// Splits the URLs of a page (its own address, links, resources, form actions, URLs found in
// scripts) into the host that the knowledge bases are asked about and the rest, the way a
// browser reads them: http and https URLs and scheme-relative ones ("//host/..."); other
// schemes have no host here, and relative references are the page's own site.
//
// Everything it reads is hostile: it never allocates beyond the URL's own size, a host
// longer than kMaxHostBytes is not parsed, and malformed hosts come back as "no host".
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace html_features {

// Hosts longer than this (after percent-decoding) are not taken: DNS names stop at 253.
inline constexpr std::size_t kMaxHostBytes = 1024;

enum class LinkClass : int {
  kNone = 0,            // another scheme (data:, javascript:, mailto: ...) or no host
  kAbsolute = 1,        // http: or https:
  kSchemeRelative = 2,  // //host/...
};

struct UrlParts {
  LinkClass linkClass = LinkClass::kNone;
  bool relative = false;    // a relative reference: the page's own site
  bool hasHost = false;     // false: "without a parsable host"
  std::string host;         // ASCII (punycode) form, lower case: what look-ups use
  std::string unicodeHost;  // the same host in Unicode (UTF-8), for lexeme matching
  std::string path;         // everything after the host and port: path, query, fragment
  // Working space of SplitUrl, kept so that splitting one URL after another reuses memory.
  std::string cleaned, decoded;
};

// Splits `url`. The parts are overwritten; a URL of another scheme, a relative reference or
// one whose host cannot be read leaves hasHost false.
void SplitUrl(std::string_view url, UrlParts& parts);

// A host of four dot-separated decimal groups, each at most 255: a dotted IPv4 address.
bool IsDottedIPv4(std::string_view host);
// 10.0.0.0/8, 172.16.0.0/12, 192.168.0.0/16 or exactly 127.0.0.1. A host that is not a
// dotted IPv4 address reads as 0.0.0.0, which is not special.
bool IsSpecialAddress(std::string_view host);

// The registrable domain of an ASCII host by the Public Suffix List (libpsl's built-in
// list); the host itself for an IP address or when the list has no answer. Always a tail of
// `host` (a view into it), which lets callers rule a host out by its ending alone.
std::string_view RegistrableDomain(const std::string& host);
// Whether `label` (lower case, ASCII) is a top-level domain of the Public Suffix List.
bool IsTopLevelDomain(std::string_view label);

}  // namespace html_features
