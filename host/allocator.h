// The reference host's allocator: plain heap blocks, counted so that tests can see that the
// module gave back everything it took.
#pragma once

#include <atomic>
#include <cstdint>
#include <mutex>
#include <unordered_set>

#include "framework/uvo/interfaces.h"
#include "framework/uvo/object.h"

namespace pelmix::host {

class Allocator final : public uvo::ObjectImpl<Allocator, uvo::IAllocator> {
 public:
  static uvo::Ptr<Allocator> Create();
  ~Allocator();

  void* Allocate(std::uint32_t size) override;
  void* Reallocate(void* pointer, std::uint32_t size) override;
  void Free(void* pointer) override;

  std::size_t LiveBlocks() const;
  // While set, every allocation fails.
  void SetRefuse(bool refuse) { refuse_ = refuse; }

 private:
  mutable std::mutex mutex_;
  std::unordered_set<void*> live_;
  std::atomic<bool> refuse_{false};
};

}  // namespace pelmix::host
