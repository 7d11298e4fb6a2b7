// MD5 (RFC 1321). The categorised-hosts database keys its hosts by the digest of their
// lower-cased names; nothing here relies on MD5 being collision-resistant.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string_view>

namespace ap {

using Md5Digest = std::array<std::uint8_t, 16>;

class Md5 {
 public:
  Md5();
  void Update(const void* data, std::size_t size);
  // The digest of everything fed so far; the object must not be fed again afterwards.
  Md5Digest Final();

 private:
  void Block(const std::uint8_t* block);

  std::uint32_t state_[4];
  std::uint64_t length_ = 0;  // bytes fed
  std::uint8_t buffer_[64];
  std::size_t buffered_ = 0;
};

inline Md5Digest Md5Of(const void* data, std::size_t size) {
  Md5 md5;
  md5.Update(data, size);
  return md5.Final();
}

inline Md5Digest Md5Of(std::string_view text) { return Md5Of(text.data(), text.size()); }

}  // namespace ap
