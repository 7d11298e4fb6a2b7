// A cheap line scan run before GMime parses a message, so that GMime's per-header and per-part
// objects stay within a budget: the message is cut at the first line where the count of header
// lines, their bytes, their ';' separators or the count of delimiter lines (every MIME part
// starts after one) runs out. The scan follows the message's structure only as far as it
// needs to: header blocks are the top, the lines after a delimiter of a declared boundary, and
// the body of a message/* part; a header block ends at a blank line or at the first line that
// is neither a header field nor its continuation. Text that merely looks like headers or
// delimiters inside a body is not counted, so it cannot cut off what follows it.
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
