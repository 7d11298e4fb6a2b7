// A byte-at-a-time lexical scanner of script text. It does not parse script: it finds string
// literals and hands their decoded text to its handler, and skips comments and regular
// expression literals so that their quotes are not taken for strings. Whether a '/' starts a
// regular expression or divides is guessed from the byte before it.
#pragma once

#include <cstddef>

#include "engine/html/state_machine.h"

namespace ap {

template <typename Char>
class JSParser : public util::StateMachine<Char, JSParser<Char>> {
  using Engine = util::StateMachine<Char, JSParser>;

 public:
  // Receives the text of string literals, escapes decoded, the closing quote included as the
  // last byte of the last piece. A piece may be empty.
  class Handler {
   public:
    virtual void text(const Char* data, std::size_t length) = 0;
    virtual ~Handler() = default;
  };

  class state_t : public Engine::State {
   public:
    // The end of the script: a string state hands over what it holds.
    virtual void finish() {}
  };

  // Throws ap::Error "JSParser(): null handler" when `handler` is null.
  explicit JSParser(Handler* handler);

  // Calls finish on the top state; the caller does this at the end of the script.
  void finish() { static_cast<state_t*>(this->top())->finish(); }

 private:
  class ScriptState;
  class ScriptDiv;
  class ScriptOLComment;
  class ScriptMLComment;
  class RegexpState;
  template <typename Quote>
  class ScriptStringState;
  class EscScriptStringState;
  class EscUState;

  Handler* handler_;
  // Whether the '/' being looked at follows an operand (and so divides).
  bool divisionContext_ = false;
};

extern template class JSParser<char>;

}  // namespace ap
