// The walk of one RFC 822 message with GMime: parses the message (cut to the structure
// budget first), then visits its MIME tree in order and reports to a MessageSink what a mail
// session takes. Malformed MIME is walked as far as GMime reads it; a message GMime cannot
// read at all (no header) is reported as unreadable. Thread-safe: walks share nothing.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "tools/mail/mail_limits.h"
#include "tools/mail/message_buffer.h"
#include "tools/mail/message_sink.h"

namespace pelmix::mail {

struct WalkReport {
  bool readable = false;
  std::string error;           // why the message could not be read, when !readable
  std::uint32_t limits = 0;    // Bit(Limit) of every budget the message ran into
  std::uint32_t warnings = 0;  // bit n set when GMime reported its parser warning n
  std::size_t bytes = 0;       // bytes parsed (after any cut)
  std::size_t parts = 0;       // MIME objects visited
  std::size_t links = 0;       // distinct links reported

  bool hit(Limit limit) const { return (limits & Bit(limit)) != 0; }
};

WalkReport WalkMessage(const MessageBuffer& message, MessageSink& sink,
                       const MailLimits& limits = {});
// The same over bytes held elsewhere (copies them once).
WalkReport WalkMessage(std::string_view message, MessageSink& sink, const MailLimits& limits = {});

// Names of the limits and parser warnings set in a report, for printing.
std::vector<std::string_view> LimitNames(std::uint32_t limits);
std::vector<std::string_view> WarningNames(std::uint32_t warnings);

}  // namespace pelmix::mail
