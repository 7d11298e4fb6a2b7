// The lexeme database, container entry "lexdb.txt": normalised words and phrases whose
// occurrence in a page or a mail is a feature, each with three numbers (LexemeStats).
//
// Entry text, one line per entry, every line normalised first (NormalizeLine):
//   optional first line "#" and up to seven numbers: capacity hints, honoured up to
//     kMaxCapacityHint each
//   phrase lines, first: "head(gap)lexeme(gap)lexeme A B [C]"; a gap is the largest
//     distance, in words, from the lexeme before to the next one
//   lexeme lines: "lexeme A B [C]"
// A is first_value, B second_value, C third_value; each is the run of digits that starts
// its blank-separated token (0 without one), saturated to its field. The first line without
// "(" ends the phrases; a line that starts with a blank, an empty line or the end of the
// entry ends the lexemes. A line without a blank raises std::runtime_error
// "invalid lexdb string '<line>'", so does an entry that ends inside the phrases.
//
// Term ids: ordinary lexemes 1, 2, 3 ... index the statistics table (0 is reserved); phrase
// heads have bit 23 set and index the phrase-head table, which also gives each head its
// range of phrases. A phrase whose head is not a phrase head, whose lexemes are not all in
// the trie, whose gap is 0 or does not fit 16 bits, or which has no lexeme after its head,
// is dropped without a message.
#pragma once

#include <cstddef>
#include <cstdint>
#include <istream>
#include <string>
#include <string_view>
#include <vector>

#include "engine/common/file_interfaces.h"
#include "engine/kb/lex_trie.h"
#include "engine/kb/lexeme_stats.h"

namespace lex {

inline constexpr char kLexdbEntry[] = "lexdb.txt";
// Phrase-head ids carry this bit; ordinary ids and head indexes stay below it.
inline constexpr std::uint32_t kPhraseHeadBit = 0x800000;
inline constexpr std::size_t kMaxTerms = kPhraseHeadBit - 1;
// Phrases and phrase items are indexed with 32 bits; this keeps them far from it.
inline constexpr std::size_t kMaxPhraseRecords = std::size_t{1} << 24;
// A header hint reserves at most this many elements of a table.
inline constexpr std::size_t kMaxCapacityHint = std::size_t{1} << 20;

template <class Ch, class Stats>
class WordsDB {
 public:
  using Trie = Character<Ch, Stats>;
  using NodeId = typename Trie::NodeId;

  struct PhraseHead {
    Stats stats;
    std::uint32_t first = 0;  // [first, end) of this head's phrases
    std::uint32_t end = 0;
  };
  struct Phrase {
    std::uint32_t first = 0;  // [first, end) of the phrase's items
    std::uint32_t end = 0;
    Stats stats;
  };
  // One lexeme after the head, with the gap written before it.
  struct PhraseItem {
    NodeId node = Trie::kNoNode;
    std::uint16_t gap = 0;
  };
  static_assert(sizeof(PhraseItem) == 8);

  class PhrTermAllocator;
  class PhraseMaker;

  // Loads lines from `in` into this (empty) database.
  void Load(std::istream& in);

  const Trie& trie() const { return trie_; }
  // The term of a normalised word; 0 when it is not a lexeme.
  std::uint32_t FindTerm(std::string_view word) const;
  // The statistics of a term id, or nullptr for an id that names nothing.
  const Stats* StatsOf(std::uint32_t term) const;
  // The phrase-head record of a phrase-head id, or nullptr.
  const PhraseHead* HeadOf(std::uint32_t term) const;
  // The term id whose statistics `stats` points at (an ordinary term or a phrase head), or 0
  // when it points at none of this database's.
  std::uint32_t TermOfStats(const Stats* stats) const;
  const std::vector<Phrase>& phrases() const { return phrases_; }
  const std::vector<PhraseItem>& items() const { return items_; }

  std::size_t term_count() const { return stats_.empty() ? 0 : stats_.size() - 1; }
  std::size_t head_count() const { return heads_.size(); }

 private:
  struct Pending {
    std::string text;
    Stats stats;
  };

  void ReserveFromHeader(std::string_view header, std::vector<Pending>& pending);

  Trie trie_;
  std::vector<Stats> stats_;  // index 0 reserved once the lexeme lines start
  std::vector<PhraseHead> heads_;
  std::vector<Phrase> phrases_;
  std::vector<PhraseItem> items_;
};

// The term allocator of loading: phrase heads while the statistics table is still empty
// (the phrase lines), ordinary terms once it holds its reserved entry.
template <class Ch, class Stats>
class WordsDB<Ch, Stats>::PhrTermAllocator final : public Trie::TermAllocator {
 public:
  explicit PhrTermAllocator(WordsDB& db) : db_(db) {}
  std::uint32_t NewTerm() override;
  void SetStats(std::uint32_t term, const Stats& stats) override;

 private:
  WordsDB& db_;
};

// Builds one phrase from its text once every lexeme is in the trie.
template <class Ch, class Stats>
class WordsDB<Ch, Stats>::PhraseMaker {
 public:
  struct Part {
    std::string_view lexeme;
    std::uint32_t gap = 0;  // written before this lexeme; 0 for the head
  };

  // Splits "head(gap)lexeme(gap)lexeme" into its lexemes. False when a "(" is not closed
  // by ")" after digits; a gap that is not a number below 2^16 reads as 0.
  static bool Split(std::string_view text, std::vector<Part>& parts);

  explicit PhraseMaker(WordsDB& db) : db_(db) {}
  // Appends the phrase to the tables when it passes every test; false when it is dropped.
  bool Build(std::string_view text, const Stats& stats);

 private:
  WordsDB& db_;
  std::vector<Part> parts_;
};

// Opens "lexdb.txt" in `container` and loads it into `db`. A missing (or empty) entry
// raises ap::Error "null readable for tell".
void LoadWordsDB(ap::FileSystemI& container, WordsDB<char, LexemeStats>& db);

// The number that starts `token`: its leading digits, saturated at `max`.
std::uint32_t LeadingNumber(std::string_view token, std::uint32_t max);

}  // namespace lex
