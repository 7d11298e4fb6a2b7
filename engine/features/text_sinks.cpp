#include "engine/features/text_sinks.h"

namespace html_features {

void LexemeSummary::lexeme(const lex::LexemeStats& s) {
  if (observer != nullptr) observer->lexeme(s);
  if (s.first_value == 0 || (s.third_value & kExclusionMask) != 0) return;
  const int band = WeightBand(s.first_value);
  lexemeSum[band] += s.first_value;
  ++lexemeHits[band];
  flags |= s.third_value;
  addKey(s.second_value);
}

void LexemeSummary::phrase(const LexemeDB::Phrase& p, std::uint16_t items) {
  if (observer != nullptr) observer->phrase(p);
  const lex::LexemeStats& s = p.stats;
  if ((s.third_value & kExclusionMask) != 0) return;
  const int band = WeightBand(s.first_value);
  phraseSum[band] += s.first_value;
  ++phraseHits[band];
  flags |= s.third_value;
  phraseItems += items;
  addKey(s.second_value);
}

}  // namespace html_features
