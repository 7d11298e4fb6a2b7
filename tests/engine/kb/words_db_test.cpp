// The lexeme database: line grammar, term ids, phrases, the trie, traces and faults.
#include "engine/kb/words_db.h"

#include <gtest/gtest.h>

#include <random>
#include <set>
#include <sstream>

#include "engine/common/error.h"
#include "tests/support/kb_test_support.h"
#include "tests/support/kbdb_test_support.h"

namespace {

using Db = lex::WordsDB<char, lex::LexemeStats>;

std::unique_ptr<Db> Load(const std::string& text) {
  auto db = std::make_unique<Db>();
  std::istringstream in(text);
  db->Load(in);
  return db;
}

std::string ErrorOf(const std::string& text) {
  return pelmix::testing::ErrorOf<std::runtime_error>([&] { Load(text); });
}

// "first second third" of a normalised word, or "none".
std::string StatsOf(const Db& db, const std::string& word) {
  const lex::LexemeStats* stats = db.StatsOf(db.FindTerm(word));
  if (stats == nullptr) return "none";
  return std::to_string(stats->first_value) + " " + std::to_string(stats->second_value) + " " +
         std::to_string(stats->third_value);
}

// The nodes reachable from the root (the trie's table also holds free room).
std::vector<Db::NodeId> Reachable(const Db& db) {
  std::vector<Db::NodeId> nodes = {Db::Trie::kRoot};
  for (std::size_t i = 0; i < nodes.size(); ++i) {
    const auto& node = db.trie().node(nodes[i]);
    for (std::uint32_t k = 0; k < node.count; ++k) nodes.push_back(node.first + k);
  }
  return nodes;
}

TEST(WordsDB, LexemeLines) {
  const auto db = Load(
      "Paypal 50 101\nPASSWORD 30 0 1\n\xD0\x9F\xD0\x90\xD0\xA0\xD0\x9E\xD0\x9B\xD0\xAC 30 0 1\n"
      "paypal 60 102 4\nodd 12abc x 7\nbig 99999 99999999999 70000\n");
  EXPECT_EQ(db->term_count(), 5u);
  EXPECT_EQ(db->head_count(), 0u);
  EXPECT_EQ(db->FindTerm("paypal"), 1u);  // inserted twice: first id, later numbers
  EXPECT_EQ(StatsOf(*db, "paypal"), "60 102 4");
  EXPECT_EQ(StatsOf(*db, "password"), "30 0 1");
  EXPECT_EQ(StatsOf(*db, "\xD0\xBF\xD0\xB0\xD1\x80\xD0\xBE\xD0\xBB\xD1\x8C"), "30 0 1");
  EXPECT_EQ(StatsOf(*db, "odd"), "12 0 7");
  EXPECT_EQ(StatsOf(*db, "big"), "65535 4294967295 65535");
  EXPECT_EQ(StatsOf(*db, "pay"), "none");
  EXPECT_EQ(StatsOf(*db, "paypals"), "none");
  EXPECT_EQ(db->StatsOf(0), nullptr);
  EXPECT_EQ(db->StatsOf(99), nullptr);
}

TEST(WordsDB, WhereLoadingStops) {
  EXPECT_EQ(Load("")->term_count(), 0u);
  EXPECT_EQ(Load("\nword 1 2\n")->term_count(), 0u);
  EXPECT_EQ(Load("#5 5 5 5 5 5 5\n")->term_count(), 0u);
  EXPECT_EQ(Load("#5 5\nword 1 2\n")->term_count(), 1u);
  // A line starting with a blank has an empty lexeme: the rest is not read.
  EXPECT_EQ(Load("a 1 1\n b 2 2\nc 3 3\n")->term_count(), 1u);
  EXPECT_EQ(Load("a 1 1\n\nc 3 3\n")->term_count(), 1u);
  EXPECT_EQ(Load("a 1 1\nc 3 3")->term_count(), 2u);
  // A header hint far beyond the limit is only a reservation, and a capped one.
  EXPECT_EQ(Load("#4294967295 4294967295 4294967295 4294967295 4294967295\nw 1 1\n")->term_count(),
            1u);
}

TEST(WordsDB, MalformedLines) {
  EXPECT_EQ(ErrorOf("good 1 2\nBad\n"), "invalid lexdb string 'bad'");
  EXPECT_EQ(ErrorOf("pay(1)pal 1 2\n"), "invalid lexdb string ''");
  EXPECT_EQ(ErrorOf("pay(1)pal 1 2\n\nword 1 1\n"), "invalid lexdb string ''");
  EXPECT_EQ(ErrorOf("pay(1)pal 1 2"), "invalid lexdb string ''");
  EXPECT_EQ(ErrorOf("pay(1)pal 1 2\n word 1 1\n"), "no error");
}

TEST(WordsDB, PhrasesAndTheirHeads) {
  const auto db = Load(
      "sign(1)in 20 0 0\n"
      "verify(2)account(3)now 40 7 1\n"
      "sign(2)up 25 0 0\n"
      "zero(0)gap 1 1 1\n"
      "big(70000)gap 1 1 1\n"
      "open(1 1 1 1\n"
      "(1)headless 1 1 1\n"
      "alone(3) 1 1 1\n"
      "account 5 0 0\n"
      "verify 9 8 7\n");
  // Heads get phrase-head ids in the order met; the other lexemes ordinary ones.
  const std::uint32_t sign = db->FindTerm("sign");
  const std::uint32_t verify = db->FindTerm("verify");
  EXPECT_EQ(sign, lex::kPhraseHeadBit | 0);
  EXPECT_EQ(verify, lex::kPhraseHeadBit | 1);
  EXPECT_EQ(db->head_count(), 6u);             // sign verify zero big open alone
  EXPECT_EQ(StatsOf(*db, "verify"), "9 8 7");  // a head listed as a lexeme keeps its id
  // Lexemes named only in phrases become terms with zeroed numbers.
  EXPECT_EQ(StatsOf(*db, "in"), "0 0 0");
  EXPECT_EQ(StatsOf(*db, "now"), "0 0 0");
  EXPECT_EQ(StatsOf(*db, "account"), "5 0 0");
  EXPECT_EQ((db->FindTerm("in") & lex::kPhraseHeadBit), 0u);

  // Built phrases in text order: sign(1)in, sign(2)up, verify(2)account(3)now. The zero
  // gap, the oversized gap, the unclosed gap, the empty head and the head alone are dropped.
  ASSERT_EQ(db->phrases().size(), 3u);
  const Db::PhraseHead* head = db->HeadOf(sign);
  ASSERT_NE(head, nullptr);
  EXPECT_EQ(head->first, 0u);
  EXPECT_EQ(head->end, 2u);
  EXPECT_EQ(db->HeadOf(verify)->first, 2u);
  EXPECT_EQ(db->HeadOf(verify)->end, 3u);
  EXPECT_EQ(db->HeadOf(db->FindTerm("zero"))->first, db->HeadOf(db->FindTerm("zero"))->end);

  const Db::Phrase& up = db->phrases()[1];
  EXPECT_EQ(up.stats.first_value, 25);
  ASSERT_EQ(up.end - up.first, 1u);
  EXPECT_EQ(db->items()[up.first].gap, 2);
  EXPECT_EQ(db->items()[up.first].node, db->trie().Find("up"));

  const Db::Phrase& now = db->phrases()[2];
  EXPECT_EQ(now.stats.second_value, 7u);
  ASSERT_EQ(now.end - now.first, 2u);
  EXPECT_EQ(db->items()[now.first].gap, 2);
  EXPECT_EQ(db->items()[now.first].node, db->trie().Find("account"));
  EXPECT_EQ(db->items()[now.first + 1].gap, 3);
  EXPECT_EQ(db->items()[now.first + 1].node, db->trie().Find("now"));
}

// Only phrase lines before an empty lexeme: everything named becomes a phrase head.
TEST(WordsDB, TermOfStatsFindsOrdinaryTermsAndPhraseHeads) {
  const auto db = Load("verify(2)account 40 0 1\npaypal 50 101 0\nverify 7 0 0\n");
  for (const char* word : {"paypal", "verify", "account"}) {
    const std::uint32_t term = db->FindTerm(word);
    ASSERT_NE(term, 0u) << word;
    EXPECT_EQ(db->TermOfStats(db->StatsOf(term)), term) << word;
  }
  EXPECT_NE(db->FindTerm("verify") & lex::kPhraseHeadBit, 0u);
  const lex::LexemeStats elsewhere{};
  EXPECT_EQ(db->TermOfStats(&elsewhere), 0u);
  EXPECT_EQ(db->TermOfStats(nullptr), 0u);
  // A phrase's own statistics are no term's.
  ASSERT_EQ(db->phrases().size(), 1u);
  EXPECT_EQ(db->TermOfStats(&db->phrases()[0].stats), 0u);
}

TEST(WordsDB, PhrasesWithoutLexemeLines) {
  const auto db = Load("a(1)b 1 1\n c 1 1\n");
  EXPECT_NE(db->FindTerm("b") & lex::kPhraseHeadBit, 0u);
  EXPECT_EQ(db->phrases().size(), 1u);
  EXPECT_EQ(db->term_count(), 0u);
}

TEST(WordsDB, Traces) {
  kbdb_test::TraceCapture trace;
  Load("a(1)b 1 1\nc(2)d 1 1\ne 1 1\nf 1 1\n");
  EXPECT_EQ(trace.texts(),
            (std::vector<std::string>{"2 phrases", "4 lines loaded during lex load"}));
}

// Many words with shared prefixes and every byte value: every one is found with its own
// numbers after the trie has grown and moved its child runs many times.
TEST(WordsDB, TrieKeepsEveryWord) {
  // More than 128 distinct first bytes, so that the root outgrows its first run too.
  std::string alphabet;
  for (int c = 0x21; c < 0x7F; ++c) {
    if (c != '#' && c != '(' && (c < 'A' || c > 'Z')) alphabet += static_cast<char>(c);
  }
  for (int c = 0x80; c < 0xC0; ++c) alphabet += static_cast<char>(c);
  std::mt19937 random(5);
  std::set<std::string> words;
  while (words.size() < 4000) {
    std::string word(1 + random() % 6, '\0');
    for (char& c : word)
      c = random() % 3 == 0 ? alphabet[random() % alphabet.size()] : 'a' + random() % 6;
    words.insert(word);
  }
  std::string text;
  std::size_t n = 0;
  for (const std::string& word : words) text += word + " " + std::to_string(++n % 60000) + " 1\n";
  const auto db = Load(text);
  ASSERT_EQ(db->term_count(), words.size());
  n = 0;
  for (const std::string& word : words) {
    ASSERT_EQ(StatsOf(*db, word), std::to_string(++n % 60000) + " 1 0") << word;
  }
  EXPECT_GT(db->trie().node(Db::Trie::kRoot).count, 128);
  std::set<int> modes;
  for (const Db::NodeId id : Reachable(*db)) modes.insert(db->trie().ModeOf(id));
  EXPECT_EQ(modes.size(), 5u);  // every look-up mode is in use
}

// The entry text stream refills its 4096-byte buffer mid-line: the result is the same.
TEST(WordsDB, LoadsFromTheContainer) {
  std::string text = "go(1)on 3 3\n";
  for (int i = 0; i < 800; ++i)
    text += "word" + std::to_string(i) + " " + std::to_string(i) + " 2\n";
  const auto packed = pelmix::testing::PackedOf({{"lexdb.txt", text}});
  Db db;
  lex::LoadWordsDB(*packed, db);
  EXPECT_EQ(db.term_count(), 801u);
  EXPECT_EQ(StatsOf(db, "word799"), "799 2 0");
  EXPECT_EQ(db.phrases().size(), 1u);

  const auto without = pelmix::testing::PackedOf({{"other", "x"}});
  Db empty;
  EXPECT_EQ(pelmix::testing::ErrorOf([&] { lex::LoadWordsDB(*without, empty); }),
            "null readable for tell");
}

// Damaged text loads or fails with the documented error, and every term it keeps resolves.
TEST(WordsDB, DamagedText) {
  const std::string good =
      "#6 2 3 2 40\nlog(1)in(3)now 35 0 8\nsign(1)up 20 0 0\npaypal 50 101 0\n"
      "\xD0\x9F\xD0\x90 30 0 1\nlog 5 0 0\n";
  std::mt19937 random(9);
  for (int round = 0; round < 3000; ++round) {
    std::string text = good.substr(0, random() % (good.size() + 1));
    for (int i = random() % 3; i > 0 && !text.empty(); --i) {
      text[random() % text.size()] = "( )\n0#\xD0\xFF"[random() % 8];
    }
    std::unique_ptr<Db> db;
    try {
      db = Load(text);
    } catch (const std::runtime_error& e) {
      ASSERT_EQ(std::string(e.what()).rfind("invalid lexdb string '", 0), 0u) << e.what();
      continue;
    }
    for (const Db::NodeId id : Reachable(*db)) {
      const std::uint32_t term = db->trie().Term(id);
      if (term != 0) {
        ASSERT_NE(db->StatsOf(term), nullptr) << term;
      }
    }
    for (const Db::PhraseItem& item : db->items()) {
      ASSERT_LT(item.node, db->trie().node_count());
    }
  }
}

}  // namespace
