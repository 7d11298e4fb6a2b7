#include "engine/kb/huffman_spooky.h"

#include <array>

#include "engine/kb/spooky_hash.h"

namespace wd {
namespace {

// The code table, in symbol order: a-z, 0-9, "-", ".".
constexpr const char* kCodes[kSymbolCount] = {
    "010",        "11101",        "11111",        "10100",        "0001",        "011111",
    "111001",     "101011",       "1011",         "11100010",     "00100",       "11110",
    "01110",      "1101",         "1000",         "00110",        "011110011",   "1001",
    "1100",       "0110",         "00111",        "001010",       "1110000",     "11100011",
    "001011",     "01111010",     "011110001",    "0111101111",   "011110000",   "01111011100",
    "0111100100", "011110111011", "011110010110", "011110111010", "01111001010", "011110010111",
    "101010",     "011110110"};

struct Code {
  std::uint32_t bits = 0;
  int length = 0;
};

constexpr std::array<Code, kSymbolCount> MakeTable() {
  std::array<Code, kSymbolCount> table{};
  for (int s = 0; s < kSymbolCount; ++s) {
    for (const char* p = kCodes[s]; *p != '\0'; ++p) {
      table[s].bits = (table[s].bits << 1) | static_cast<std::uint32_t>(*p - '0');
      ++table[s].length;
    }
  }
  return table;
}

constexpr std::array<Code, kSymbolCount> kTable = MakeTable();

}  // namespace

int HuffmanSpooky::Symbol(char c) {
  if (c >= 'a' && c <= 'z') return c - 'a';
  if (c >= 'A' && c <= 'Z') return c - 'A';
  if (c >= '0' && c <= '9') return 26 + (c - '0');
  if (c == '-') return 36;
  if (c == '.') return 37;
  return -1;
}

std::uint32_t HuffmanSpooky::Bits(int symbol) { return kTable[symbol].bits; }
int HuffmanSpooky::BitLength(int symbol) { return kTable[symbol].length; }

int HuffmanSpooky::Pack(std::string_view name, std::uint8_t (&out)[kMaxCodedLength]) {
  std::uint64_t pending = 0;  // bits not yet written, right-aligned
  int pending_bits = 0;
  std::size_t length = 0;
  for (const char c : name) {
    const int symbol = Symbol(c);
    if (symbol < 0) return -1;
    pending = (pending << kTable[symbol].length) | kTable[symbol].bits;
    pending_bits += kTable[symbol].length;
    while (pending_bits >= 8) {
      if (length == kMaxCodedLength) return -1;
      pending_bits -= 8;
      out[length++] = static_cast<std::uint8_t>(pending >> pending_bits);
    }
  }
  if (pending_bits != 0) {
    if (length == kMaxCodedLength) return -1;
    out[length++] = static_cast<std::uint8_t>(pending << (8 - pending_bits));
  }
  return static_cast<int>(length);
}

CodedName HuffmanSpooky::Code(std::string_view name) {
  std::uint8_t packed[kMaxCodedLength];
  const int length = Pack(name, packed);
  if (length < 0) return {};
  CodedName coded;
  coded.length = static_cast<std::size_t>(length);
  coded.code = ap::SpookyHash32(packed, coded.length, 0);
  return coded;
}

}  // namespace wd
