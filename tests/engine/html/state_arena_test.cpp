#include "engine/html/state_arena.h"

#include <gtest/gtest.h>

#include <vector>

namespace {

TEST(StateArena, ChurnAtABlockEdgeDoesNotAllocateEachTime) {
  util::StateArena arena;
  std::vector<void*> live;
  for (int i = 0; i < 50; ++i) live.push_back(arena.allocate(64));  // fills the first block
  ASSERT_EQ(arena.blockCount(), 1u);
  for (int round = 0; round < 1000; ++round) {
    void* p = arena.allocate(64);  // needs a second block
    ASSERT_EQ(arena.blockCount(), 2u);
    arena.release(p);  // empties it again
    ASSERT_EQ(arena.blockCount(), 1u);
  }
  EXPECT_EQ(arena.heapAllocations(), 2u);
  for (auto it = live.rbegin(); it != live.rend(); ++it) arena.release(*it);
  EXPECT_EQ(arena.blockCount(), 0u);
}

TEST(StateArena, AKeptBlockIsReusedOnlyWhenTheGrowthRuleFitsIt) {
  util::StateArena arena;
  void* first = arena.allocate(64);     // block 0: 3200 bytes
  void* second = arena.allocate(3200);  // block 1: 320000 bytes
  arena.release(second);                // kept aside
  // Too big for what block 0 has left; the growth rule asks for 315200: the kept block serves.
  void* third = arena.allocate(3150);
  EXPECT_EQ(third, second);
  EXPECT_EQ(arena.heapAllocations(), 2u);
  arena.release(third);
  void* fourth = arena.allocate(4096);  // the rule asks for 409600: a new block
  EXPECT_EQ(arena.blockSize(1), 409600u);
  EXPECT_EQ(arena.heapAllocations(), 3u);
  arena.release(fourth);
  arena.release(first);
}

}  // namespace
