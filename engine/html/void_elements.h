// The elements that never have content: their end tags mean nothing and their start tags
// close at once.
#pragma once

#include <string_view>

namespace html {

// Exact, case-sensitive test; tag names reach it already lower-cased.
bool isVoidElement(std::string_view name);

}  // namespace html
