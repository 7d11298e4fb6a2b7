// The system time as Windows counts it: 100-ns units since 1601-01-01 UTC.
#pragma once

#include <cstdint>

namespace platform {

// Seconds between 1601-01-01 and 1970-01-01.
inline constexpr std::uint64_t kEpochDifferenceSeconds = 11644473600ull;

std::uint64_t GetSystemTimeAsFileTime();

}  // namespace platform
