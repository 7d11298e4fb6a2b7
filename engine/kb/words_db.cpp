#include "engine/kb/words_db.h"

#include <algorithm>
#include <stdexcept>

#include "engine/common/trace.h"
#include "engine/kb/case_fold.h"
#include "engine/kb/readable_stream.h"

namespace lex {
namespace {

constexpr std::uint32_t kMaxGap = 0xFFFF;

bool IsDigit(char c) { return c >= '0' && c <= '9'; }

// Splits at single blanks: "a  b" has an empty token between the blanks.
std::string_view NextToken(std::string_view& rest) {
  const std::size_t blank = rest.find(' ');
  const std::string_view token = rest.substr(0, blank);
  rest = blank == std::string_view::npos ? std::string_view() : rest.substr(blank + 1);
  return token;
}

struct ParsedLine {
  std::string_view lexeme;
  LexemeStats stats;
};

ParsedLine Parse(const std::string& line) {
  const std::size_t blank = line.find(' ');
  if (blank == std::string::npos) throw std::runtime_error("invalid lexdb string '" + line + "'");
  ParsedLine parsed;
  parsed.lexeme = std::string_view(line).substr(0, blank);
  std::string_view rest = std::string_view(line).substr(blank + 1);
  parsed.stats.first_value = static_cast<std::uint16_t>(LeadingNumber(NextToken(rest), 0xFFFF));
  parsed.stats.second_value = LeadingNumber(NextToken(rest), 0xFFFFFFFFu);
  parsed.stats.third_value = static_cast<std::uint16_t>(LeadingNumber(NextToken(rest), 0xFFFF));
  return parsed;
}

template <class Table>
void CheckRoom(const Table& table, std::size_t limit) {
  if (table.size() >= limit) throw std::length_error("vector<T> too long");
}

}  // namespace

std::uint32_t LeadingNumber(std::string_view token, std::uint32_t max) {
  std::uint64_t value = 0;
  for (const char c : token) {
    if (!IsDigit(c)) break;
    value = value * 10 + static_cast<std::uint64_t>(c - '0');
    if (value > max) value = max;  // stays small enough never to overflow
  }
  return static_cast<std::uint32_t>(value);
}

template <class Ch, class Stats>
std::uint32_t WordsDB<Ch, Stats>::PhrTermAllocator::NewTerm() {
  if (db_.stats_.empty()) {
    CheckRoom(db_.heads_, kMaxTerms);
    db_.heads_.emplace_back();
    return kPhraseHeadBit | static_cast<std::uint32_t>(db_.heads_.size() - 1);
  }
  CheckRoom(db_.stats_, kMaxTerms + 1);
  db_.stats_.emplace_back();
  return static_cast<std::uint32_t>(db_.stats_.size() - 1);
}

template <class Ch, class Stats>
void WordsDB<Ch, Stats>::PhrTermAllocator::SetStats(std::uint32_t term, const Stats& stats) {
  if ((term & kPhraseHeadBit) != 0) {
    db_.heads_[term & ~kPhraseHeadBit].stats = stats;
  } else {
    db_.stats_[term] = stats;
  }
}

template <class Ch, class Stats>
bool WordsDB<Ch, Stats>::PhraseMaker::Split(std::string_view text, std::vector<Part>& parts) {
  parts.clear();
  std::uint32_t gap = 0;
  for (;;) {
    const std::size_t open = text.find('(');
    parts.push_back(Part{text.substr(0, open), gap});
    if (open == std::string_view::npos) return true;
    const std::size_t close = text.find(')', open + 1);
    if (close == std::string_view::npos) return false;
    const std::string_view number = text.substr(open + 1, close - open - 1);
    const bool digits = !number.empty() && std::all_of(number.begin(), number.end(), IsDigit) &&
                        LeadingNumber(number, kMaxGap + 1) <= kMaxGap;
    gap = digits ? LeadingNumber(number, kMaxGap) : 0;
    text = text.substr(close + 1);
  }
}

template <class Ch, class Stats>
bool WordsDB<Ch, Stats>::PhraseMaker::Build(std::string_view text, const Stats& stats) {
  if (!Split(text, parts_) || parts_.size() < 2) return false;
  const std::uint32_t head = db_.FindTerm(parts_[0].lexeme);
  if ((head & kPhraseHeadBit) == 0) return false;
  const std::size_t items_before = db_.items_.size();
  for (std::size_t i = 1; i < parts_.size(); ++i) {
    const NodeId node = parts_[i].lexeme.empty() ? Trie::kNoNode : db_.trie_.Find(parts_[i].lexeme);
    if (node == Trie::kNoNode || db_.trie_.Term(node) == 0 || parts_[i].gap == 0) {
      db_.items_.resize(items_before);
      return false;
    }
    db_.items_.push_back(PhraseItem{node, static_cast<std::uint16_t>(parts_[i].gap)});
  }
  PhraseHead& record = db_.heads_[head & ~kPhraseHeadBit];
  const auto index = static_cast<std::uint32_t>(db_.phrases_.size());
  // A head's phrases must be contiguous; sorting the phrase texts guarantees it.
  if (record.first != record.end && record.end != index) {
    db_.items_.resize(items_before);
    return false;
  }
  if (record.first == record.end) record.first = index;
  record.end = index + 1;
  Phrase phrase;
  phrase.first = static_cast<std::uint32_t>(items_before);
  phrase.end = static_cast<std::uint32_t>(db_.items_.size());
  phrase.stats = stats;
  db_.phrases_.push_back(phrase);
  return true;
}

template <class Ch, class Stats>
void WordsDB<Ch, Stats>::ReserveFromHeader(std::string_view header, std::vector<Pending>& pending) {
  std::string_view rest = header.substr(1);
  std::size_t hint[7] = {};
  for (int i = 0; i < 7 && !rest.empty(); ++i) {
    hint[i] = std::min<std::size_t>(LeadingNumber(NextToken(rest), 0xFFFFFFFFu), kMaxCapacityHint);
  }
  stats_.reserve(hint[0]);
  heads_.reserve(hint[1]);
  items_.reserve(hint[2]);
  phrases_.reserve(hint[3]);
  pending.reserve(hint[3]);
  trie_.Reserve(hint[4]);
  // The sixth hint sized a pool of child vectors that the table above replaces; the seventh
  // is not used.
}

template <class Ch, class Stats>
void WordsDB<Ch, Stats>::Load(std::istream& in) {
  std::string raw;
  std::string line;
  const auto next = [&]() {
    if (!std::getline(in, raw)) return false;
    line = NormalizeLine(raw);
    return true;
  };

  std::vector<Pending> pending;
  std::size_t lines = 0;
  PhrTermAllocator allocator(*this);
  if (!next() || line.empty()) return;
  if (line[0] == '#') {
    ReserveFromHeader(line, pending);
    if (!next() || line.empty()) return;
  }

  bool lexemes = false;
  for (;;) {  // phrase lines
    const ParsedLine parsed = Parse(line);
    ++lines;
    if (parsed.lexeme.empty()) break;
    const std::size_t open = parsed.lexeme.find('(');
    if (open == std::string_view::npos) {
      AP_TRACE(ap::kSeverityMessage) << pending.size() << " phrases";
      stats_.assign(1, Stats{});
      lexemes = true;
      break;
    }
    if (open != 0) trie_.Insert(parsed.lexeme.substr(0, open), allocator, Stats{});
    CheckRoom(pending, kMaxPhraseRecords);
    pending.push_back(Pending{std::string(parsed.lexeme), parsed.stats});
    // The phrases may not be the whole entry: an empty line here fails to parse.
    if (!next()) line.clear();
  }
  while (lexemes) {  // lexeme lines, the current one (already counted) first
    const ParsedLine parsed = Parse(line);
    if (parsed.lexeme.empty()) break;
    trie_.Insert(parsed.lexeme, allocator, parsed.stats);
    if (!next() || line.empty()) break;
    ++lines;
  }
  AP_TRACE(ap::kSeverityMessage) << lines << " lines loaded during lex load";

  // Every lexeme of a phrase becomes a term, then the phrases are built head by head.
  std::vector<typename PhraseMaker::Part> parts;
  for (const Pending& phrase : pending) {
    if (!PhraseMaker::Split(phrase.text, parts)) continue;
    for (const auto& part : parts) {
      if (part.lexeme.empty() || FindTerm(part.lexeme) != 0) continue;
      trie_.Insert(part.lexeme, allocator, Stats{});
    }
  }
  std::stable_sort(pending.begin(), pending.end(),
                   [](const Pending& a, const Pending& b) { return a.text < b.text; });
  PhraseMaker maker(*this);
  for (const Pending& phrase : pending) {
    if (phrases_.size() >= kMaxPhraseRecords) break;
    maker.Build(phrase.text, phrase.stats);
  }
  stats_.shrink_to_fit();
}

template <class Ch, class Stats>
std::uint32_t WordsDB<Ch, Stats>::FindTerm(std::string_view word) const {
  const NodeId node = trie_.Find(word);
  return node == Trie::kNoNode ? 0 : trie_.Term(node);
}

template <class Ch, class Stats>
const Stats* WordsDB<Ch, Stats>::StatsOf(std::uint32_t term) const {
  if (term == 0) return nullptr;
  if ((term & kPhraseHeadBit) != 0) {
    const PhraseHead* head = HeadOf(term);
    return head == nullptr ? nullptr : &head->stats;
  }
  return term < stats_.size() ? &stats_[term] : nullptr;
}

template <class Ch, class Stats>
const typename WordsDB<Ch, Stats>::PhraseHead* WordsDB<Ch, Stats>::HeadOf(
    std::uint32_t term) const {
  if ((term & kPhraseHeadBit) == 0) return nullptr;
  const std::uint32_t index = term & ~kPhraseHeadBit;
  return index < heads_.size() ? &heads_[index] : nullptr;
}

template <class Ch, class Stats>
std::uint32_t WordsDB<Ch, Stats>::TermOfStats(const Stats* stats) const {
  if (stats == nullptr) return 0;
  // Compared as addresses: a pointer into another array must not be subtracted.
  const auto address = reinterpret_cast<std::uintptr_t>(stats);
  const auto begin = reinterpret_cast<std::uintptr_t>(stats_.data());
  if (address >= begin && address < begin + stats_.size() * sizeof(Stats)) {
    return static_cast<std::uint32_t>((address - begin) / sizeof(Stats));  // 0: the reserved one
  }
  for (std::size_t i = 0; i < heads_.size(); ++i) {
    if (&heads_[i].stats == stats) return static_cast<std::uint32_t>(i) | kPhraseHeadBit;
  }
  return 0;
}

template class WordsDB<char, LexemeStats>;

void LoadWordsDB(ap::FileSystemI& container, WordsDB<char, LexemeStats>& db) {
  ap::EntryTextStream in(container.open(kLexdbEntry));
  db.Load(in);
}

}  // namespace lex
