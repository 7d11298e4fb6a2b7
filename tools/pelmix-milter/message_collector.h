// One message as the MTA hands it to the milter (header fields one by one, then the body in
// chunks), rebuilt into RFC 822 bytes for the MIME walk. Lines end in LF, as in a message
// stored on disk: the MTA sends CRLF, and the same message judged by `pelmix mail` from a
// file must get the same verdict (the engine counts the bytes of the text it is given). At
// most a set number of bytes is kept; the rest is counted and dropped, so a message costs
// bounded memory whatever its size.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "tools/mail/message_buffer.h"

namespace pelmix::milter {

// The header the milter adds; incoming ones are the sender's and are removed.
inline constexpr char kVerdictHeader[] = "X-Pelmix-Verdict";

class MessageCollector {
 public:
  explicit MessageCollector(std::size_t maxBytes);

  // A header field as the MTA passes it: the name, and the value without the space after the
  // colon (folded lines keep their line breaks).
  void Header(std::string_view name, std::string_view value);
  // The blank line between header and body; implied by the first body chunk when the MTA
  // never announced it.
  void EndOfHeaders();
  void Body(std::string_view chunk);
  // The end of the message: a CR the last chunk ended with is kept.
  void Finish();

  // The kept bytes; message().cut when some were dropped.
  const mail::MessageBuffer& message() const { return message_; }
  // Every byte of the rebuilt message, kept or not.
  std::uint64_t totalBytes() const { return message_.inputBytes; }
  // How many X-Pelmix-Verdict fields the message came with.
  std::size_t verdictHeaders() const { return verdictHeaders_; }

 private:
  // Keeps `bytes` with every CRLF written LF; a CR at the end waits in `pendingCr`.
  void KeepLines(std::string_view bytes, bool& pendingCr);
  void Keep(std::string_view bytes);

  const std::size_t maxBytes_;
  mail::MessageBuffer message_;
  bool inBody_ = false;
  bool bodyCr_ = false;  // the last body chunk ended with CR
  std::size_t verdictHeaders_ = 0;
};

}  // namespace pelmix::milter
