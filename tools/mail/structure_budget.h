// A cheap line scan run before GMime parses a message, so that GMime's per-header and per-part
// objects stay within a budget: the message is cut at the first line where the count of
// header-like lines, their bytes, their ';' separators or the count of "--" lines (every MIME
// part starts after one) runs out. Header-like lines are counted only where a header block may
// start: at the top, after a "--" line and after a blank line (the body of a message/rfc822
// part), up to the first line that is neither a header field nor its continuation.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "tools/mail/mail_limits.h"

namespace pelmix::mail {

struct StructureCut {
  std::size_t length = 0;   // bytes of the message to parse
  std::uint32_t limit = 0;  // Bit(Limit) of the budget that ran out, 0 when none did
};

StructureCut MeasureStructure(std::string_view message, const MailLimits& limits);

}  // namespace pelmix::mail
