// What the feature extractor learns from one URL: the page's own address, an anchor's href
// or a mail link. Computed once per URL from its parts and the organisation look-ups.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <unordered_map>

#include "engine/features/feature_layout.h"
#include "engine/features/url_splitter.h"
#include "engine/kb/white_domain_i.h"
#include "engine/kb/words_db.h"

namespace html_features {

// The longest part of a URL's path searched for lexemes: paths can be megabytes long.
inline constexpr std::size_t kMaxPathLexemeBytes = 4096;

// Parent paths tried when asking whether a URL is below a listed share link.
inline constexpr int kMaxShareLinkSteps = 16;

struct UrlRecord {
  UrlParts parts;
  bool trusted = false;      // a special address, or white (and not a share link)
  bool white = false;        // on a white domain, not a share link
  bool ip = false;           // a dotted IPv4 address
  bool hostLexemes = false;  // some run of the host's letters and digits is a lexeme
  // The organisations the host's lexemes name, as TextLexemes finds them (at most
  // kMaxHostLexemeKeys); known when AnalyseUrl did not compute the host channels.
  static constexpr std::size_t kMaxHostLexemeKeys = 8;
  std::array<std::uint32_t, kMaxHostLexemeKeys> hostKeys{};
  std::size_t hostKeyCount = 0;
  bool hostKeysKnown = false;
  std::uint32_t key = 0;  // the owning organisation, 0 when the host is not listed
  std::int32_t category = 6;
  std::array<float, 3 * kHostChannelSize> hostFloats{};

  // The five floats an anchor, a mail link and a web page carry: host has lexemes, host is
  // an IP address, path length, host length, dots in the host.
  std::array<float, kUrlRecordSize> five() const;
};

using LexemeDB = lex::WordsDB<char, lex::LexemeStats>;

// Hosts a HostMemo keeps; past this many, a new host is analysed every time it comes.
inline constexpr std::size_t kMaxRememberedHosts = 1024;

// What AnalyseUrl learns from a URL's host alone, kept by host so that a page's links to
// one host look it up once: the organisation and its category, whether its domain is
// white (before share links, which depend on the path), whether it is an IP address or a
// special one, and its lexemes with the organisations they name.
class HostMemo {
 public:
  struct Facts {
    std::string unicodeHost;  // the Unicode form these lexemes were found in
    std::uint32_t key = 0;
    std::int32_t category = 6;
    bool whiteDomain = false;
    bool ip = false;
    bool special = false;
    bool hostLexemes = false;
    std::array<std::uint32_t, UrlRecord::kMaxHostLexemeKeys> hostKeys{};
    std::size_t hostKeyCount = 0;
  };
  // The facts kept for `host` in the Unicode form `unicodeHost`, or null.
  const Facts* find(const std::string& host, const std::string& unicodeHost) const {
    const auto it = byHost_.find(host);
    return it != byHost_.end() && it->second.unicodeHost == unicodeHost ? &it->second : nullptr;
  }
  // Keeps `facts` for `host` while fewer than kMaxRememberedHosts are kept.
  void keep(const std::string& host, const Facts& facts) {
    if (byHost_.size() < kMaxRememberedHosts) byHost_.insert_or_assign(host, facts);
  }
  std::size_t size() const { return byHost_.size(); }

 private:
  std::unordered_map<std::string, Facts> byHost_;
};

// Analyses `url` into `record`. With `hostFloats` the three host channels are computed.
// Without them, `memo` (if given) answers for hosts analysed before and keeps new ones:
// the record is the same either way.
void AnalyseUrl(std::string_view url, ap::WhiteDomainI& lookup, const LexemeDB& lexemes,
                bool hostFloats, UrlRecord& record, HostMemo* memo = nullptr);

// Whether `text` (a host or a path) has any lexeme, and the organisations its lexemes name
// (at most kMaxKeys of them, written to keys, count returned through keyCount).
bool TextLexemes(std::string_view text, const LexemeDB& lexemes, std::uint32_t* keys,
                 std::size_t maxKeys, std::size_t& keyCount);

// Brings a channel of any length to `out.size()` values: copied and padded when short,
// else averaged over equal windows, a value straddling two windows shared in proportion.
void Resample(const float* values, std::size_t count, float* out, std::size_t outSize);

// The link class of an organisation's category: 0 financial (0, 7, 9), 1 account (1, 4, 8),
// 3 anything else.
int LinkClassOf(std::int32_t category);

}  // namespace html_features
