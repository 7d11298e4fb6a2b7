// Decodes a "data:" URL byte by byte as it streams out of a page (the target of a meta
// refresh) and hands every decoded byte to its handler: base64 when the last header token is
// "base64", percent-decoding otherwise. A URL that is not a data URL yields nothing: each
// byte that does not continue "data:" is rejected, and later bytes are compared with the same
// expected byte, so junk before the scheme is skipped. Rejection is a state, not an error:
// offer() counts rejected bytes; only the one-byte feed() raises an error for them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "engine/html/state_machine.h"

namespace utils {

// A header token (media type or parameter) keeps at most this many bytes; the rest of an
// over-long token is dropped, so a header without ',' cannot grow without bound.
inline constexpr std::size_t kMaxDataUrlHeaderToken = 1024;

class DataUrlMachine : public util::StateMachine<char, DataUrlMachine> {
  using Engine = util::StateMachine<char, DataUrlMachine>;

 public:
  class Handler {
   public:
    virtual void byte(std::uint8_t b) = 0;
    virtual ~Handler() = default;
  };

  // The message of the error raised for a byte that does not continue "data:".
  static constexpr const char* kHeaderError = "DataUrlMachine: not a data URL";

  explicit DataUrlMachine(Handler& handler);

  // Starts on a new URL, as a machine just made would (its blocks are kept).
  void restart();

  // One byte through the machine; throws ap::Error (kHeaderError) for a byte that does not
  // continue the scheme. The machine stays usable after the error.
  void feed(std::uint8_t byte);
  // Bytes through the machine; answers how many of them the scheme rejected. Never throws
  // for a rejected byte.
  std::size_t offer(const char* data, std::size_t length);
  // Whether the scheme is still incomplete (only then can a byte be rejected).
  bool inHeader() const { return depth() == 1; }
  // Bytes rejected so far.
  std::size_t rejected() const { return rejected_; }

  // "text/plain" unless the header names a media type.
  const std::string& mediaType() const { return mediaType_; }

 private:
  using state_t = Engine::State;
  class WaitHeaderState;
  class ParseHeader;
  class Base64StateBase;
  class DecodePercentage;
  class HexPair;

  void output(std::uint8_t b) { handler_->byte(b); }

  Handler* handler_;
  std::string mediaType_ = "text/plain";
  std::size_t rejected_ = 0;
};

}  // namespace utils
