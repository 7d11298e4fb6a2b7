// Percent-decoding of URLs taken from attribute values.
#pragma once

#include <string>
#include <string_view>

namespace html_decrunch {

// Replaces each '%' followed by two hexadecimal digits (either case) by the byte they encode.
// After a '%' that does not start such a triple, scanning resumes two bytes on, so the byte
// right after it is kept as written. Character references are not decoded.
std::string percentDecode(std::string_view value);

}  // namespace html_decrunch
