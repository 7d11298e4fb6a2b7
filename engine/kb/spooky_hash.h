// SpookyHash V2 (Bob Jenkins, 2012), the 128-bit non-cryptographic hash, computed as on a
// little-endian machine whatever the host's byte order. The white-domain set keys its names
// by the low 32 bits of the first half, started from two zero seeds.
#pragma once

#include <cstddef>
#include <cstdint>

namespace ap {

// Hashes `length` bytes; `hash1` and `hash2` carry the two seeds in and the two halves out.
void SpookyHash128(const void* message, std::size_t length, std::uint64_t* hash1,
                   std::uint64_t* hash2);

inline std::uint32_t SpookyHash32(const void* message, std::size_t length, std::uint32_t seed = 0) {
  std::uint64_t hash1 = seed;
  std::uint64_t hash2 = seed;
  SpookyHash128(message, length, &hash1, &hash2);
  return static_cast<std::uint32_t>(hash1);
}

}  // namespace ap
