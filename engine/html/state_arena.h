// The LIFO arena that holds the states of a push-down machine. States are pushed and popped
// strictly in stack order, so the arena is a chain of bump blocks: popping a state hands its
// address back as the next free position, and a block that becomes empty is given up. The
// last block given up is kept aside and reused by the next block of no larger size, so that
// input pushing and popping right at a block edge does not allocate on every byte.
#pragma once

#include <cassert>
#include <cstddef>

namespace util {

class StateArena {
 public:
  static constexpr std::size_t kMaxBlocks = 10;
  // The first block holds this many copies of the first request.
  static constexpr std::size_t kFirstBlockFactor = 50;
  // A later block is the larger of this many copies of the request and twice its predecessor.
  static constexpr std::size_t kGrowthFactor = 100;
  // Every allocation is rounded up to this, so any state type is suitably aligned.
  static constexpr std::size_t kAlignment = alignof(std::max_align_t);

  StateArena() = default;
  ~StateArena();
  StateArena(const StateArena&) = delete;
  StateArena& operator=(const StateArena&) = delete;

  // Throws std::runtime_error "StateMachine: state arena exhausted" when the request fits in
  // no block and all kMaxBlocks are in use.
  void* allocate(std::size_t size) {
    // Every push comes here; the common case (room in the current block) stays inline.
    size = size == 0 ? kAlignment : (size + kAlignment - 1) / kAlignment * kAlignment;
    if (count_ > 0) {
      Block& current = blocks_[count_ - 1];
      if (current.size - current.used >= size) {
        void* p = current.base + current.used;
        current.used += size;
        return p;
      }
    }
    return allocateBlock(size);
  }
  // `p` must be the most recent allocation still live.
  void release(void* p) {
    assert(count_ > 0);
    Block& current = blocks_[count_ - 1];
    assert(static_cast<std::byte*>(p) >= current.base &&
           static_cast<std::byte*>(p) < current.base + current.used);
    current.used = static_cast<std::size_t>(static_cast<std::byte*>(p) - current.base);
    if (current.used == 0) releaseBlock();
  }

  std::size_t blockCount() const { return count_; }
  std::size_t blockSize(std::size_t index) const { return blocks_[index].size; }
  // How many blocks were taken from the heap over the arena's life.
  std::size_t heapAllocations() const { return heapAllocations_; }

 private:
  struct Block {
    std::byte* base = nullptr;
    std::size_t size = 0;
    std::size_t used = 0;
  };
  void* allocateBlock(std::size_t size);  // `size` already rounded
  void releaseBlock();                    // the current block is empty

  Block blocks_[kMaxBlocks];
  std::size_t count_ = 0;  // blocks in use; the last one is current
  Block spare_;            // the last block given up, kept for reuse
  std::size_t heapAllocations_ = 0;
};

}  // namespace util
