// The three numbers the lexeme database keeps for every lexeme and phrase.
#pragma once

#include <cstdint>

namespace lex {

struct LexemeStats {
  std::uint32_t second_value = 0;  // the line's second number: an organisation domain key
  std::uint16_t first_value = 0;   // the first number: a weight
  std::uint16_t third_value = 0;   // the third number (0 when absent): flags
};
static_assert(sizeof(LexemeStats) == 8);

}  // namespace lex
