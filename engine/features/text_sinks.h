// The small text sinks the feature extractor hands to the decrunch pipeline:
//   LexerWrapper  page or script text straight into a word finder;
//   TextToString  an anchor's text, collected into one string (up to kMaxAnchorText);
//   TitleLexer    a title or description, summarised as lexeme and phrase weights by band,
//                 the flags and organisations of its hits, and its word count.
// Each calls its completion callback when its element ends.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <set>
#include <string>

#include "engine/features/utf8_normalizer.h"
#include "engine/features/word_finder.h"
#include "engine/html/decrunch_interfaces.h"
#include "engine/kb/lexeme_stats.h"
#include "engine/kb/words_db.h"

namespace html_features {

using LexemeDB = lex::WordsDB<char, lex::LexemeStats>;

// A text sink that feeds a normaliser; a block break is a word break.
template <class Normalizer>
class LexerWrapper final : public html::DecrunchInterfaces::TextHandler {
 public:
  explicit LexerWrapper(Normalizer& normalizer) : normalizer_(normalizer) {}
  void text(const char* data, std::size_t length) override { normalizer_.text(data, length); }
  void breakText() override { normalizer_.wordEnd(); }
  void end() override {}

 private:
  Normalizer& normalizer_;
};

// The anchor text stops growing once it holds this many bytes (a chunk is taken whole when
// the string is still below it).
inline constexpr std::size_t kMaxAnchorText = 20000;

class TextToString final : public html::DecrunchInterfaces::TextHandler {
 public:
  using Callback = std::function<void(const std::string&)>;

  explicit TextToString(Callback done) : done_(std::move(done)) {}
  void start() { text_.clear(); }
  void text(const char* data, std::size_t length) override {
    if (text_.size() < kMaxAnchorText) text_.append(data, length);
  }
  void breakText() override { text_.push_back(' '); }
  void end() override {
    if (done_) done_(text_);
  }
  const std::string& collected() const { return text_; }

 private:
  Callback done_;
  std::string text_;
};

// Hears every lexeme and phrase a word finder of the extractor matches, whatever its weight
// or flags, before the extractor weighs it: for tools that ask which words of the lexicon a
// text holds. The references point into the lexeme database.
class LexemeObserverI {
 public:
  virtual void lexeme(const lex::LexemeStats& stats) = 0;
  virtual void phrase(const LexemeDB::Phrase& phrase) = 0;
  virtual ~LexemeObserverI() = default;
};

// Weight bands of lexeme and phrase hits: up to 30, 31 to 65, 66 and more.
inline int WeightBand(double w) { return w <= 30 ? 0 : w < 66 ? 1 : 2; }

// What a title lexer, or an anchor's text, adds up.
struct LexemeSummary {
  // A hit whose flags have a bit of this mask counts for nothing.
  static constexpr std::uint16_t kExclusionMask = 0x100;
  // Organisations kept per summary: a text naming more adds nothing new.
  static constexpr std::size_t kMaxKeys = 64;

  std::uint64_t words = 0;
  std::uint64_t phraseItems = 0;
  std::uint32_t lexemeSum[3] = {0, 0, 0};
  std::uint64_t lexemeHits[3] = {0, 0, 0};
  std::uint32_t phraseSum[3] = {0, 0, 0};
  std::uint64_t phraseHits[3] = {0, 0, 0};
  std::uint32_t flags = 0;
  std::set<std::uint32_t> keys;
  LexemeObserverI* observer = nullptr;  // not owned; may be null

  // The finder's handler operations.
  void word() { ++words; }
  void lexeme(const lex::LexemeStats& s);
  void phrase(const LexemeDB::Phrase& p, std::uint16_t items);

  double lexemeTotal() const { return double(lexemeSum[0]) + lexemeSum[1] + lexemeSum[2]; }
  double phraseTotal() const { return double(phraseSum[0]) + phraseSum[1] + phraseSum[2]; }
  void addKey(std::uint32_t key) {
    if (key != 0 && keys.size() < kMaxKeys) keys.insert(key);
  }
};

class TitleLexer final : public html::DecrunchInterfaces::TextHandler {
 public:
  using Callback = std::function<void(const TitleLexer&)>;

  TitleLexer(const LexemeDB& db, Callback done)
      : finder_(db, summary_), normalizer_(finder_), done_(std::move(done)) {}
  TitleLexer(const TitleLexer&) = delete;
  TitleLexer& operator=(const TitleLexer&) = delete;

  void text(const char* data, std::size_t length) override {
    bytes_ += length;
    normalizer_.text(data, length);
  }
  void breakText() override { normalizer_.wordEnd(); }
  void end() override {
    normalizer_.wordEnd();
    if (done_) done_(*this);
  }

  const LexemeSummary& summary() const { return summary_; }
  void setObserver(LexemeObserverI* observer) { summary_.observer = observer; }
  std::uint64_t bytes() const { return bytes_; }

 private:
  using Finder = lex::WordsFinder<LexemeDB, LexemeSummary>;
  LexemeSummary summary_;
  Finder finder_;
  lex::UTF8Normalizer<Finder> normalizer_;
  std::uint64_t bytes_ = 0;
  Callback done_;
};

}  // namespace html_features
