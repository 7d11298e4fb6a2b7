// A validator that runs beside the HTML tokenizer over the same bytes and tells, without
// building anything, whether the document so far can still be one JSON value. It is lenient
// by design (a trailing ',' in an array, a lone '-' and values that follow a number or a
// literal without a ',' pass); a document cut off mid-value still counts as JSON.
#pragma once

#include <cstddef>

#include "engine/html/state_machine.h"

namespace utils {

// Arrays and objects nested deeper than this make the document "not JSON": each level holds
// two states, and an unbounded stack would let a page of '[' bytes exhaust the state arena.
inline constexpr std::size_t kMaxJsonNesting = 1024;

template <typename Char>
class JSONStateMachine : public util::StateMachine<Char, JSONStateMachine<Char>> {
  using Engine = util::StateMachine<Char, JSONStateMachine>;

 public:
  using state_t = typename Engine::State;

  JSONStateMachine();

  // True unless the top state is WrongState, the state that swallows everything after the
  // first byte that cannot belong to a JSON value.
  bool accepted() const;
  // Arrays and objects open right now.
  std::size_t nesting() const { return nesting_; }

 private:
  class InitState;
  class ValueState;
  class ObjectState;
  class ArrayState;
  template <int Kind>
  class StringState;
  class NumberState;
  class CharsSetState;
  class TrueState;
  class FalseState;
  class NullState;
  class WrongState;
  class NestingCount;

  std::size_t nesting_ = 0;
};

extern template class JSONStateMachine<char>;

}  // namespace utils
