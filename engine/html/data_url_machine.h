// Decodes a "data:" URL byte by byte as it streams out of a page (the target of a meta
// refresh) and hands every decoded byte to its handler: base64 when the last header token is
// "base64", percent-decoding otherwise. A URL that is not a data URL yields nothing: each
// byte that does not continue "data:" raises an error the caller is expected to swallow, and
// later bytes are compared with the same expected byte, so junk before the scheme is skipped.
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

  // One byte through the machine; throws ap::Error (kHeaderError) before the scheme is
  // complete. The machine stays usable after the error.
  void feed(std::uint8_t byte) { feedByte(byte); }
  using Engine::feed;

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
};

}  // namespace utils
