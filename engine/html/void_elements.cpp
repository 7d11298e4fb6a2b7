#include "engine/html/void_elements.h"

#include <algorithm>
#include <array>
#include <cstdint>

#include "engine/html/char_class.h"

namespace html {
namespace {

constexpr std::array<std::string_view, 16> kVoidElements = {
    "area",  "base",   "br",   "col",  "command", "embed",  "hr",    "img",
    "input", "keygen", "link", "meta", "param",   "source", "track", "wbr"};

static_assert(std::is_sorted(kVoidElements.begin(), kVoidElements.end()));

// The same names packed: every tag of a page is looked up here, twice for most.
constexpr std::array<std::uint64_t, 16> kVoidKeys = [] {
  std::array<std::uint64_t, 16> keys{};
  for (std::size_t i = 0; i < keys.size(); ++i) keys[i] = packName(kVoidElements[i]);
  return keys;
}();

}  // namespace

bool isVoidElement(std::string_view name) { return isVoidKey(packName(name)); }

bool isVoidKey(std::uint64_t key) {
  if (key == 0) return false;
  return std::find(kVoidKeys.begin(), kVoidKeys.end(), key) != kVoidKeys.end();
}

}  // namespace html
