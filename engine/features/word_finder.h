// The word finder: cuts text into words, folds case and follows every word through the
// lexeme database's trie, one trie step per byte; it also follows the database's phrases
// (lexemes in order, each within a gap of words after the one before).
//
// lex::UTF8Normalizer sits in front of it: it decodes UTF-8 and character references,
// folds case as the lexeme database's loader does, and ends words at delimiters.
//
// The handler hears word() for every word, lexeme(stats) for a word that is a term of the
// database and phrase(phrase, items) for every completed phrase.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "engine/kb/words_db.h"

namespace lex {

// Live phrase candidates a finder follows at once. A hostile page that opens a phrase on
// every word cannot make a word cost more than this many steps; candidates beyond it are
// not opened.
inline constexpr std::size_t kMaxPhraseCandidates = 1024;

template <class DB, class Handler>
class WordsFinder {
 public:
  using NodeId = typename DB::NodeId;
  using Phrase = typename DB::Phrase;

  WordsFinder(const DB& db, Handler& handler) : db_(db), handler_(handler) {}

  void feed(unsigned char c) {
    if (!inWord_) {
      inWord_ = true;
      cursor_ = DB::Trie::kRoot;
    }
    if (cursor_ != DB::Trie::kNoNode) cursor_ = db_.trie().Child(cursor_, static_cast<char>(c));
  }

  // Feeds the run of word bytes that starts at `p` (at least one) and returns where it
  // stops: at `end` or at the first byte that `table` maps to 0 or 0xFF, the normaliser's
  // word end and per-byte marks; other entries are the bytes to feed. The same as feed() on
  // each byte of the run, with the cursor in a register and, once the word has left the
  // trie, nothing left to do for the rest of the run but to find its end.
  const unsigned char* feedRun(const unsigned char* p, const unsigned char* end,
                               const std::uint8_t* table) {
    if (!inWord_) {
      inWord_ = true;
      cursor_ = DB::Trie::kRoot;
    }
    NodeId node = cursor_;
    const auto& trie = db_.trie();
    while (node != DB::Trie::kNoNode) {
      node = trie.Child(node, static_cast<char>(table[*p]));
      if (++p == end || !IsWordMark(table[*p])) {
        cursor_ = node;
        return p;
      }
    }
    cursor_ = node;
    while (p != end && IsWordMark(table[*p])) ++p;
    return p;
  }

  void wordEnd() {
    if (!inWord_) return;
    inWord_ = false;
    handler_.word();
    const NodeId node = cursor_;
    cursor_ = DB::Trie::kNoNode;
    const std::uint32_t term = node == DB::Trie::kNoNode ? 0 : db_.trie().Term(node);
    if (term == 0) {
      advance(DB::Trie::kNoNode);
      current_.swap(next_);
      return;
    }
    if (const auto* stats = db_.StatsOf(term)) handler_.lexeme(*stats);
    advance(node);
    if (const auto* head = db_.HeadOf(term)) {
      for (std::uint32_t p = head->first; p < head->end; ++p) {
        if (next_.size() >= kMaxPhraseCandidates) break;
        const Phrase& phrase = db_.phrases()[p];
        if (phrase.first >= phrase.end) continue;
        next_.push_back(Candidate{&phrase, phrase.first, db_.items()[phrase.first].gap, 1});
      }
    }
    current_.swap(next_);
  }

  bool inWord() const { return inWord_; }

 private:
  static bool IsWordMark(std::uint8_t mark) { return static_cast<std::uint8_t>(mark - 1) < 0xFE; }

  struct Candidate {
    const Phrase* phrase;
    std::uint32_t item;    // the item it waits for
    std::uint16_t budget;  // words it may still wait
    std::uint16_t items;   // items matched so far, the head included
  };

  void push(const Candidate& candidate) {
    if (next_.size() < kMaxPhraseCandidates) next_.push_back(candidate);
  }

  // Moves every live candidate past the word that just ended (`node`: its trie node, or
  // none) into the next list, which the caller opens new phrases into and swaps in.
  void advance(NodeId node) {
    next_.clear();
    for (const Candidate& c : current_) {
      if (node != DB::Trie::kNoNode && db_.items()[c.item].node == node) {
        const std::uint16_t items = c.items == 0xFFFF ? c.items : c.items + 1;
        if (c.item + 1 >= c.phrase->end) {
          handler_.phrase(*c.phrase, items);
        } else {
          push(Candidate{c.phrase, c.item + 1, db_.items()[c.item + 1].gap, items});
        }
        if (c.budget > 1) push(Candidate{c.phrase, c.item, std::uint16_t(c.budget - 1), c.items});
      } else if (c.budget > 1) {
        push(Candidate{c.phrase, c.item, std::uint16_t(c.budget - 1), c.items});
      }
    }
  }

  const DB& db_;
  Handler& handler_;
  bool inWord_ = false;
  NodeId cursor_ = DB::Trie::kNoNode;
  std::vector<Candidate> current_;
  std::vector<Candidate> next_;
};

}  // namespace lex
