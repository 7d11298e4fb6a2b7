#include "engine/kb/spooky_hash.h"

#include <cstring>

namespace ap {
namespace {

// Number of 64-bit words in the long hash's state, the block it consumes at a time, and the
// length from which the long hash is used.
constexpr int kNumVars = 12;
constexpr std::size_t kBlockSize = kNumVars * 8;
constexpr std::size_t kShortLimit = 2 * kBlockSize;
constexpr std::uint64_t kConst = 0xdeadbeefdeadbeefULL;

inline std::uint64_t Rot(std::uint64_t x, int k) { return (x << k) | (x >> (64 - k)); }

inline std::uint64_t Load64(const std::uint8_t* p) {
  std::uint64_t v = 0;
  for (int i = 7; i >= 0; --i) v = (v << 8) | p[i];
  return v;
}

inline std::uint32_t Load32(const std::uint8_t* p) {
  return static_cast<std::uint32_t>(p[0]) | static_cast<std::uint32_t>(p[1]) << 8 |
         static_cast<std::uint32_t>(p[2]) << 16 | static_cast<std::uint32_t>(p[3]) << 24;
}

void Mix(const std::uint64_t* d, std::uint64_t* s) {
  // One round per input word; the rotation amounts are the hash's own.
  static constexpr int kRot[kNumVars] = {11, 32, 43, 31, 17, 28, 39, 57, 55, 54, 22, 46};
  for (int i = 0; i < kNumVars; ++i) {
    s[i] += d[i];
    s[(i + 2) % kNumVars] ^= s[(i + 10) % kNumVars];
    s[(i + 11) % kNumVars] ^= s[i];
    s[i] = Rot(s[i], kRot[i]);
    s[(i + 11) % kNumVars] += s[(i + 1) % kNumVars];
  }
}

void EndPartial(std::uint64_t* h) {
  static constexpr int kRot[kNumVars] = {44, 15, 34, 21, 38, 33, 10, 13, 38, 53, 42, 54};
  for (int i = 0; i < kNumVars; ++i) {
    h[(i + 11) % kNumVars] += h[(i + 1) % kNumVars];
    h[(i + 2) % kNumVars] ^= h[(i + 11) % kNumVars];
    h[(i + 1) % kNumVars] = Rot(h[(i + 1) % kNumVars], kRot[i]);
  }
}

void ShortMix(std::uint64_t& h0, std::uint64_t& h1, std::uint64_t& h2, std::uint64_t& h3) {
  h2 = Rot(h2, 50), h2 += h3, h0 ^= h2;
  h3 = Rot(h3, 52), h3 += h0, h1 ^= h3;
  h0 = Rot(h0, 30), h0 += h1, h2 ^= h0;
  h1 = Rot(h1, 41), h1 += h2, h3 ^= h1;
  h2 = Rot(h2, 54), h2 += h3, h0 ^= h2;
  h3 = Rot(h3, 48), h3 += h0, h1 ^= h3;
  h0 = Rot(h0, 38), h0 += h1, h2 ^= h0;
  h1 = Rot(h1, 37), h1 += h2, h3 ^= h1;
  h2 = Rot(h2, 62), h2 += h3, h0 ^= h2;
  h3 = Rot(h3, 34), h3 += h0, h1 ^= h3;
  h0 = Rot(h0, 5), h0 += h1, h2 ^= h0;
  h1 = Rot(h1, 36), h1 += h2, h3 ^= h1;
}

void ShortEnd(std::uint64_t& h0, std::uint64_t& h1, std::uint64_t& h2, std::uint64_t& h3) {
  h3 ^= h2, h2 = Rot(h2, 15), h3 += h2;
  h0 ^= h3, h3 = Rot(h3, 52), h0 += h3;
  h1 ^= h0, h0 = Rot(h0, 26), h1 += h0;
  h2 ^= h1, h1 = Rot(h1, 51), h2 += h1;
  h3 ^= h2, h2 = Rot(h2, 28), h3 += h2;
  h0 ^= h3, h3 = Rot(h3, 9), h0 += h3;
  h1 ^= h0, h0 = Rot(h0, 47), h1 += h0;
  h2 ^= h1, h1 = Rot(h1, 54), h2 += h1;
  h3 ^= h2, h2 = Rot(h2, 32), h3 += h2;
  h0 ^= h3, h3 = Rot(h3, 25), h0 += h3;
  h1 ^= h0, h0 = Rot(h0, 63), h1 += h0;
}

void Short(const std::uint8_t* p, std::size_t length, std::uint64_t* hash1, std::uint64_t* hash2) {
  std::size_t remainder = length % 32;
  std::uint64_t a = *hash1, b = *hash2, c = kConst, d = kConst;
  if (length > 15) {
    for (const std::uint8_t* end = p + (length / 32) * 32; p < end; p += 32) {
      c += Load64(p), d += Load64(p + 8);
      ShortMix(a, b, c, d);
      a += Load64(p + 16), b += Load64(p + 24);
    }
    if (remainder >= 16) {
      c += Load64(p), d += Load64(p + 8);
      ShortMix(a, b, c, d);
      p += 16;
      remainder -= 16;
    }
  }
  d += static_cast<std::uint64_t>(length) << 56;
  // The last 0 to 15 bytes: bytes 0-7 go to c, bytes 8-14 to d, whole words where they fit.
  switch (remainder) {
    case 15:
      d += static_cast<std::uint64_t>(p[14]) << 48;
      [[fallthrough]];
    case 14:
      d += static_cast<std::uint64_t>(p[13]) << 40;
      [[fallthrough]];
    case 13:
      d += static_cast<std::uint64_t>(p[12]) << 32;
      [[fallthrough]];
    case 12:
      d += Load32(p + 8);
      c += Load64(p);
      break;
    case 11:
      d += static_cast<std::uint64_t>(p[10]) << 16;
      [[fallthrough]];
    case 10:
      d += static_cast<std::uint64_t>(p[9]) << 8;
      [[fallthrough]];
    case 9:
      d += p[8];
      [[fallthrough]];
    case 8:
      c += Load64(p);
      break;
    case 7:
      c += static_cast<std::uint64_t>(p[6]) << 48;
      [[fallthrough]];
    case 6:
      c += static_cast<std::uint64_t>(p[5]) << 40;
      [[fallthrough]];
    case 5:
      c += static_cast<std::uint64_t>(p[4]) << 32;
      [[fallthrough]];
    case 4:
      c += Load32(p);
      break;
    case 3:
      c += static_cast<std::uint64_t>(p[2]) << 16;
      [[fallthrough]];
    case 2:
      c += static_cast<std::uint64_t>(p[1]) << 8;
      [[fallthrough]];
    case 1:
      c += p[0];
      break;
    case 0:
      c += kConst, d += kConst;
      break;
  }
  ShortEnd(a, b, c, d);
  *hash1 = a;
  *hash2 = b;
}

}  // namespace

void SpookyHash128(const void* message, std::size_t length, std::uint64_t* hash1,
                   std::uint64_t* hash2) {
  const auto* p = static_cast<const std::uint8_t*>(message);
  if (length < kShortLimit) {
    Short(p, length, hash1, hash2);
    return;
  }
  std::uint64_t h[kNumVars];
  for (int i = 0; i < kNumVars; i += 3) {
    h[i] = *hash1;
    h[i + 1] = *hash2;
    h[i + 2] = kConst;
  }
  std::uint64_t words[kNumVars];
  const std::uint8_t* end = p + (length / kBlockSize) * kBlockSize;
  for (; p < end; p += kBlockSize) {
    for (int i = 0; i < kNumVars; ++i) words[i] = Load64(p + 8 * i);
    Mix(words, h);
  }
  // The last partial block, zero-padded, with its length in its last byte.
  const std::size_t remainder = length % kBlockSize;
  std::uint8_t last[kBlockSize] = {};
  std::memcpy(last, p, remainder);
  last[kBlockSize - 1] = static_cast<std::uint8_t>(remainder);
  for (int i = 0; i < kNumVars; ++i) h[i] += Load64(last + 8 * i);
  EndPartial(h);
  EndPartial(h);
  EndPartial(h);
  *hash1 = h[0];
  *hash2 = h[1];
}

}  // namespace ap
