#include "engine/features/word_finder.h"

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

#include "engine/features/utf8_normalizer.h"
#include "tests/support/features_test_support.h"

namespace lex {
namespace {

using features_test::LexemeDB;

// Writes what the finder reports: "w" per word, "L<first_value>" per lexeme, "P<first
// value>x<items>" per phrase.
struct Log {
  std::string out;
  void word() { out += "w "; }
  void lexeme(const LexemeStats& s) { out += "L" + std::to_string(s.first_value) + " "; }
  void phrase(const LexemeDB::Phrase& p, std::uint16_t items) {
    out += "P" + std::to_string(p.stats.first_value) + "x" + std::to_string(items) + " ";
  }
};

std::string Find(const LexemeDB& db, const std::string& text, std::size_t chunk = 0) {
  Log log;
  WordsFinder<LexemeDB, Log> finder(db, log);
  UTF8Normalizer<WordsFinder<LexemeDB, Log>> normalizer(finder);
  if (chunk == 0) chunk = text.size() + 1;
  for (std::size_t i = 0; i < text.size(); i += chunk)
    normalizer.text(text.data() + i, std::min(chunk, text.size() - i));
  normalizer.wordEnd();
  return log.out;
}

const LexemeDB& Db() {
  static const LexemeDB db = features_test::Lexemes(
      "verify(2)account 40 0 1\n"
      "a(3)b(1)c 7 0 0\n"
      "sign(1)in 20 0 1\n"
      "pass 11 0 0\n"
      "\xd0\xbf\xd0\xb0\xd1\x80\xd0\xbe\xd0\xbb\xd1\x8c 12 0 0\n"  // пароль
      "stra\xc3\x9f"
      "e 13 0 0\n"             // straße
      "caf\xc3\xa9 14 0 0\n"   // café
      "\xe5\xaf\x86 15 0 0\n"  // 密
      "account 10 0 0\n"
      "b 1 0 0\n"
      "c 2 0 0\n"
      "in 3 0 0\n");
  return db;
}

TEST(WordFinder, WordsAndCaseFolding) {
  struct Case {
    std::string text, expected;
  };
  const Case cases[] = {
      {"PASS pass Pass", "w L11 w L11 w L11 "},
      {"\xd0\x9f\xd0\x90\xd0\xa0\xd0\x9e\xd0\x9b\xd0\xac", "w L12 "},  // ПАРОЛЬ
      {"STRA\xc3\x9f"
       "E",
       "w L13 "},                 // ß has no capital of its own here: unchanged
      {"CAF\xc3\x89", "w L14 "},  // É folds to é
      {"pass-pass_pass:pass'pass", "w L11 w L11 w L11 w L11 w L11 "},
      {"\xe5\xaf\x86\xe5\xaf\x86\xe5\xaf\x86", "w L15 w L15 w L15 "},  // three ideographs
      {"pa\x80ss", "w "},  // a stray continuation byte stays in the word
      {"caf&eacute; caf&#233;", "w L14 w L14 "},
      {"pa&zzzz;ss", "w w w "},              // an unknown reference ends the word
      {"pass\xc2\xa0pass", "w L11 w L11 "},  // no-break space is a word break
      {"", ""},
  };
  for (const Case& c : cases) EXPECT_EQ(Find(Db(), c.text), c.expected) << c.text;
}

TEST(WordFinder, PhrasesWithGaps) {
  // A phrase head is a term of its own (its statistics are the head's: 0 here).
  // "verify" then "account" within 2 words; "sign in" adjacent only.
  EXPECT_EQ(Find(Db(), "verify account"), "w L0 w L10 P40x2 ");
  EXPECT_EQ(Find(Db(), "verify your account"), "w L0 w w L10 P40x2 ");
  EXPECT_EQ(Find(Db(), "verify your own account"), "w L0 w w w L10 ");
  EXPECT_EQ(Find(Db(), "sign in"), "w L0 w L3 P20x2 ");
  EXPECT_EQ(Find(Db(), "sign x in"), "w L0 w w L3 ");
  // "a b b c": the candidate that advanced on the first b and the copy still waiting there
  // both go on; the waiting copy completes through the second b, the advanced one misses.
  EXPECT_EQ(Find(Db(), "a b b c"), "w L0 w L1 w L1 w L2 P7x3 ");
  EXPECT_EQ(Find(Db(), "a b c"), "w L0 w L1 w L2 P7x3 ");
}

TEST(WordFinder, ChunkInvariance) {
  const std::string text =
      "Verify your ACCOUNT, sign in: caf&eacute; \xd0\x9f\xd0\x90\xd0\xa0\xd0\x9e\xd0\x9b\xd0\xac "
      "\xe5\xaf\x86\xe5\xaf\x86 stra\xc3\x9f"
      "e a b b c pa&zz;ss \xf0\x9f\x98\x80 \xff pass";
  const std::string whole = Find(Db(), text);
  EXPECT_EQ(Find(Db(), text, 1), whole);
  std::mt19937 rng(7);
  for (int round = 0; round < 50; ++round) EXPECT_EQ(Find(Db(), text, 1 + rng() % 9), whole);
}

TEST(WordFinder, CandidatesAreBounded) {
  // Every word opens a phrase that waits long: the live candidates stop at the limit.
  const LexemeDB db = features_test::Lexemes("x(60000)y 5 0 0\ny 1 0 0\n");
  std::string text;
  for (std::size_t i = 0; i < 3 * kMaxPhraseCandidates; ++i) text += "x ";
  text += "y";
  const std::string out = Find(db, text);
  std::size_t phrases = 0;
  for (std::size_t p = out.find("P5"); p != std::string::npos; p = out.find("P5", p + 1)) ++phrases;
  EXPECT_EQ(phrases, kMaxPhraseCandidates);
}

}  // namespace
}  // namespace lex
