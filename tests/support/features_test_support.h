// A small world for the feature extractor's tests: organisations with categories and names,
// domains that belong to them (a domain's subdomains too), share links and categorised
// hosts, and a lexeme database read from text.
#pragma once

#include <cstdint>
#include <map>
#include <set>
#include <stdexcept>
#include <sstream>
#include <string>
#include <utility>

#include "engine/kb/lexeme_stats.h"
#include "engine/kb/white_domain_i.h"
#include "engine/kb/words_db.h"

namespace features_test {

using LexemeDB = lex::WordsDB<char, lex::LexemeStats>;

inline LexemeDB Lexemes(const std::string& text) {
  LexemeDB db;
  std::istringstream in(text);
  db.Load(in);
  return db;
}

class World final : public ap::WhiteDomainI {
 public:
  struct Org {
    std::int32_t category;
    std::string name;
  };
  std::map<std::uint32_t, Org> orgs;
  std::map<std::string, std::uint32_t> domains;  // domain -> organisation
  std::set<std::string> notWhite;                // listed, but not white (a restricted listing)
  std::set<std::pair<std::string, std::string>> shareLinks, categorised;
  int lookups = 0;
  int failAt = -1;  // the look-up with this number raises

  ap::WhiteDomainRecord Lookup(const char* begin, const char* end) override {
    if (lookups++ == failAt) throw std::runtime_error("look-up failed");
    std::string host(begin, end);
    while (true) {
      const auto it = domains.find(host);
      if (it != domains.end()) {
        ap::WhiteDomainRecord r;
        r.key = it->second;
        r.other_suffix_flag = notWhite.count(host) ? 1 : 0;
        return r;
      }
      const std::size_t dot = host.find('.');
      if (dot == std::string::npos) return {};
      host.erase(0, dot + 1);
    }
  }
  bool find_org(std::uint64_t id, ap::OrgResult& result) override {
    const auto it = orgs.find(static_cast<std::uint32_t>(id));
    if (it == orgs.end()) {
      result.category = 6;
      result.name = {};
      return false;
    }
    result.org_id = static_cast<std::uint32_t>(id);
    result.category = it->second.category;
    result.name = it->second.name;
    return true;
  }
  bool IsCategorised(const char* hb, const char* he, const char* pb, const char* pe) override {
    return categorised.count({std::string(hb, he), std::string(pb, pe)}) != 0;
  }
  bool IsShareLink(const char* hb, const char* he, const char* pb, const char* pe) override {
    return shareLinks.count({std::string(hb, he), std::string(pb, pe)}) != 0;
  }
};

// Organisations: 101 PayPal (payment, 7), 102 Example Bank (bank, 0), 103 Example Mail
// (webmail, 1), 104 Example Shop (e-commerce, 2), 105 Popular (6).
inline World DefaultWorld() {
  World w;
  w.orgs = {{101, {7, "PayPal"}},
            {102, {0, "Example_Bank"}},
            {103, {1, "Example_Mail"}},
            {104, {2, "Example_Shop"}},
            {105, {6, "Popular"}}};
  w.domains = {{"paypal.com", 101},      {"paypalobjects.com", 101}, {"examplebank.com", 102},
               {"examplemail.com", 103}, {"exampleshop.com", 104},   {"popular.com", 105},
               {"paypal.xyz", 101}};
  w.notWhite = {"paypal.xyz"};
  return w;
}

// Lexemes: brand words bound to their organisations, credential words flagged sensitive
// (third number bit 0), and two phrases.
inline const char* kDefaultLexemes =
    "verify(2)account 40 0 1\n"
    "sign(1)in 20 0 1\n"
    "paypal 50 101 0\n"
    "examplebank 45 102 0\n"
    "password 30 0 1\n"
    "login 25 0 0\n"
    "account 10 0 0\n"
    "secure 35 0 0\n"
    "urgent 70 0 0\n"
    "in 0 0 0\n";

}  // namespace features_test
