#include "platform/system_time.h"

#include <chrono>

namespace platform {

std::uint64_t GetSystemTimeAsFileTime() {
  using Ticks = std::chrono::duration<std::int64_t, std::ratio<1, 10'000'000>>;
  const auto since1970 =
      std::chrono::duration_cast<Ticks>(std::chrono::system_clock::now().time_since_epoch());
  return static_cast<std::uint64_t>(since1970.count()) + kEpochDifferenceSeconds * 10'000'000ull;
}

}  // namespace platform
