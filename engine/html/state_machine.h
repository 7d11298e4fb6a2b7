// The push-down byte machine under every scanner of markup and script. A machine is a stack
// of state objects; each input byte goes to the top state, whose answer (a transition) may
// push a new state, pop states, and ask for the same byte to be offered again to the new top.
// Scanners never look back: everything they remember lives in their states.
//
// Most bytes of a document change nothing but the top state's own fields (text, attribute
// values, comments, script bodies). A state that declares `static constexpr bool kBulk = true`
// overrides consume() to take such a run in one call; feed() offers it every run, and the
// events stay exactly those of the byte-at-a-time machine whatever the chunking.
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <new>
#include <stdexcept>
#include <type_traits>
#include <utility>

#include "engine/html/state_arena.h"

namespace util {

// What a state answers for one byte. Pushes are carried out by the state itself (see Push
// below) before it returns, so a transition only says how many states to pop (the answering
// state counts as one) and whether the byte is to be offered again.
struct Transition {
  std::uint8_t pops = 0;
  bool reprocess = false;
};

constexpr Transition Stay() { return {}; }
constexpr Transition Pop(std::uint8_t n) { return {n, false}; }
constexpr Transition PopReprocess(std::uint8_t n) { return {n, true}; }

// Whether feed() takes the bulk paths; on by default. Turned off, every byte goes through
// process(), which makes the byte-at-a-time machine the reference the bulk paths are tested
// against. Read once per feed() call.
inline std::atomic<bool> gBulkScanning{true};
inline void setBulkScanning(bool on) { gBulkScanning.store(on, std::memory_order_relaxed); }
inline bool bulkScanning() { return gBulkScanning.load(std::memory_order_relaxed); }

// Machine is the concrete machine (CRTP); its states reach it through State::machine().
template <typename Char, typename Machine>
class StateMachine {
 public:
  // Bytes are handed to states as unsigned values whatever the signedness of Char.
  using Byte = std::make_unsigned_t<Char>;

  class State {
   public:
    virtual Transition process(Byte byte) = 0;
    virtual ~State() = default;
    // The bulk path of a state that declares kBulk: consumes the longest prefix of
    // [data, end) that process() would take byte by byte without a transition, with the same
    // effects and the same calls, and returns where it stopped. The byte it stops at goes to
    // process().
    virtual const Byte* consume(const Byte* data, const Byte*) { return data; }

    State* below() const { return reinterpret_cast<State*>(below_ & ~kBulkBit); }
    Machine& machine() const { return *machine_; }

   private:
    friend class StateMachine;
    // States sit at aligned addresses, so the lowest bit of the pointer to the state below
    // is free to say whether this state has a bulk path (a state stays this small).
    static constexpr std::uintptr_t kBulkBit = 1;
    bool bulk() const { return (below_ & kBulkBit) != 0; }
    std::uintptr_t below_ = 0;
    Machine* machine_ = nullptr;
  };
  static_assert(StateArena::kAlignment > 1);

  // A state that collects bytes and hands them on in pieces.
  class BufferedState : public State {
   public:
    virtual void flush(const Char* data, std::size_t length) = 0;
  };

  StateMachine() = default;
  ~StateMachine() {
    while (top_ != nullptr) destroyTop();
  }
  StateMachine(const StateMachine&) = delete;
  StateMachine& operator=(const StateMachine&) = delete;

  void feed(const Char* data, std::size_t length) {
    const Byte* p = reinterpret_cast<const Byte*>(data);
    const Byte* const end = p + length;
    if (!bulkScanning()) {
      while (p < end) feedByte(*p++);
      return;
    }
    while (p < end) {
      if (top_->bulk()) {
        p = top_->consume(p, end);
        if (p == end) break;
      }
      feedByte(*p++);
    }
  }

  void feedByte(Byte byte) {
    do {
      reprocess_ = false;
      const Transition t = top_->process(byte);
      if (t.pops != 0) pop(t.pops);
      reprocess_ = t.reprocess;
    } while (reprocess_);
  }

  State* top() const { return top_; }
  std::size_t depth() const { return depth_; }
  const StateArena& arena() const { return arena_; }

  // Constructs S on top of the stack. Meant for states (through Push) and for the concrete
  // machine's constructor, which pushes the bottom state.
  template <typename S, typename... Args>
  S& pushState(Args&&... args) {
    static_assert(std::is_base_of_v<State, S>);
    void* storage = arena_.allocate(sizeof(S));
    S* state;
    try {
      // Default-initialised, not value-initialised: states hold fixed buffers of a kilobyte
      // or more, which must not be zeroed on every push (every field that is read has its
      // own initialiser).
      if constexpr (sizeof...(Args) == 0) {
        state = ::new (storage) S;
      } else {
        state = ::new (storage) S(std::forward<Args>(args)...);
      }
    } catch (...) {
      arena_.release(storage);
      throw;
    }
    state->below_ = reinterpret_cast<std::uintptr_t>(top_);
    if constexpr (requires { S::kBulk; }) {
      if (S::kBulk) state->below_ |= State::kBulkBit;
    }
    state->machine_ = static_cast<Machine*>(this);
    top_ = state;
    ++depth_;
    return *state;
  }

  // Pops every state, the bottom one too, for a machine that starts over: the concrete machine
  // pushes its bottom state again. The arena keeps its last block, so this allocates nothing.
  void popAll() {
    while (top_ != nullptr) destroyTop();
  }

  // Pops n states, the top one first. Removing the bottom state is a fault of the machine.
  void pop(std::size_t n) {
    if (n >= depth_)
      throw std::runtime_error("StateMachine: trying to pop state in depth over the stack");
    while (n-- > 0) destroyTop();
  }

 private:
  void destroyTop() {
    State* state = top_;
    top_ = state->below();
    --depth_;
    void* storage = dynamic_cast<void*>(state);  // the most derived object, as allocated
    state->~State();
    arena_.release(storage);
  }

  StateArena arena_;  // destroyed after the states, which the destructor pops first
  State* top_ = nullptr;
  std::size_t depth_ = 0;
  bool reprocess_ = false;
};

// Transitions that push: `return Push<Next>(this->machine(), args...);`
template <typename S, typename Machine, typename... Args>
Transition Push(Machine& machine, Args&&... args) {
  machine.template pushState<S>(std::forward<Args>(args)...);
  return {};
}

template <typename S, typename Machine, typename... Args>
Transition PushReprocess(Machine& machine, Args&&... args) {
  machine.template pushState<S>(std::forward<Args>(args)...);
  return {0, true};
}

}  // namespace util
