#include "tools/mail/link_finder.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace {

std::vector<std::string> Links(std::string_view text) {
  std::vector<std::string> links;
  std::string scratch;
  pelmix::mail::FindLinks(
      text, [&](std::string_view link) { links.emplace_back(link); }, scratch);
  return links;
}

struct Case {
  std::string text;
  std::vector<std::string> links;
};

TEST(LinkFinder, LinksAsAMailReaderMakesThem) {
  const Case cases[] = {
      {"see http://a.example/x now", {"http://a.example/x"}},
      {"HTTPS://A.Example/Path", {"HTTPS://A.Example/Path"}},
      {"www.a.example", {"http://www.a.example"}},
      {"WWW.a.example/p?q=1", {"http://WWW.a.example/p?q=1"}},
      // Sentence punctuation and quotes after a link are not part of it.
      {"Go to http://a.example/x. Then http://b.example/y, ok?",
       {"http://a.example/x", "http://b.example/y"}},
      {"'http://a.example/'!", {"http://a.example/"}},
      {"(http://a.example/x)", {"http://a.example/x"}},
      {"http://en.example/wiki/Foo_(bar)", {"http://en.example/wiki/Foo_(bar)"}},
      {"[see http://a.example/x]]", {"http://a.example/x"}},
      {"<http://a.example/x>", {"http://a.example/x"}},
      {"\"http://a.example/x\"", {"http://a.example/x"}},
      {"*http://a.example/x*", {"http://a.example/x"}},
      // Links end at blanks, controls and no-break or ideographic spaces.
      {"http://a.example/x\thttp://b.example/\r\n", {"http://a.example/x", "http://b.example/"}},
      {"http://a.example/x\xC2\xA0next", {"http://a.example/x"}},
      {"http://a.example/x\xE3\x80\x80next", {"http://a.example/x"}},
      // Internationalised hosts and paths stay as they are.
      {"http://b\xC3\xBC\x63her.example/\xC3\xA4", {"http://b\xC3\xBC\x63her.example/\xC3\xA4"}},
      {"http://[2001:db8::1]/x", {"http://[2001:db8::1]/x"}},
      // Duplicates are reported; the walk keeps each link once.
      {"http://a.example/ http://a.example/", {"http://a.example/", "http://a.example/"}},
      // A link inside another is not a second link.
      {"http://a.example/?u=http://b.example/&w=www.c.example",
       {"http://a.example/?u=http://"
        "b.example/&w=www.c.example"}},
  };
  for (const Case& c : cases) EXPECT_EQ(Links(c.text), c.links) << c.text;
}

TEST(LinkFinder, WhatIsNotALink) {
  const char* texts[] = {
      "http://",
      "http:// a.example",
      "https://.",
      "www.",
      "www..example",
      "xhttp://a.example/",
      "foo.www.a.example",
      "mail@www.a.example",
      "ahttps://a.example",
      "ftp://a.example/",
      "http:/a.example",
      "awww.a.example",
      "-www.a.example",
      "/www.a.example",
      "hxxp://a.example",
      "http//a.example",
  };
  for (const char* text : texts) EXPECT_TRUE(Links(text).empty()) << text;
}

TEST(LinkFinder, ManyClosingBracketsAreTrimmedInOnePass) {
  // A run of unmatched closers is trimmed without rescanning the link for each one.
  const std::string text = "http://a.example/" + std::string(200000, ')');
  EXPECT_EQ(Links(text), std::vector<std::string>{"http://a.example/"});
  const std::string balanced =
      "http://a.example/" + std::string(1000, '(') + std::string(1001, ')');
  EXPECT_EQ(Links(balanced), std::vector<std::string>{balanced.substr(0, balanced.size() - 1)});
}

}  // namespace
