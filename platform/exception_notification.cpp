#include "platform/exception_notification.h"

#include <atomic>

namespace platform {
namespace {
std::atomic<ExceptionObserver> observer{nullptr};
}

ExceptionObserver SetExceptionObserver(ExceptionObserver next) { return observer.exchange(next); }

void RaiseException(std::uint32_t code, std::uint32_t flags) {
  if (ExceptionObserver current = observer.load()) current(code, flags);
}

}  // namespace platform
