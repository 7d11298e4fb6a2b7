#include "engine/features/url_record.h"

#include <algorithm>
#include <vector>

#include "engine/kb/case_fold.h"

namespace html_features {
namespace {

bool IsWordByte(unsigned char c) {
  return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c >= 0x80;
}
bool IsContinuation(unsigned char c) { return (c & 0xC0) == 0x80; }

// Calls run(begin, end) for each run of letters and digits (non-ASCII bytes count as
// letters) in `text`.
template <class F>
void ForEachRun(std::string_view text, F&& run) {
  std::size_t i = 0;
  while (i < text.size()) {
    while (i < text.size() && !IsWordByte(static_cast<unsigned char>(text[i]))) ++i;
    const std::size_t b = i;
    while (i < text.size() && IsWordByte(static_cast<unsigned char>(text[i]))) ++i;
    if (i > b) run(b, i);
  }
}

const lex::LexemeStats* RunLexeme(std::string_view run, const LexemeDB& lexemes) {
  // A run of ASCII letters and digits normalises to itself lower-cased: walk the trie with
  // it directly. Other runs go through the loader's normalisation.
  const auto& trie = lexemes.trie();
  auto node = LexemeDB::Trie::kRoot;
  for (const char c : run) {
    const auto byte = static_cast<unsigned char>(c);
    if (byte >= 0x80) return lexemes.StatsOf(lexemes.FindTerm(lex::NormalizeLine(run)));
    node = trie.Child(node, static_cast<char>(byte >= 'A' && byte <= 'Z' ? byte + 32 : byte));
    if (node == LexemeDB::Trie::kNoNode) {
      // No lexeme starts so; the rest must still be ASCII for that to be the answer.
      for (const char rest : run)
        if (static_cast<unsigned char>(rest) >= 0x80)
          return lexemes.StatsOf(lexemes.FindTerm(lex::NormalizeLine(run)));
      return nullptr;
    }
  }
  return lexemes.StatsOf(run.empty() ? 0 : trie.Term(node));
}

std::size_t CharCount(std::string_view bytes) {
  std::size_t n = 0;
  for (char c : bytes) n += IsContinuation(static_cast<unsigned char>(c)) ? 0 : 1;
  return n;
}

// 0 lower case (and non-ASCII letters), 1 capital, 2 digit.
int CharClass(unsigned char c) {
  if (c >= '0' && c <= '9') return 2;
  if (c >= 'A' && c <= 'Z') return 1;
  return 0;
}

void HostChannels(const std::string& host, const LexemeDB& lexemes, UrlRecord& r) {
  std::vector<float> plain, org, change;
  int previous = -1;
  ForEachRun(host, [&](std::size_t b, std::size_t e) {
    const std::string_view run(host.data() + b, e - b);
    const std::size_t chars = CharCount(run);
    const lex::LexemeStats* s = RunLexeme(run, lexemes);
    if (s != nullptr) r.hostLexemes = true;
    const bool weighted = s != nullptr && s->first_value != 0;
    plain.insert(plain.end(), chars, weighted && s->second_value == 0 ? 1.0f : 0.0f);
    org.insert(org.end(), chars, weighted && s->second_value != 0 ? 1.0f : 0.0f);
    for (char c : run) {
      if (IsContinuation(static_cast<unsigned char>(c))) continue;
      const int cls = CharClass(static_cast<unsigned char>(c));
      change.push_back(previous >= 0 && cls != previous ? 1.0f : 0.0f);
      previous = cls;
    }
  });
  float* out = r.hostFloats.data();
  Resample(plain.data(), plain.size(), out, kHostChannelSize);
  Resample(org.data(), org.size(), out + kHostChannelSize, kHostChannelSize);
  Resample(change.data(), change.size(), out + 2 * kHostChannelSize, kHostChannelSize);
}

// A share link is listed by its host and a path; a URL below that path is shared content
// too (a form or a document under a listed prefix), so the path and each of its parents
// are tried, the query and fragment left out. The root "/" is the last parent: a host
// listed with "/" publishes users' content under every path.
bool IsShareLinkBelow(ap::WhiteDomainI& lookup, const std::string& host, std::string_view path) {
  path = path.substr(0, path.find_first_of("?#"));
  const auto listed = [&](std::string_view p) {
    return lookup.IsShareLink(host.data(), host.data() + host.size(), p.data(),
                              p.data() + p.size());
  };
  for (int step = 0; step < kMaxShareLinkSteps && !path.empty(); ++step) {
    if (listed(path)) return true;
    if (path.size() > 1 && path.back() == '/') {
      path.remove_suffix(1);
      continue;
    }
    const std::size_t slash = path.rfind('/');
    if (slash == std::string_view::npos) break;
    if (slash == 0) return path.size() > 1 && listed(path.substr(0, 1));
    path = path.substr(0, slash);
  }
  return false;
}

}  // namespace

int LinkClassOf(std::int32_t category) {
  switch (category) {
    case 0:
    case 7:
    case 9:
      return 0;
    case 1:
    case 4:
    case 8:
      return 1;
    default:
      return 3;
  }
}

std::array<float, kUrlRecordSize> UrlRecord::five() const {
  const std::string& host = parts.host;
  return {hostLexemes ? 1.0f : 0.0f, ip ? 1.0f : 0.0f, static_cast<float>(parts.path.size()),
          static_cast<float>(host.size()),
          static_cast<float>(std::count(host.begin(), host.end(), '.'))};
}

void Resample(const float* values, std::size_t count, float* out, std::size_t outSize) {
  std::fill(out, out + outSize, 0.0f);
  if (count <= outSize) {
    std::copy(values, values + count, out);
    return;
  }
  // Window w covers [w * count / outSize, (w + 1) * count / outSize) of the values.
  const double width = static_cast<double>(count) / outSize;
  for (std::size_t i = 0; i < count; ++i) {
    const double b = static_cast<double>(i), e = b + 1.0;
    const auto first = static_cast<std::size_t>(b / width);
    for (std::size_t w = first; w < outSize; ++w) {
      const double wb = w * width, we = wb + width;
      const double overlap = std::min(e, we) - std::max(b, wb);
      if (overlap <= 0) break;
      out[w] += static_cast<float>(values[i] * overlap / width);
    }
  }
}

bool TextLexemes(std::string_view text, const LexemeDB& lexemes, std::uint32_t* keys,
                 std::size_t maxKeys, std::size_t& keyCount) {
  keyCount = 0;
  bool any = false;
  text = text.substr(0, kMaxPathLexemeBytes);
  ForEachRun(text, [&](std::size_t b, std::size_t e) {
    const lex::LexemeStats* s = RunLexeme(text.substr(b, e - b), lexemes);
    if (s == nullptr) return;
    any = true;
    if (s->second_value != 0 && keyCount < maxKeys &&
        std::find(keys, keys + keyCount, s->second_value) == keys + keyCount) {
      keys[keyCount++] = s->second_value;
    }
  });
  return any;
}

void AnalyseUrl(std::string_view url, ap::WhiteDomainI& lookup, const LexemeDB& lexemes,
                bool hostFloats, UrlRecord& r, HostMemo* memo) {
  SplitUrl(url, r.parts);
  r.trusted = r.white = r.ip = r.hostLexemes = r.hostKeysKnown = false;
  r.hostKeyCount = 0;
  r.key = 0;
  r.category = 6;
  r.hostFloats.fill(0.0f);
  if (!r.parts.hasHost) return;
  const std::string& host = r.parts.host;
  const std::string& path = r.parts.path;
  if (memo != nullptr && !hostFloats) {
    if (const HostMemo::Facts* known = memo->find(host, r.parts.unicodeHost)) {
      r.key = known->key;
      r.category = known->category;
      r.white = known->whiteDomain && !IsShareLinkBelow(lookup, host, path);
      r.ip = known->ip;
      r.trusted = r.white || known->special;
      r.hostLexemes = known->hostLexemes;
      r.hostKeys = known->hostKeys;
      r.hostKeyCount = known->hostKeyCount;
      r.hostKeysKnown = true;
      return;
    }
  }
  const ap::WhiteDomainRecord record = lookup.Lookup(host.data(), host.data() + host.size());
  r.key = record.key;
  if (r.key != 0) {
    ap::OrgResult org;
    lookup.find_org(r.key, org);
    r.category = org.category;
  }
  // Content anyone can publish on a white organisation's domain is judged like any page.
  const bool whiteDomain = ap::IsWhite(record);
  r.white = whiteDomain && !IsShareLinkBelow(lookup, host, path);
  r.ip = IsDottedIPv4(host);
  const bool special = IsSpecialAddress(host);
  r.trusted = r.white || special;
  if (hostFloats && !r.trusted) {
    HostChannels(r.parts.unicodeHost, lexemes, r);
  } else {
    // With the organisations its lexemes name, which links ask for next.
    r.hostLexemes = TextLexemes(r.parts.unicodeHost, lexemes, r.hostKeys.data(), r.hostKeys.size(),
                                r.hostKeyCount);
    r.hostKeysKnown = true;
    if (memo != nullptr && !hostFloats) {
      memo->keep(host, HostMemo::Facts{r.parts.unicodeHost, r.key, r.category, whiteDomain, r.ip,
                                       special, r.hostLexemes, r.hostKeys, r.hostKeyCount});
    }
  }
}

}  // namespace html_features
