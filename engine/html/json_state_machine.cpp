#include "engine/html/json_state_machine.h"

#include <cstdint>

#include "engine/html/byte_scan.h"

namespace utils {
namespace {

// Anything below 33 is a blank; bytes are unsigned, so nothing above 0x7F is.
constexpr bool isBlank(std::uint8_t b) { return b < 33; }
constexpr bool isDigit(std::uint8_t b) { return b >= '0' && b <= '9'; }

}  // namespace

using util::Pop;
using util::PopReprocess;
using util::Push;
using util::PushReprocess;
using util::Stay;
using util::Transition;

template <typename Char>
class JSONStateMachine<Char>::WrongState final : public state_t {
 public:
  Transition process(std::uint8_t) override { return Stay(); }
  static constexpr bool kBulk = true;
  const std::uint8_t* consume(const std::uint8_t*, const std::uint8_t* end) override { return end; }
};

// Counts the open arrays and objects for the nesting limit.
template <typename Char>
class JSONStateMachine<Char>::NestingCount {
 public:
  explicit NestingCount(JSONStateMachine& m) : m_(m) { ++m_.nesting_; }
  ~NestingCount() { --m_.nesting_; }
  NestingCount(const NestingCount&) = delete;
  NestingCount& operator=(const NestingCount&) = delete;

 private:
  JSONStateMachine& m_;
};

// The bottom state: blanks around one value.
template <typename Char>
class JSONStateMachine<Char>::InitState final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    if (isBlank(b)) return Stay();
    if (seen_) return Push<WrongState>(this->machine());
    seen_ = true;
    return PushReprocess<ValueState>(this->machine());
  }

 private:
  bool seen_ = false;
};

template <typename Char>
class JSONStateMachine<Char>::ValueState final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    JSONStateMachine& m = this->machine();
    const bool nestingFull = m.nesting_ >= kMaxJsonNesting;
    switch (b) {
      case '"':
        started_ = true;
        return Push<StringState<1>>(m);
      case '[':
        started_ = true;
        return nestingFull ? Push<WrongState>(m) : Push<ArrayState>(m, m);
      case '{':
        started_ = true;
        return nestingFull ? Push<WrongState>(m) : Push<ObjectState>(m, m);
      case 'f':
        started_ = true;
        return Push<FalseState>(m);
      case 'n':
        started_ = true;
        return Push<NullState>(m);
      case 't':
        started_ = true;
        return Push<TrueState>(m);
      default:
        if (b == '-' || isDigit(b)) {
          started_ = true;
          return Push<NumberState>(m);
        }
        return started_ ? PopReprocess(1) : Push<WrongState>(m);
    }
  }

 private:
  bool started_ = false;
};

template <typename Char>
class JSONStateMachine<Char>::ObjectState final : public state_t {
 public:
  explicit ObjectState(JSONStateMachine& m) : count_(m) {}
  Transition process(std::uint8_t b) override {
    if (isBlank(b)) return Stay();
    JSONStateMachine& m = this->machine();
    switch (step_++) {
      case 0:  // a member name or the end of an empty object
        if (b == '"') return Push<StringState<0>>(m);
        if (b == '}') return Pop(2);
        break;
      case 1:
        if (b == ':') return Stay();
        break;
      case 2:
        return PushReprocess<ValueState>(m);
      default:  // after a member
        if (b == ',') {
          step_ = 0;
          return Stay();
        }
        if (b == '}') return Pop(2);
        break;
    }
    return Push<WrongState>(m);
  }

 private:
  NestingCount count_;
  int step_ = 0;
};

template <typename Char>
class JSONStateMachine<Char>::ArrayState final : public state_t {
 public:
  explicit ArrayState(JSONStateMachine& m) : count_(m) {}
  Transition process(std::uint8_t b) override {
    if (isBlank(b)) return Stay();
    JSONStateMachine& m = this->machine();
    if (b == ']') return Pop(2);
    if (b == ',') {
      if (!hadValue_) return Push<WrongState>(m);
      hadValue_ = false;
      return Stay();
    }
    if (hadValue_) return Push<WrongState>(m);
    hadValue_ = true;
    return PushReprocess<ValueState>(m);
  }

 private:
  NestingCount count_;
  bool hadValue_ = false;
};

// Kind 0 is a member name (pops back to its object), kind 1 a string value (pops its
// ValueState too).
template <typename Char>
template <int Kind>
class JSONStateMachine<Char>::StringState final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    if (escape_) {
      escape_ = false;
    } else if (b == '\\') {
      escape_ = true;
    } else if (b == '"') {
      return Pop(Kind == 0 ? 1 : 2);
    }
    return Stay();
  }
  static constexpr bool kBulk = true;
  const std::uint8_t* consume(const std::uint8_t* p, const std::uint8_t* end) override {
    return escape_ ? p : html::findEither(p, end, '"', '\\');
  }

 private:
  bool escape_ = false;
};

template <typename Char>
class JSONStateMachine<Char>::NumberState final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    switch (part_) {
      case 0:  // integer part
        if (isDigit(b)) return Stay();
        if (b == '.') return advance(1);
        if (b == 'e' || b == 'E') return advance(2);
        break;
      case 1:  // fraction
        if (isDigit(b)) return Stay();
        if (b == 'e' || b == 'E') return advance(2);
        break;
      case 2:  // right after the exponent mark
        part_ = 3;
        if (b == '+' || b == '-') return Stay();
        [[fallthrough]];
      default:
        if (isDigit(b)) return Stay();
        break;
    }
    return PopReprocess(1);
  }

 private:
  Transition advance(int part) {
    part_ = part;
    return Stay();
  }
  int part_ = 0;
};

// true, false and null after their first byte.
template <typename Char>
class JSONStateMachine<Char>::CharsSetState : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    const char expected = expectedAt(position_);
    if (expected == '\0') return PopReprocess(1);
    if (b == static_cast<std::uint8_t>(expected)) {
      ++position_;
      return Stay();
    }
    return Push<WrongState>(this->machine());
  }
  // The byte expected at `position`, a zero after the last.
  virtual char expectedAt(std::size_t position) const = 0;

 private:
  std::size_t position_ = 0;
};

template <typename Char>
class JSONStateMachine<Char>::TrueState final : public CharsSetState {
 public:
  char expectedAt(std::size_t position) const override { return "rue"[position]; }
};

template <typename Char>
class JSONStateMachine<Char>::FalseState final : public CharsSetState {
 public:
  char expectedAt(std::size_t position) const override { return "alse"[position]; }
};

template <typename Char>
class JSONStateMachine<Char>::NullState final : public CharsSetState {
 public:
  char expectedAt(std::size_t position) const override { return "ull"[position]; }
};

template <typename Char>
JSONStateMachine<Char>::JSONStateMachine() {
  this->template pushState<InitState>();
}

template <typename Char>
bool JSONStateMachine<Char>::accepted() const {
  return dynamic_cast<const WrongState*>(this->top()) == nullptr;
}

template class JSONStateMachine<char>;

}  // namespace utils
