// The module-wide count of live framework objects, which decides whether the module may be
// unloaded. Every framework object of the module holds one ObjectModuleAutoLock.
#pragma once

#include <atomic>
#include <cstdint>

namespace uvo::detail {

std::int32_t ModuleLockCount();

class ObjectModuleAutoLock {
 public:
  ObjectModuleAutoLock();
  ObjectModuleAutoLock(const ObjectModuleAutoLock&);
  ObjectModuleAutoLock& operator=(const ObjectModuleAutoLock&) = default;
  ~ObjectModuleAutoLock();
};

}  // namespace uvo::detail
