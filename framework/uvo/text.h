// Conversions between the framework's UTF-16 strings and the module's 8-bit text.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace uvo {

// Appends the UTF-8 form of one code point (up to U+10FFFF).
void AppendUtf8(std::string& out, char32_t cp);
// UTF-16 to UTF-8; an unpaired surrogate becomes U+FFFD.
std::string ToUtf8(std::u16string_view text);
// 8-bit text to UTF-16, each byte taken as a Latin-1 code unit (framework texts are ASCII).
std::u16string Widen(std::string_view text);
// "0x" and eight lower-case hexadecimal digits.
std::string HexCode(std::uint32_t value);

}  // namespace uvo
