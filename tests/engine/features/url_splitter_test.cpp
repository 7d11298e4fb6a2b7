#include "engine/features/url_splitter.h"

#include <gtest/gtest.h>

#include <fstream>
#include <sstream>
#include <string>
#include <vector>

namespace html_features {
namespace {

std::string Unescape(const std::string& field) {
  std::string out;
  for (std::size_t i = 0; i < field.size(); ++i) {
    if (field[i] != '\\' || i + 1 == field.size()) {
      out.push_back(field[i]);
      continue;
    }
    const char c = field[++i];
    if (c == 't')
      out.push_back('\t');
    else if (c == 'n')
      out.push_back('\n');
    else if (c == 'r')
      out.push_back('\r');
    else if (c == 'x') {
      out.push_back(static_cast<char>(std::stoi(field.substr(i + 1, 2), nullptr, 16)));
      i += 2;
    } else {
      out.push_back(c);
    }
  }
  return out;
}

std::vector<std::string> Fields(const std::string& line) {
  std::vector<std::string> fields;
  std::stringstream in(line);
  std::string field;
  while (std::getline(in, field, '\t')) fields.push_back(Unescape(field));
  if (!line.empty() && line.back() == '\t') fields.push_back("");
  return fields;
}

// The http and https cases of the web-platform-tests URL data: the host a browser finds (or
// its refusal) for every input that is itself an absolute or scheme-relative web URL.
TEST(UrlSplitter, AgreesWithBrowsersOnHosts) {
  std::ifstream in(PELMIX_SOURCE_DIR "/tests/engine/features/data/wpt_url_cases.tsv");
  ASSERT_TRUE(in) << "missing table";
  std::string line;
  bool header = false;
  int checked = 0;
  while (std::getline(in, line)) {
    if (!header) {
      header = line.rfind("input\t", 0) == 0;
      continue;
    }
    const auto f = Fields(line);
    ASSERT_GE(f.size(), 7u) << line;
    const std::string& input = f[0];
    const bool failure = f[6] == "1";
    UrlParts parts;
    SplitUrl(input, parts);
    if (parts.linkClass == LinkClass::kNone) continue;  // resolved against its base only
    // "http:host" or "http:/host" is relative to a base of the same scheme.
    const std::size_t colon = input.find(':');
    const auto slash = [&](std::size_t i) {
      return i < input.size() && (input[i] == '/' || input[i] == '\\');
    };
    if (!f[1].empty() && parts.linkClass == LinkClass::kAbsolute &&
        !(slash(colon + 1) && slash(colon + 2)))
      continue;
    // libidn2 applies the IDNA2008 validity rules after the UTS #46 mapping: symbols such
    // as U+2603 are refused where browsers take them.
    if (input == "https://%e2%98%83") continue;
    ++checked;
    if (failure) {
      EXPECT_FALSE(parts.hasHost) << "input: " << input << " host: " << parts.host;
      continue;
    }
    std::string expected = f[2];
    if (!expected.empty() && expected.back() == '.') expected.pop_back();
    EXPECT_EQ(parts.host, expected) << "input: " << input;
    EXPECT_EQ(parts.hasHost, !expected.empty()) << "input: " << input;
  }
  EXPECT_GT(checked, 250);
}

TEST(UrlSplitter, ClassesAndParts) {
  struct Case {
    const char* url;
    LinkClass cls;
    bool relative;
    const char* host;
    const char* path;
  };
  const Case cases[] = {
      {"HTTPS://User:pw@WWW.PayPal.COM:443/a\\b?q=\\x#f", LinkClass::kAbsolute, false,
       "www.paypal.com", "/a/b?q=\\x#f"},
      {"//cdn.example.net/x.js", LinkClass::kSchemeRelative, false, "cdn.example.net", "/x.js"},
      {"\\\\cdn.example.net", LinkClass::kSchemeRelative, false, "cdn.example.net", ""},
      {"/login.php", LinkClass::kNone, true, "", ""},
      {"login.php", LinkClass::kNone, true, "", ""},
      {"javascript:alert(1)", LinkClass::kNone, false, "", ""},
      {"data:text/html,<b>x</b>", LinkClass::kNone, false, "", ""},
      {"mailto:a@b.c", LinkClass::kNone, false, "", ""},
      {"http://example.com./", LinkClass::kAbsolute, false, "example.com", "/"},
      {"http://xn--pypal-4ve.com/", LinkClass::kAbsolute, false, "xn--pypal-4ve.com", "/"},
      {"http://p\xd0\xb0ypal.com/", LinkClass::kAbsolute, false, "xn--pypal-4ve.com", "/"},
      {"http://0x7f.1/", LinkClass::kAbsolute, false, "127.0.0.1", "/"},
      {"http://[0:0::1]:80/", LinkClass::kAbsolute, false, "[::1]", "/"},
  };
  for (const Case& c : cases) {
    UrlParts parts;
    SplitUrl(c.url, parts);
    EXPECT_EQ(parts.linkClass, c.cls) << c.url;
    EXPECT_EQ(parts.relative, c.relative) << c.url;
    EXPECT_EQ(parts.host, c.host) << c.url;
    if (parts.hasHost) {
      EXPECT_EQ(parts.path, c.path) << c.url;
    }
  }
  UrlParts idn;
  SplitUrl("http://xn--pypal-4ve.com/", idn);
  EXPECT_EQ(idn.unicodeHost, "p\xd0\xb0ypal.com");  // look-alike letters stay visible
}

TEST(UrlSplitter, HostileInputsHaveNoHost) {
  const std::string huge(1 << 20, 'a');
  const std::string cases[] = {
      "http://",
      "http://:80/",
      "http://a b/",
      "http://a:99999/",
      "http://a:x/",
      "http://[::1/",
      "http://%zz%/",
      "http://a<b/",
      "http://1.2.3.4.5/",
      "http://999.1.1.1/",
      "http://" + huge,
      "http://\xff\xfe/",
      std::string("http://a\0b/", 11),
  };
  for (const std::string& url : cases) {
    UrlParts parts;
    SplitUrl(url, parts);
    EXPECT_FALSE(parts.hasHost) << url.substr(0, 40);
  }
}

TEST(UrlSplitter, AddressesAndDomains) {
  EXPECT_TRUE(IsDottedIPv4("192.168.1.1"));
  EXPECT_FALSE(IsDottedIPv4("192.168.1"));
  EXPECT_FALSE(IsDottedIPv4("1.2.3.256"));
  EXPECT_FALSE(IsDottedIPv4("1..2.3"));
  for (const char* special :
       {"10.1.2.3", "172.16.0.1", "172.31.255.255", "192.168.0.9", "127.0.0.1"})
    EXPECT_TRUE(IsSpecialAddress(special)) << special;
  for (const char* plain : {"172.32.0.1", "127.0.0.2", "8.8.8.8", "paypal.com", "11.0.0.1"})
    EXPECT_FALSE(IsSpecialAddress(plain)) << plain;
  EXPECT_EQ(RegistrableDomain("www.paypal.co.uk"), "paypal.co.uk");
  EXPECT_EQ(RegistrableDomain("evil.github.io"), "evil.github.io");
  EXPECT_EQ(RegistrableDomain("10.0.0.1"), "10.0.0.1");
  EXPECT_TRUE(IsTopLevelDomain("com"));
  EXPECT_TRUE(IsTopLevelDomain("de"));
  EXPECT_FALSE(IsTopLevelDomain("php"));
  EXPECT_FALSE(IsTopLevelDomain("co.uk"));
}

}  // namespace
}  // namespace html_features
