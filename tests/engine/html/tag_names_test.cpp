// Tag names are looked up packed into integers; the packing must keep every name apart that
// a string comparison keeps apart.
#include <gtest/gtest.h>

#include <string>

#include "engine/html/char_class.h"
#include "engine/html/void_elements.h"

namespace {

TEST(TagNames, VoidElementsExactly) {
  for (const char* name : {"area", "base", "br", "col", "command", "embed", "hr", "img", "input",
                           "keygen", "link", "meta", "param", "source", "track", "wbr"}) {
    EXPECT_TRUE(html::isVoidElement(name)) << name;
  }
  // Prefixes, extensions, other cases, bytes above 0x7F and names past the packed length.
  const std::string notVoid[] = {"",
                                 "b",
                                 "a",
                                 "are",
                                 "areas",
                                 "BR",
                                 "Br",
                                 "imgx",
                                 "commands",
                                 "\xE2r",
                                 "metameta",
                                 "inputinput",
                                 "p",
                                 "div",
                                 "script",
                                 std::string("b\0", 2),
                                 std::string("\0br", 3)};
  for (const std::string& name : notVoid) {
    EXPECT_FALSE(html::isVoidElement(name)) << name;
  }
}

TEST(TagNames, PackingKeepsNamesApart) {
  EXPECT_EQ(html::packName(""), 0u);
  EXPECT_EQ(html::packName("eightchr"), 0u);
  EXPECT_NE(html::packName("sevench"), 0u);
  const std::string names[] = {"a",
                               std::string("a\0", 2),
                               std::string("\0a", 2),
                               "ab",
                               "ba",
                               "\xE1",
                               "\x61\x80",
                               "abcdefg",
                               "abcdefh",
                               "\xff\xff\xff\xff\xff\xff\xff"};
  for (const std::string& x : names) {
    for (const std::string& y : names) {
      EXPECT_EQ(html::packName(x) == html::packName(y), x == y) << x << " / " << y;
    }
  }
}

}  // namespace
