// The bytes of one message as read from its input, kept in a GLib byte array so that GMime can
// parse them in place instead of copying them into a stream of its own.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

struct _GByteArray;

namespace pelmix::mail {

class MessageBuffer {
 public:
  MessageBuffer();
  ~MessageBuffer();
  MessageBuffer(const MessageBuffer&) = delete;
  MessageBuffer& operator=(const MessageBuffer&) = delete;

  void Append(std::string_view bytes);
  // Drops the last `count` bytes (at most all).
  void DropBack(std::size_t count);
  void Clear();

  std::string_view bytes() const;
  std::size_t size() const;
  _GByteArray* array() const { return array_; }

  // Where the message came from: its number in the input (1-based), how many bytes it had
  // there, and whether bytes past the message budget were skipped.
  std::size_t index = 0;
  std::uint64_t inputBytes = 0;
  bool cut = false;

 private:
  _GByteArray* array_;
};

}  // namespace pelmix::mail
