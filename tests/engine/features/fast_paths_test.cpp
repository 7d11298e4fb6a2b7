// The feature extractor's fast paths against the plain code they stand for: the
// normaliser's ASCII path against its per-byte reader, the trie's root table and inline step
// against a set of words, the URL lexemes' ASCII walk against the loader's normalisation,
// the URL splitter's early refusal of other schemes, and the per-page memory of own and
// foreign hosts beyond its limit.
#include <gtest/gtest.h>

#include <map>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "engine/features/html_features.h"
#include "engine/features/html_features_impl.h"
#include "engine/features/url_record.h"
#include "engine/features/url_splitter.h"
#include "engine/features/utf8_normalizer.h"
#include "engine/features/word_finder.h"
#include "engine/html/decrunch.h"
#include "engine/kb/case_fold.h"
#include "tests/support/features_test_support.h"

namespace {

using features_test::LexemeDB;

// A finder that writes down every byte it is fed and every word end.
struct Recorder {
  std::string out;
  void feed(unsigned char c) { out.push_back(static_cast<char>(c)); }
  void wordEnd() { out += "|"; }
};

// Text made of what ends or extends the ASCII path: letters of both cases, digits,
// delimiters, references whole, cut and unknown, UTF-8 sequences whole, cut short and
// stray, folded and punctuation code points, CJK and bytes no sequence starts with.
std::string HostileText(std::mt19937& rng, std::size_t pieces) {
  static const std::vector<std::string> kPieces = {"a",
                                                   "Z",
                                                   "q",
                                                   "7",
                                                   " ",
                                                   ".",
                                                   "-",
                                                   "'",
                                                   "\n",
                                                   "\t",
                                                   "&",
                                                   ";",
                                                   "#",
                                                   "&amp;",
                                                   "&AMP;",
                                                   "&lt",
                                                   "&#65;",
                                                   "&#x4a;",
                                                   "&#xZZ;",
                                                   "&nosuchname;",
                                                   "&verylongreferencename;",
                                                   "&#",
                                                   "\xd0\x9f",
                                                   "\xd0",
                                                   "\xd0\xbf\xd0\xb0",
                                                   "\xc3\x9f",
                                                   "\xc3\x89",
                                                   "\xe2\x80\x94",
                                                   "\xe5\xaf\x86",
                                                   "\xe5\xaf",
                                                   "\x80",
                                                   "\xbf",
                                                   "\xf8",
                                                   "\xff",
                                                   "\xf0\x9f\x98\x80",
                                                   "\xf0\x9f",
                                                   "\xc2\xa0",
                                                   "PayPal",
                                                   "VERIFY",
                                                   "account",
                                                   "\x7f",
                                                   std::string(1, '\0')};
  std::string text;
  for (std::size_t i = 0; i < pieces; ++i) text += kPieces[rng() % kPieces.size()];
  return text;
}

// Where a text is cut into chunks (each 1 to maxCut bytes) and after which chunks a word is
// broken off (one in breakOneIn).
struct CutPlan {
  std::vector<std::size_t> cuts;
  std::vector<bool> breaks;
};

CutPlan RandomCuts(std::mt19937& rng, std::size_t size, std::size_t maxCut, unsigned breakOneIn) {
  CutPlan plan;
  for (std::size_t i = 0; i < size;) {
    const std::size_t n = std::min<std::size_t>(1 + rng() % maxCut, size - i);
    plan.cuts.push_back(n);
    plan.breaks.push_back(rng() % breakOneIn == 0);
    i += n;
  }
  return plan;
}

// Feeds `text` to the normaliser as the plan cuts it, through its per-byte reader or not.
template <typename Normalizer>
void FeedCut(Normalizer& n, const std::string& text, const CutPlan& plan, bool perByte) {
  std::size_t at = 0;
  for (std::size_t k = 0; k < plan.cuts.size(); ++k) {
    if (perByte) {
      n.textByteByByte(text.data() + at, plan.cuts[k]);
    } else {
      n.text(text.data() + at, plan.cuts[k]);
    }
    if (plan.breaks[k]) n.wordEnd();
    at += plan.cuts[k];
  }
}

TEST(NormalizerFastPath, AgreesWithThePerByteReaderInAnyChunking) {
  std::mt19937 rng(20261207);
  for (int round = 0; round < 400; ++round) {
    const std::string text = HostileText(rng, 1 + rng() % 200);

    Recorder reference;
    lex::UTF8Normalizer<Recorder> slow(reference);
    for (const char c : text) slow.textByteByByte(&c, 1);
    slow.wordEnd();

    Recorder fast;
    lex::UTF8Normalizer<Recorder> normalizer(fast);
    for (std::size_t i = 0; i < text.size();) {
      const std::size_t n = std::min<std::size_t>(1 + rng() % 17, text.size() - i);
      normalizer.text(text.data() + i, n);
      i += n;
    }
    normalizer.wordEnd();
    ASSERT_EQ(fast.out, reference.out) << "round " << round;

    Recorder whole;
    lex::UTF8Normalizer<Recorder> once(whole);
    once.text(text.data(), text.size());
    once.wordEnd();
    ASSERT_EQ(whole.out, reference.out) << "round " << round;
  }
}

TEST(NormalizerFastPath, BreaksBetweenChunksLandWhereThePerByteReaderPutsThem) {
  std::mt19937 rng(7);
  for (int round = 0; round < 300; ++round) {
    const std::string text = HostileText(rng, 1 + rng() % 120);
    const CutPlan plan = RandomCuts(rng, text.size(), 13, 5);
    const auto run = [&](bool perByte) {
      Recorder out;
      lex::UTF8Normalizer<Recorder> n(out);
      FeedCut(n, text, plan, perByte);
      n.wordEnd();
      return out.out;
    };
    ASSERT_EQ(run(false), run(true)) << "round " << round;
  }
}

TEST(NormalizerFastPath, PlainAsciiIsLowerCasedAndCutAtDelimiters) {
  Recorder out;
  lex::UTF8Normalizer<Recorder> n(out);
  const std::string text = "Hello, WORLD-wide_web 42!";
  n.text(text.data(), text.size());
  n.wordEnd();
  EXPECT_EQ(out.out, "hello||world|wide|web|42||");  // every end is passed on
}

// What a word finder tells its handler, written down in order.
struct FinderLog {
  std::string out;
  void word() { out += "w "; }
  void lexeme(const lex::LexemeStats& s) {
    out += "L" + std::to_string(s.first_value) + "/" + std::to_string(s.second_value) + " ";
  }
  void phrase(const LexemeDB::Phrase& p, std::uint16_t items) {
    out += "P" + std::to_string(p.stats.first_value) + "x" + std::to_string(items) + " ";
  }
};

// The normaliser hands a lexeme word finder whole runs of ASCII word bytes (feedRun): the
// finder's handler hears the same words, lexemes and phrases as when every byte goes
// through the per-byte reader and feed(), whatever the chunking and the block breaks. The
// text mixes lexemes, their prefixes and extensions, words that leave the trie at once or
// late, long words, and the hostile pieces of the test above.
TEST(NormalizerFastPath, FinderRunsAgreeWithFeedingByteByByte) {
  const LexemeDB db = features_test::Lexemes(std::string(features_test::kDefaultLexemes) +
                                             "stra\xc3\x9f"
                                             "e 13 0 0\n"
                                             "a1 5 0 0\n"
                                             "x 3 0 0\n");
  static const std::vector<std::string> kWords = {
      "verify", "Account", "ACCOUNT", "accoun",  "accounts", "sign", "in",
      "In",     "PayPal",  "paypa",   "paypall", "password", "pass", "login",
      "LOGIN",  "a1",      "A",       "a",       "x",        "xx",   "zzzzzzzzzzzzzzzzzzzzzzzz",
      "qwerty", "secure",  "urgent",  "9"};
  std::mt19937 rng(4242);
  for (int round = 0; round < 400; ++round) {
    std::string text;
    const std::size_t pieces = 1 + rng() % 150;
    for (std::size_t i = 0; i < pieces; ++i) {
      const unsigned pick = rng() % 10;
      if (pick < 5) {
        text += kWords[rng() % kWords.size()];
      } else if (pick < 8) {
        static const std::vector<std::string> kGaps = {" ",
                                                       ",",
                                                       ".",
                                                       "\n",
                                                       "-",
                                                       "\n        ",
                                                       "\t\t\t\t\t\t\t\t\t",
                                                       "  \r\n  ",
                                                       std::string(17, ' '),
                                                       std::string("\x01\x1f\x20\x00 ", 5)};
        text += kGaps[rng() % kGaps.size()];
      } else {
        text += HostileText(rng, 1);
      }
    }
    const CutPlan plan = RandomCuts(rng, text.size(), 23, 6);
    const auto run = [&](int how) {
      FinderLog log;
      lex::WordsFinder<LexemeDB, FinderLog> finder(db, log);
      lex::UTF8Normalizer<lex::WordsFinder<LexemeDB, FinderLog>> n(finder);
      if (how == 2) {
        n.text(text.data(), text.size());
      } else {
        FeedCut(n, text, plan, how == 0);
      }
      n.wordEnd();
      return log.out;
    };
    const std::string reference = run(0);
    ASSERT_EQ(run(1), reference) << "round " << round;
    // Unbroken, the per-byte reader gives what the whole text does at once.
    FinderLog log;
    lex::WordsFinder<LexemeDB, FinderLog> finder(db, log);
    lex::UTF8Normalizer<lex::WordsFinder<LexemeDB, FinderLog>> n(finder);
    n.textByteByByte(text.data(), text.size());
    n.wordEnd();
    ASSERT_EQ(run(2), log.out) << "round " << round;
  }
  // The log is not empty by accident: lexemes and a phrase are heard.
  FinderLog log;
  lex::WordsFinder<LexemeDB, FinderLog> finder(db, log);
  lex::UTF8Normalizer<lex::WordsFinder<LexemeDB, FinderLog>> n(finder);
  const std::string text = "Please VERIFY your PayPal account, zzzz paypall";
  n.text(text.data(), text.size());
  n.wordEnd();
  EXPECT_EQ(log.out, "w w L0/0 w w L50/101 w L10/0 w w ");
}

// Words of a few letters from a small alphabet (ASCII and UTF-8 lead and continuation
// bytes), so that prefixes are shared and the root gains children in random order.
TEST(LexemeTrie, RootTableAndInlineStepAgreeWithTheInsertedWords) {
  std::mt19937 rng(99);
  const std::string alphabet = "abcz09_\xc3\xd0\x9f\xbf\xe5\x01\x7f\xff";
  for (int round = 0; round < 20; ++round) {
    lex::Character<char, lex::LexemeStats> trie;
    struct Terms final : lex::Character<char, lex::LexemeStats>::TermAllocator {
      std::uint32_t next = 1;
      std::uint32_t NewTerm() override { return next++; }
      void SetStats(std::uint32_t, const lex::LexemeStats&) override {}
    } terms;
    std::map<std::string, std::uint32_t> words;
    std::set<std::string> prefixes;
    const int count = 1 + static_cast<int>(rng() % 600);
    for (int i = 0; i < count; ++i) {
      std::string word;
      const std::size_t length = 1 + rng() % 5;
      for (std::size_t k = 0; k < length; ++k) word += alphabet[rng() % alphabet.size()];
      const std::uint32_t term = trie.Insert(word, terms, lex::LexemeStats{});
      words.emplace(word, term);
      for (std::size_t k = 1; k <= word.size(); ++k) prefixes.insert(word.substr(0, k));
    }
    for (int probe = 0; probe < 3000; ++probe) {
      std::string word;
      const std::size_t length = 1 + rng() % 6;
      for (std::size_t k = 0; k < length; ++k) word += alphabet[rng() % alphabet.size()];
      auto node = trie.kRoot;
      for (const char c : word) {
        node = trie.Child(node, c);
        if (node == trie.kNoNode) break;
      }
      ASSERT_EQ(node != trie.kNoNode, prefixes.count(word) == 1) << round << " " << word;
      const auto found = words.find(word);
      if (node != trie.kNoNode) {
        ASSERT_EQ(trie.Term(node), found == words.end() ? 0u : found->second) << word;
      }
    }
    for (unsigned c = 0; c < 256; ++c) {
      const std::string one(1, static_cast<char>(c));
      EXPECT_EQ(trie.Child(trie.kRoot, static_cast<char>(c)) != trie.kNoNode,
                prefixes.count(one) == 1);
    }
  }
}

// A run of letters and digits is looked up as the loader normalises it, whether it is
// plain ASCII (walked directly) or not.
TEST(UrlLexemes, AsciiWalkAgreesWithTheLoadersNormalisation) {
  const LexemeDB db = features_test::Lexemes(
      "paypal 50 101 0\n"
      "login 25 0 0\n"
      "stra\xc3\x9f"
      "e 13 0 0\n"
      "\xd0\xbf\xd0\xb0\xd1\x80\xd0\xbe\xd0\xbb\xd1\x8c 12 0 0\n"
      "a1 5 0 0\n");
  const std::vector<std::string> runs = {"paypal",
                                         "PayPal",
                                         "PAYPAL",
                                         "paypa",
                                         "paypall",
                                         "Login",
                                         "a1",
                                         "A1",
                                         "a",
                                         "STRASSE",
                                         "STRA\xc3\x9f"
                                         "E",
                                         "Stra\xc3\x9f"
                                         "e",
                                         "\xd0\x9f\xd0\x90\xd0\xa0\xd0\x9e\xd0\x9b\xd0\xac",
                                         "pay\xc3\xa9pal",
                                         "zz\xc3",
                                         "x\x80"};
  for (const std::string& run : runs) {
    std::size_t none = 0;
    const bool any = html_features::TextLexemes(run, db, nullptr, 0, none);
    const bool expected = db.StatsOf(db.FindTerm(lex::NormalizeLine(run))) != nullptr;
    EXPECT_EQ(any, expected) << run;
  }
  std::size_t none = 0;
  EXPECT_TRUE(html_features::TextLexemes("PayPal", db, nullptr, 0, none));
  EXPECT_TRUE(
      html_features::TextLexemes("STRA\xc3\x9f"
                                 "E",
                                 db, nullptr, 0, none));
  EXPECT_FALSE(html_features::TextLexemes("paypa", db, nullptr, 0, none));
}

// Another scheme is refused on its scheme; tabs and newlines inside a scheme are dropped
// first, as browsers do, and a colon that ends no scheme leaves a relative reference.
TEST(UrlSplitter, SchemesReadAsTheCleanedUrlReadsThem) {
  struct Case {
    std::string url;
    html_features::LinkClass linkClass;
    bool relative;
    std::string host;
  };
  using html_features::LinkClass;
  const std::string megabyte(1 << 20, 'A');
  const std::vector<Case> cases = {
      {"ht\ttp://Example.COM/a", LinkClass::kAbsolute, false, "example.com"},
      {"  \x01HT\nTPS://a.example:443/x", LinkClass::kAbsolute, false, "a.example"},
      {"java\tscript:http://evil.example/", LinkClass::kNone, false, ""},
      {"data:text/html;base64," + megabyte, LinkClass::kNone, false, ""},
      {"data:\t,http://x.example/", LinkClass::kNone, false, ""},
      {"mailto:a@b.example", LinkClass::kNone, false, ""},
      {"httpx://a.example/", LinkClass::kNone, false, ""},
      {"a b:c", LinkClass::kNone, true, ""},
      {"1http://a.example/", LinkClass::kNone, true, ""},
      {":http://a.example/", LinkClass::kNone, true, ""},
      {"/path?q=a:b", LinkClass::kNone, true, ""},
      {"//cdn.example/a:b", LinkClass::kSchemeRelative, false, "cdn.example"},
      {"\\\\cdn.example\\x", LinkClass::kSchemeRelative, false, "cdn.example"},
      {"https:" + megabyte, LinkClass::kAbsolute, false, ""},
  };
  html_features::UrlParts parts;  // reused, as the extractor reuses it
  for (const Case& c : cases) {
    html_features::SplitUrl(c.url, parts);
    EXPECT_EQ(parts.linkClass, c.linkClass) << c.url.substr(0, 40);
    EXPECT_EQ(parts.relative, c.relative) << c.url.substr(0, 40);
    EXPECT_EQ(parts.hasHost, !c.host.empty()) << c.url.substr(0, 40);
    EXPECT_EQ(parts.host, c.host) << c.url.substr(0, 40);
  }
  html_features::SplitUrl("https://a.example/p\\q?r\\s", parts);
  EXPECT_EQ(parts.path, "/p/q?r\\s");
}

// The extractor remembers kMaxForeignHosts hosts per page; hosts past that are asked about
// each time and still counted right.
TEST(HTMLFeatures, OwnAndForeignHostsBeyondTheRememberedOnes) {
  auto lexemes = features_test::Lexemes(features_test::kDefaultLexemes);
  auto world = features_test::DefaultWorld();
  ap::HTMLFeatures features("https://www.shop.example.co.uk/", world, lexemes, nullptr);
  std::string html;
  const int hosts = static_cast<int>(ap::kMaxForeignHosts) + 300;
  for (int round = 0; round < 2; ++round) {
    for (int i = 0; i < hosts; ++i) {
      html += "<form action=\"https://h" + std::to_string(i) + ".shop.example.co.uk/\"></form>";
      html += "<form action=\"https://h" + std::to_string(i) + ".co.uk/\"></form>";
    }
  }
  html::Decrunch pipeline(features, false);
  pipeline.feed(html.data(), html.size());
  std::string target;
  std::vector<float> vector;
  features.GetVector(target, vector, pipeline.byteCount());
  float foreign = 0;
  for (std::size_t s = 0; s < 3; ++s)
    foreign += vector.at(html_features::SegmentBin(s, html_features::kEvFormForeign));
  EXPECT_EQ(foreign, 2.0f * hosts);
}

}  // namespace

namespace {

// A host that does not end in the page's registrable domain is foreign without the suffix
// list: the answers agree with comparing registrable domains, for hosts that end in the
// page's domain without being its site (a public suffix below it, a longer label), IP
// addresses and hosts of other sites.
TEST(HTMLFeatures, ForeignHostsAgreeWithTheirRegistrableDomains) {
  const std::vector<std::string> pages = {
      "https://www.shop.example.co.uk/", "https://example.net/", "https://user.blogspot.com/",
      "https://blogspot.com/",           "http://10.1.2.3/",     "https://co.uk/"};
  const std::vector<std::string> hosts = {"shop.example.co.uk",
                                          "example.co.uk",
                                          "a.b.shop.example.co.uk",
                                          "notexample.co.uk",
                                          "co.uk",
                                          "example.net",
                                          "www.example.net",
                                          "anexample.net",
                                          "net",
                                          "blogspot.com",
                                          "user.blogspot.com",
                                          "x.user.blogspot.com",
                                          "otheruser.blogspot.com",
                                          "10.1.2.3",
                                          "110.1.2.3",
                                          "[::1]",
                                          "xn--bcher-kva.example.net",
                                          "example.co.uk.evil.org"};
  auto lexemes = features_test::Lexemes(features_test::kDefaultLexemes);
  auto world = features_test::DefaultWorld();
  int foreignSeen = 0, ownSeen = 0;
  for (const std::string& page : pages) {
    html_features::UrlParts pageParts;
    html_features::SplitUrl(page, pageParts);
    ASSERT_TRUE(pageParts.hasHost) << page;
    const std::string pageDomain(html_features::RegistrableDomain(pageParts.host));
    for (const std::string& host : hosts) {
      html_features::UrlParts parts;
      html_features::SplitUrl("https://" + host + "/", parts);
      ASSERT_TRUE(parts.hasHost) << host;
      const std::string_view domain = html_features::RegistrableDomain(parts.host);
      ASSERT_TRUE(std::string_view(parts.host).ends_with(domain)) << host;
      const bool expected = domain != pageDomain;
      (expected ? foreignSeen : ownSeen)++;

      ap::HTMLFeatures features(page, world, lexemes, nullptr);
      const std::string html = "<form action=\"https://" + host + "/x\"></form>";
      html::Decrunch pipeline(features, false);
      pipeline.feed(html.data(), html.size());
      std::string target;
      std::vector<float> vector;
      features.GetVector(target, vector, pipeline.byteCount());
      float foreign = 0;
      for (std::size_t s = 0; s < 3; ++s)
        foreign += vector.at(html_features::SegmentBin(s, html_features::kEvFormForeign));
      EXPECT_EQ(foreign, expected ? 1.0f : 0.0f) << page << " " << host;
    }
  }
  EXPECT_GT(ownSeen, 8);
  EXPECT_GT(foreignSeen, 40);
}

}  // namespace

namespace {

// The splitter reads a host without '%' in place, lower-cases and checks it in one pass by
// table, and turns a path's backslashes into slashes by search. Against the plain rules over
// random web URLs: the host is the authority's host lower-cased (written even when refused,
// as link records count its length and dots), refused when it holds a forbidden byte; the
// same host written with percent escapes splits the same; and a backslash is a slash up to
// the first '?' or '#' of the path, not after.
TEST(UrlSplitter, HostAndPathFastPathsAgreeWithThePlainRules) {
  static const std::vector<std::string> kHostPieces = {
      "a", "B", "z", "Q",    "0",  "7",   "-",    ".", "example", "PayPal", "<",
      "^", "|", " ", "\x7f", "@x", ":80", "xn--", "%", "%zz",     "]",      "\t"};
  static const std::vector<std::string> kPathPieces = {"/",   "\\", "a",    "?",    "#",
                                                       "%5C", "B",  "\\\\", "&q=1", ".."};
  static const std::vector<std::string> kSchemes = {"http://", "HTTPS://", "hTtP:\\\\", "//",
                                                    "https:///"};
  const auto isForbidden = [](unsigned char c) {
    return c <= 0x20 || c == 0x7F ||
           std::string_view("#/:<>?@[\\]^|%").find(static_cast<char>(c)) != std::string_view::npos;
  };
  std::mt19937 rng(1207);
  int refused = 0, taken = 0;
  for (int round = 0; round < 5000; ++round) {
    std::string host;
    const std::size_t hostPieces = 1 + rng() % 6;
    for (std::size_t i = 0; i < hostPieces; ++i) host += kHostPieces[rng() % kHostPieces.size()];
    host += rng() % 2 ? ".com" : "";
    std::string path;
    const std::size_t pathPieces = rng() % 8;
    for (std::size_t i = 0; i < pathPieces; ++i) path += kPathPieces[rng() % kPathPieces.size()];
    if (!path.empty() && path[0] != '/' && path[0] != '\\' && path[0] != '?' && path[0] != '#')
      path.insert(0, "/");
    const std::string scheme = kSchemes[rng() % kSchemes.size()];
    html_features::UrlParts parts;
    html_features::SplitUrl(scheme + host + path, parts);

    // Plain hosts: the authority (no '/', '\', '?', '#', '@' or ':' in it; not ending in a
    // number, so not read as an address) is the host.
    const bool plain = host.find_first_of("@:%\t") == std::string::npos &&
                       host.find("xn--") == std::string::npos &&
                       host.find_first_of("\\/?#") == std::string::npos && host.back() >= 'A' &&
                       host.find_first_not_of(" \x7f") == 0 && host.back() != ' ' &&
                       host.back() != '\x7f' && host.back() != '.';
    if (plain) {
      std::string lower;
      bool forbidden = false;
      for (const char c : host) {
        lower.push_back(c >= 'A' && c <= 'Z' ? static_cast<char>(c + 32) : c);
        forbidden = forbidden || isForbidden(static_cast<unsigned char>(c));
      }
      ASSERT_EQ(parts.host, lower) << scheme + host + path;
      ASSERT_EQ(parts.hasHost, !forbidden) << scheme + host + path;
      (forbidden ? refused : taken)++;
    }
    // Every letter and digit of the host escaped: the same parts.
    std::string escaped;
    for (const char c : host) {
      if ((c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9')) {
        char code[4];
        std::snprintf(code, sizeof code, "%%%02X", static_cast<unsigned char>(c));
        escaped += code;
      } else {
        escaped.push_back(c);
      }
    }
    if (escaped != host && host.find_first_of("%:@") == std::string::npos) {
      html_features::UrlParts again;
      html_features::SplitUrl(scheme + escaped + path, again);
      ASSERT_EQ(again.hasHost, parts.hasHost) << scheme + escaped + path;
      ASSERT_EQ(again.host, parts.host) << scheme + escaped + path;
      ASSERT_EQ(again.unicodeHost, parts.unicodeHost) << scheme + escaped + path;
    }
    // The path's backslashes, by the plain loop (for hosts that neither end the authority
    // early nor carry a port, which may refuse the URL before its path is read).
    if (host.find_first_of("\\/?#:\t") == std::string::npos) {
      std::string expected = path;
      for (char& c : expected) {
        if (c == '?' || c == '#') break;
        if (c == '\\') c = '/';
      }
      ASSERT_EQ(parts.path, expected) << scheme + host + path;
    }
  }
  EXPECT_GT(refused, 200);
  EXPECT_GT(taken, 200);
}

}  // namespace

namespace {

// Everything of a URL record but its working strings.
std::string Describe(const html_features::UrlRecord& r) {
  std::string out = std::to_string(static_cast<int>(r.parts.linkClass)) + r.parts.host + "|" +
                    r.parts.unicodeHost + "|" + r.parts.path + "|";
  for (const bool b : {r.parts.relative, r.parts.hasHost, r.trusted, r.white, r.ip, r.hostLexemes,
                       r.hostKeysKnown})
    out += b ? '1' : '0';
  out += "|" + std::to_string(r.key) + "|" + std::to_string(r.category) + "|";
  for (std::size_t i = 0; i < r.hostKeyCount; ++i) out += std::to_string(r.hostKeys[i]) + ",";
  for (const float f : r.hostFloats) out += std::to_string(f) + ",";
  return out;
}

// The host memo against analysing every URL afresh: random links to listed, unlisted,
// special and lexeme-bearing hosts (in both cases, as IDN and punycode), with paths under
// and beside share links, give the same records, and the memo stops growing at its limit.
TEST(HostMemo, RecordsAgreeWithAnalysingEveryUrlAfresh) {
  auto lexemes = features_test::Lexemes(features_test::kDefaultLexemes);
  auto world = features_test::DefaultWorld();
  world.shareLinks = {
      {"paypal.com", "/shared/"}, {"www.examplebank.com", "/"}, {"docs.popular.com", "/d"}};
  static const std::vector<std::string> kHosts = {"paypal.com",
                                                  "WWW.PayPal.com",
                                                  "www.examplebank.com",
                                                  "login.examplemail.com",
                                                  "paypal.xyz",
                                                  "docs.popular.com",
                                                  "secure-login.example",
                                                  "10.0.0.1",
                                                  "192.168.1.1",
                                                  "8.8.8.8",
                                                  "[::1]",
                                                  "verify.account.example",
                                                  "b\xc3\xbc"
                                                  "cher.example",
                                                  "xn--bcher-kva.example",
                                                  "bu\xcc\x88"
                                                  "cher.example",
                                                  "unknown.example"};
  static const std::vector<std::string> kPaths = {"",   "/",    "/shared/",   "/shared/doc",
                                                  "/d", "/d/e", "/login?x=1", "/a#f"};
  std::mt19937 rng(31);
  html_features::HostMemo memo;
  html_features::UrlRecord withMemo, fresh;
  int hits = 0;
  for (int i = 0; i < 3000; ++i) {
    const std::string url = std::string(rng() % 4 ? "https://" : "//") +
                            kHosts[rng() % kHosts.size()] + kPaths[rng() % kPaths.size()];
    const std::size_t before = memo.size();
    html_features::AnalyseUrl(url, world, lexemes, false, withMemo, &memo);
    hits += memo.size() == before;
    html_features::AnalyseUrl(url, world, lexemes, false, fresh);
    ASSERT_EQ(Describe(withMemo), Describe(fresh)) << url;
  }
  EXPECT_GT(hits, 2500);
  // Past the limit new hosts are still analysed right, and not kept.
  for (std::size_t i = 0; i < html_features::kMaxRememberedHosts + 50; ++i) {
    const std::string url = "https://h" + std::to_string(i) + ".paypal.com/x";
    html_features::AnalyseUrl(url, world, lexemes, false, withMemo, &memo);
    html_features::AnalyseUrl(url, world, lexemes, false, fresh);
    ASSERT_EQ(Describe(withMemo), Describe(fresh)) << url;
  }
  EXPECT_EQ(memo.size(), html_features::kMaxRememberedHosts);
}

}  // namespace
