#include "engine/html/percent_decoding.h"

#include <cstdint>

#include "engine/html/char_class.h"

namespace html_decrunch {

std::string percentDecode(std::string_view value) {
  std::string out;
  out.reserve(value.size());
  std::size_t i = 0;
  while (i < value.size()) {
    const std::size_t percent = value.find('%', i);
    if (percent == std::string_view::npos) break;
    out.append(value, i, percent - i);
    if (percent + 2 < value.size()) {
      const int high = html::hexDigitValue(static_cast<std::uint8_t>(value[percent + 1]));
      const int low = html::hexDigitValue(static_cast<std::uint8_t>(value[percent + 2]));
      if (high >= 0 && low >= 0) {
        out.push_back(static_cast<char>(high * 16 + low));
        i = percent + 3;
        continue;
      }
    }
    // Not an escape: the '%' and the byte after it stay as they are.
    const std::size_t keep = percent + 2 <= value.size() ? 2 : 1;
    out.append(value, percent, keep);
    i = percent + keep;
  }
  if (i < value.size()) out.append(value, i);
  return out;
}

}  // namespace html_decrunch
