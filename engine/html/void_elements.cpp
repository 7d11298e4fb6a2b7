#include "engine/html/void_elements.h"

#include <algorithm>
#include <array>

namespace html {
namespace {

constexpr std::array<std::string_view, 16> kVoidElements = {
    "area",  "base",   "br",   "col",  "command", "embed",  "hr",    "img",
    "input", "keygen", "link", "meta", "param",   "source", "track", "wbr"};

static_assert(std::is_sorted(kVoidElements.begin(), kVoidElements.end()));

}  // namespace

bool isVoidElement(std::string_view name) {
  return std::binary_search(kVoidElements.begin(), kVoidElements.end(), name);
}

}  // namespace html
