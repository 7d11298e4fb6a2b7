#include "engine/html/state_arena.h"

#include <algorithm>
#include <cassert>
#include <new>
#include <stdexcept>

namespace util {

StateArena::~StateArena() {
  while (count_ > 0) ::operator delete(blocks_[--count_].base);
  ::operator delete(spare_.base);
}

void* StateArena::allocateBlock(std::size_t size) {
  if (count_ == kMaxBlocks) throw std::runtime_error("StateMachine: state arena exhausted");
  const std::size_t blockSize = count_ == 0
                                    ? kFirstBlockFactor * size
                                    : std::max(kGrowthFactor * size, 2 * blocks_[count_ - 1].size);
  Block& block = blocks_[count_];
  if (spare_.base != nullptr && spare_.size >= blockSize) {
    block = spare_;
    spare_ = Block{};
  } else {
    block.base = static_cast<std::byte*>(::operator new(blockSize));
    block.size = blockSize;
    ++heapAllocations_;
  }
  block.used = size;
  ++count_;
  return block.base;
}

void StateArena::releaseBlock() {
  assert(count_ > 0);
  Block& current = blocks_[count_ - 1];
  ::operator delete(spare_.base);
  spare_ = current;
  current = Block{};
  --count_;
}

}  // namespace util
