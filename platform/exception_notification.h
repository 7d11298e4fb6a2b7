// The continuable notification raised just before every engine error. Windows delivers it
// to debuggers and vectored handlers; here it goes to an observer that tests can install.
#pragma once

#include <cstdint>

namespace platform {

// Code of the notification that precedes every ap::Error.
inline constexpr std::uint32_t kEngineErrorNotification = 0x42849FD0;

using ExceptionObserver = void (*)(std::uint32_t code, std::uint32_t flags);

// Installs `observer` (null for none) and returns the previous one.
ExceptionObserver SetExceptionObserver(ExceptionObserver observer);

// Raises a continuable notification: calls the observer, if any, and returns.
void RaiseException(std::uint32_t code, std::uint32_t flags = 0);

}  // namespace platform
