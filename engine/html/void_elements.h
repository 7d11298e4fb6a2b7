// The elements that never have content: their end tags mean nothing and their start tags
// close at once.
#pragma once

#include <cstdint>
#include <string_view>

namespace html {

// Exact, case-sensitive test; tag names reach it already lower-cased.
bool isVoidElement(std::string_view name);
// The same for a name packed with packName (0, a name too long to pack, is never void).
bool isVoidKey(std::uint64_t key);

}  // namespace html
