// CRC-32 in its ISO-HDLC / IEEE 802.3 form (reflected polynomial 0x04C11DB7, initial value
// and final XOR 0xFFFFFFFF): the checksum of the knowledge-base container and its entries.
#pragma once

#include <boost/crc.hpp>
#include <cstddef>
#include <cstdint>

namespace ap {

// Table-driven, byte at a time; the 256-entry table is Boost.CRC's, built once per process.
class Crc32 {
 public:
  void Update(const void* data, std::size_t size) { crc_.process_bytes(data, size); }
  std::uint32_t Value() const { return crc_.checksum(); }

 private:
  boost::crc_32_type crc_;
};

inline std::uint32_t Crc32Of(const void* data, std::size_t size) {
  Crc32 crc;
  crc.Update(data, size);
  return crc.Value();
}

}  // namespace ap
