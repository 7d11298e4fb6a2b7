#include "framework/uvo/module_lock.h"

namespace uvo::detail {
namespace {
std::atomic<std::int32_t> moduleLockCount{0};
}

std::int32_t ModuleLockCount() { return moduleLockCount.load(std::memory_order_acquire); }

ObjectModuleAutoLock::ObjectModuleAutoLock() { moduleLockCount.fetch_add(1); }
ObjectModuleAutoLock::ObjectModuleAutoLock(const ObjectModuleAutoLock&) {
  moduleLockCount.fetch_add(1);
}
ObjectModuleAutoLock::~ObjectModuleAutoLock() { moduleLockCount.fetch_sub(1); }

}  // namespace uvo::detail
