#include "engine/html/state_machine.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <string>

namespace {

// A machine whose states log what they see. Every state is 64 bytes so that the arena's
// block arithmetic is easy to follow.
class LogMachine : public util::StateMachine<char, LogMachine> {
 public:
  LogMachine() { pushState<Bottom>(); }

  class Sized : public State {
   public:
    explicit Sized(int* destroyed = nullptr) : destroyed_(destroyed) {}
    ~Sized() override {
      if (destroyed_ != nullptr) ++*destroyed_;
    }

   private:
    int* destroyed_;
    [[maybe_unused]] char pad_[32] = {};  // gives the states a size the arena must honour
  };

  // 'p' pushes Echo and offers it the same byte; '!' tries to pop the bottom.
  class Bottom final : public Sized {
   public:
    util::Transition process(unsigned char b) override {
      machine().log += std::string("B") + static_cast<char>(b) + " ";
      if (b == 'p') return util::PushReprocess<Echo>(machine());
      if (b == '!') return util::Pop(1);
      return util::Stay();
    }
  };

  // Logs every byte; 'q' pops it and hands the 'q' back to the state below.
  class Echo final : public Sized {
   public:
    using Sized::Sized;
    util::Transition process(unsigned char b) override {
      machine().log += std::string("E") + static_cast<char>(b) + " ";
      return b == 'q' ? util::PopReprocess(1) : util::Stay();
    }
  };

  template <std::size_t N>
  class Big final : public State {
   public:
    util::Transition process(unsigned char) override { return util::Stay(); }

   private:
    char pad_[N - sizeof(State)] = {};
  };

  std::string log;
};

static_assert(sizeof(LogMachine::Echo) == 64);

void Feed(LogMachine& m, const std::string& bytes) { m.feed(bytes.data(), bytes.size()); }

TEST(StateMachine, ReprocessOffersTheSameByteToTheNewTop) {
  LogMachine m;
  Feed(m, "apxqz");
  EXPECT_EQ(m.log, "Ba Bp Ep Ex Eq Bq Bz ");
  EXPECT_EQ(m.depth(), 1u);
}

TEST(StateMachine, PoppingTheBottomStateIsRefusedAndHarmless) {
  LogMachine m;
  try {
    Feed(m, "!");
    FAIL() << "no error";
  } catch (const std::runtime_error& e) {
    EXPECT_STREQ(e.what(), "StateMachine: trying to pop state in depth over the stack");
  }
  EXPECT_EQ(m.depth(), 1u);
  Feed(m, "pq");
  EXPECT_EQ(m.log, "B! Bp Ep Eq Bq ");
  EXPECT_THROW(m.pop(1), std::runtime_error);
}

TEST(StateMachine, DestroyingTheMachineDestroysEveryState) {
  int destroyed = 0;
  {
    LogMachine m;
    for (int i = 0; i < 300; ++i) m.pushState<LogMachine::Echo>(&destroyed);
    m.pop(100);
    EXPECT_EQ(destroyed, 100);
  }
  EXPECT_EQ(destroyed, 300);
}

TEST(StateMachine, ArenaBlocksGrowAndAreFreedWhenEmpty) {
  LogMachine m;
  const util::StateArena& arena = m.arena();
  ASSERT_EQ(arena.blockCount(), 1u);
  EXPECT_EQ(arena.blockSize(0), 50u * 64);  // fifty times the first request

  for (int i = 1; i < 50; ++i) m.pushState<LogMachine::Echo>();
  EXPECT_EQ(arena.blockCount(), 1u);
  m.pushState<LogMachine::Echo>();  // the 51st state needs a second block
  ASSERT_EQ(arena.blockCount(), 2u);
  EXPECT_EQ(arena.blockSize(1), 6400u);
  for (int i = 1; i < 100; ++i) m.pushState<LogMachine::Echo>();
  EXPECT_EQ(arena.blockCount(), 2u);
  m.pushState<LogMachine::Echo>();
  ASSERT_EQ(arena.blockCount(), 3u);
  EXPECT_EQ(arena.blockSize(2), 12800u);  // twice the previous block
  for (int i = 1; i < 199; ++i) m.pushState<LogMachine::Echo>();
  m.pushState<LogMachine::Big<2048>>();  // does not fit in the 64 bytes left
  ASSERT_EQ(arena.blockCount(), 4u);
  EXPECT_EQ(arena.blockSize(3), 204800u);  // a hundred times the request

  m.pop(1);
  EXPECT_EQ(arena.blockCount(), 3u);
  m.pop(199);
  EXPECT_EQ(arena.blockCount(), 2u);
  m.pop(100);
  EXPECT_EQ(arena.blockCount(), 1u);
  m.pop(49);
  EXPECT_EQ(m.depth(), 1u);
  EXPECT_EQ(arena.blockCount(), 1u);
  // Freed space is reused: the same pushes need the same blocks again.
  for (int i = 1; i < 51; ++i) m.pushState<LogMachine::Echo>();
  EXPECT_EQ(arena.blockCount(), 2u);
  EXPECT_EQ(arena.blockSize(1), 6400u);
}

TEST(StateMachine, ExhaustedArenaRefusesThePushAndKeepsTheStack) {
  LogMachine m;
  std::size_t pushed = 1;
  try {
    for (;;) {
      m.pushState<LogMachine::Echo>();
      ++pushed;
    }
  } catch (const std::runtime_error& e) {
    EXPECT_STREQ(e.what(), "StateMachine: state arena exhausted");
  }
  EXPECT_EQ(m.arena().blockCount(), util::StateArena::kMaxBlocks);
  EXPECT_EQ(pushed, 50u * 1023);  // 50 + 100 + 200 + ... + 25600 states of 64 bytes
  EXPECT_EQ(m.depth(), pushed);
  m.pop(1);
  EXPECT_EQ(m.depth(), pushed - 1);
  m.pushState<LogMachine::Echo>();  // the room just freed
  EXPECT_EQ(m.depth(), pushed);
}

}  // namespace
