#include "host/allocator.h"

#include <cstdlib>

namespace pelmix::host {

uvo::Ptr<Allocator> Allocator::Create() { return uvo::Ptr<Allocator>::Adopt(new Allocator()); }

Allocator::~Allocator() {
  for (void* block : live_) std::free(block);
}

void* Allocator::Allocate(std::uint32_t size) {
  if (refuse_) return nullptr;
  void* block = std::malloc(size == 0 ? 1 : size);
  if (block == nullptr) return nullptr;
  std::lock_guard<std::mutex> lock(mutex_);
  live_.insert(block);
  return block;
}

void* Allocator::Reallocate(void* pointer, std::uint32_t size) {
  if (pointer == nullptr) return Allocate(size);
  if (refuse_) return nullptr;
  std::lock_guard<std::mutex> lock(mutex_);
  if (live_.find(pointer) == live_.end()) return nullptr;
  void* block = std::realloc(pointer, size == 0 ? 1 : size);
  if (block == nullptr) return nullptr;
  live_.erase(pointer);
  live_.insert(block);
  return block;
}

void Allocator::Free(void* pointer) {
  if (pointer == nullptr) return;
  {
    std::lock_guard<std::mutex> lock(mutex_);
    // A block this allocator did not hand out is left alone.
    if (live_.erase(pointer) == 0) return;
  }
  std::free(pointer);
}

std::size_t Allocator::LiveBlocks() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return live_.size();
}

}  // namespace pelmix::host
