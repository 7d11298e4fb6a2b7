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

// Every tag of a page is looked up here, twice for most: by the packed name's length (bits
// 60 and up), then against the few void names of that length.
constexpr bool voidKey(std::uint64_t key) {
  switch (key >> 60) {
    case 2:
      return key == packName("br") || key == packName("hr");
    case 3:
      return key == packName("col") || key == packName("img") || key == packName("wbr");
    case 4:
      return key == packName("area") || key == packName("base") || key == packName("link") ||
             key == packName("meta");
    case 5:
      return key == packName("embed") || key == packName("input") || key == packName("param") ||
             key == packName("track");
    case 6:
      return key == packName("keygen") || key == packName("source");
    case 7:
      return key == packName("command");
    default:
      return false;
  }
}

// The switch holds exactly the list.
static_assert(std::all_of(kVoidElements.begin(), kVoidElements.end(),
                          [](std::string_view name) { return voidKey(packName(name)); }));
static_assert(!voidKey(packName("b")) && !voidKey(packName("div")) && !voidKey(packName("col2")) &&
              !voidKey(packName("metas")) && !voidKey(0));

}  // namespace

bool isVoidElement(std::string_view name) { return isVoidKey(packName(name)); }

bool isVoidKey(std::uint64_t key) { return voidKey(key); }

}  // namespace html
