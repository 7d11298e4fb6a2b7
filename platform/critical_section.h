// Stands in for the Windows critical-section API the module's locks were written against.
#pragma once

#include <mutex>

namespace platform {

struct CriticalSection {
  std::mutex mutex;
};

inline void InitializeCriticalSection(CriticalSection*) {}
inline void EnterCriticalSection(CriticalSection* section) { section->mutex.lock(); }
inline void LeaveCriticalSection(CriticalSection* section) { section->mutex.unlock(); }
inline void DeleteCriticalSection(CriticalSection*) {}

// Holds a critical section for a scope; leaves it also when the scope unwinds.
class CriticalSectionLock {
 public:
  explicit CriticalSectionLock(CriticalSection& section) : section_(section) {
    EnterCriticalSection(&section_);
  }
  ~CriticalSectionLock() { LeaveCriticalSection(&section_); }
  CriticalSectionLock(const CriticalSectionLock&) = delete;
  CriticalSectionLock& operator=(const CriticalSectionLock&) = delete;

 private:
  CriticalSection& section_;
};

}  // namespace platform
