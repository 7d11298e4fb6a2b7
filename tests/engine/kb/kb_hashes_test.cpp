// The hashes and checksums the knowledge bases are keyed with: SpookyHash V2 and MD5 against
// their published results, Fletcher-16 against its definition.
#include <gtest/gtest.h>

#include <cstdio>
#include <random>
#include <string>

#include "engine/kb/fletcher16.h"
#include "engine/kb/md5.h"
#include "engine/kb/spooky_hash.h"

namespace {

constexpr std::uint32_t kSpookyResults[512] = {
#include "tests/engine/kb/spooky_v2_vectors.inc"
};

// Covers the short form (below 192 bytes, with every remainder of 0 to 31), the switch to
// the long form at 192, and long messages with every partial last block.
TEST(KbHashes, SpookyMatchesPublishedResults) {
  std::uint8_t message[512];
  for (int i = 0; i < 512; ++i) message[i] = static_cast<std::uint8_t>(i + 128);
  for (std::size_t n = 0; n < 512; ++n) {
    EXPECT_EQ(ap::SpookyHash32(message, n, 0), kSpookyResults[n]) << "length " << n;
  }
}

TEST(KbHashes, SpookyReadsUnalignedMessages) {
  std::uint8_t buffer[300 + 8];
  for (int offset = 0; offset < 8; ++offset) {
    for (int i = 0; i < 300; ++i) buffer[offset + i] = static_cast<std::uint8_t>(i + 128);
    EXPECT_EQ(ap::SpookyHash32(buffer + offset, 37, 0), kSpookyResults[37]);
    EXPECT_EQ(ap::SpookyHash32(buffer + offset, 299, 0), kSpookyResults[299]);
  }
}

std::string Hex(const ap::Md5Digest& digest) {
  std::string text;
  char byte[3];
  for (const std::uint8_t b : digest) {
    std::snprintf(byte, sizeof byte, "%02x", b);
    text += byte;
  }
  return text;
}

TEST(KbHashes, Md5MatchesRfc1321Suite) {
  const std::pair<std::string, std::string> suite[] = {
      {"", "d41d8cd98f00b204e9800998ecf8427e"},
      {"a", "0cc175b9c0f1b6a831c399e269772661"},
      {"abc", "900150983cd24fb0d6963f7d28e17f72"},
      {"message digest", "f96b697d7cb7938d525a2f31aaf161d0"},
      {"abcdefghijklmnopqrstuvwxyz", "c3fcd3d76192e4007dfb496cca67e13b"},
      {"ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789",
       "d174ab98d277d9f5a5611c2c9f419d9f"},
      {"12345678901234567890123456789012345678901234567890123456789012345678901234567890",
       "57edf4a22be3c955ac49da2e2107b67a"},
  };
  for (const auto& [text, digest] : suite) EXPECT_EQ(Hex(ap::Md5Of(text)), digest) << text;
}

// Padding lands on both sides of the 56-byte boundary; feeding in pieces changes nothing.
TEST(KbHashes, Md5IsIndependentOfHowBytesArrive) {
  std::mt19937 random(7);
  for (std::size_t size : {55u, 56u, 63u, 64u, 65u, 119u, 120u, 1000u}) {
    std::string text(size, '\0');
    for (char& c : text) c = static_cast<char>(random());
    const std::string whole = Hex(ap::Md5Of(text));
    ap::Md5 pieces;
    for (std::size_t at = 0; at < size;) {
      const std::size_t n = std::min<std::size_t>(size - at, 1 + random() % 70);
      pieces.Update(text.data() + at, n);
      at += n;
    }
    EXPECT_EQ(Hex(pieces.Final()), whole) << size;
  }
}

// The sums taken modulo 255 with 0 written as 255, which is what folding computes.
std::uint16_t Fletcher16Reference(const std::string& bytes) {
  std::uint64_t sum1 = 0xFF, sum2 = 0xFF;
  for (const char c : bytes) {
    sum1 += static_cast<std::uint8_t>(c);
    sum2 += sum1;
  }
  sum1 %= 255;
  sum2 %= 255;
  return static_cast<std::uint16_t>((sum2 == 0 ? 255 : sum2) << 8 | (sum1 == 0 ? 255 : sum1));
}

TEST(KbHashes, Fletcher16KnownValuesAndBlockForm) {
  EXPECT_EQ(ap::Fletcher16Of("abcde", 5), 0xC8F0);
  EXPECT_EQ(ap::Fletcher16Of("abcdef", 6), 0x2057);
  EXPECT_EQ(ap::Fletcher16Of("abcdefgh", 8), 0x0627);
  EXPECT_EQ(ap::Fletcher16Of("", 0), 0xFFFF);
  // Lengths around the 20-byte fold, and long runs of 0xFF that push both sums hardest.
  std::mt19937 random(3);
  for (std::size_t size : {19u, 20u, 21u, 39u, 40u, 41u, 400u, 4001u}) {
    std::string bytes(size, '\0');
    for (char& c : bytes) c = static_cast<char>(random());
    EXPECT_EQ(ap::Fletcher16Of(bytes.data(), size), Fletcher16Reference(bytes)) << size;
    const std::string high(size, '\xFF');
    EXPECT_EQ(ap::Fletcher16Of(high.data(), size), Fletcher16Reference(high)) << size;
  }
}

}  // namespace
