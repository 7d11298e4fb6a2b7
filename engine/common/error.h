// The engine's error: one fixed English message. Every raise is preceded by the platform
// notification 0x42849FD0, as a debugger attached to the host expects.
#pragma once

#include <stdexcept>
#include <string>

namespace ap {

class Error : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

// Raises the notification, then throws ap::Error(message).
[[noreturn]] void ThrowError(const std::string& message);

}  // namespace ap
