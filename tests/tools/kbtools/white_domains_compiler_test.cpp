// The white-domain writer: bytes, the public-suffix split, the source grammar, and round
// trips through the engine's reader.
#include "tools/kbtools/white_domains_compiler.h"

#include <gtest/gtest.h>

#include "engine/kb/fletcher16.h"
#include "engine/kb/huffman_spooky.h"
#include "engine/kb/white_domains.h"
#include "tools/kbtools/public_suffix.h"
#include "tools/kbtools/source_text.h"
#include "tools/kbtools/wdb_writer.h"

namespace {

using pelmix::kbtools::CompileWhiteDomains;
using pelmix::kbtools::SourceError;

wd::WhiteDomains Compile(const std::string& text) {
  const std::string bytes = CompileWhiteDomains(text, "white_domains.txt");
  return wd::WhiteDomains(std::vector<std::uint8_t>(bytes.begin(), bytes.end()));
}

std::string Show(const wd::WhiteDomains& set, const std::string& host) {
  const wd::DomainResult r = set.Lookup(host);
  return std::to_string(r.key) + (r.partial_flag ? " partial" : "") +
         (r.other_suffix_flag ? " other" : "");
}

std::string ErrorOf(const std::string& text) {
  try {
    CompileWhiteDomains(text, "white_domains.txt");
  } catch (const SourceError& e) {
    return e.what();
  }
  return "no error";
}

TEST(WdbWriter, WritesTheDocumentedLayout) {
  pelmix::kbtools::WdbWriter writer;
  writer.Add(9, "AB", "com", true);
  writer.Add(7, "ab", "net", false);
  writer.Add(7, "ab", "net", false);  // repeated: kept once
  const std::uint32_t code = wd::HuffmanSpooky::Code("ab").code;
  const std::uint16_t com = ap::Fletcher16Of("com", 3);
  const std::uint16_t net = ap::Fletcher16Of("net", 3);
  std::string expected = {1, 0, 0, 0, 5};
  for (int i = 3; i >= 0; --i) expected += static_cast<char>(code >> (8 * i));
  for (const int b :
       {0, 14, 0, 7, 0, 1, net >> 8, net & 0xFF, 0, 0, 9, 0, 1, com >> 8, com & 0xFF, 1}) {
    expected += static_cast<char>(b);
  }
  EXPECT_EQ(writer.Build(), expected);
  EXPECT_EQ(pelmix::kbtools::WdbWriter().Build(), std::string(1, '\0'));
}

TEST(WdbWriter, RefusesWhatTheReaderCouldNeverFind) {
  pelmix::kbtools::WdbWriter writer;
  EXPECT_THROW(writer.Add(0, "a", "com", false), std::invalid_argument);
  EXPECT_THROW(writer.Add(1, "", "com", false), std::invalid_argument);
  EXPECT_THROW(writer.Add(1, "a", "", false), std::invalid_argument);
  EXPECT_THROW(writer.Add(1, "a_b", "com", false), std::invalid_argument);
  EXPECT_THROW(writer.Add(1, std::string(511, 'e'), "com", false), std::invalid_argument);
  EXPECT_THROW(writer.Add(1, "a", "abcdefg.com", false), std::invalid_argument);
  EXPECT_THROW(writer.Add(1, "a", "a.b.c.d", false), std::invalid_argument);
  writer.Add(1, "a", "com", false);
  EXPECT_THROW(writer.Add(1, "a", "com", true), std::invalid_argument);
  EXPECT_EQ(writer.name_count(), 1u);
  // A name's organisation list has a 16-bit length: 9362 organisations of one suffix fit.
  pelmix::kbtools::WdbWriter many;
  int accepted = 0;
  bool refused = false;
  for (int org = 1; org <= 10000 && !refused; ++org) {
    try {
      many.Add(static_cast<std::uint16_t>(org), "brand", "com", false);
      ++accepted;
    } catch (const std::invalid_argument&) {
      refused = true;
    }
  }
  EXPECT_EQ(accepted, 65535 / 7);
  EXPECT_TRUE(refused);
}

TEST(WhiteDomainsCompiler, SplitsWithThePublicSuffixList) {
  const pelmix::kbtools::PublicSuffixList list;
  const auto split = [&](const std::string& domain) {
    const auto s = pelmix::kbtools::SplitWhiteDomain(list, domain);
    return s.name + " + " + s.suffix;
  };
  EXPECT_EQ(split("paypal.co.uk"), "paypal + co.uk");
  EXPECT_EQ(split("login.paypal.com"), "login.paypal + com");
  EXPECT_EQ(split("brand.github.io"), "brand + github.io");
  // Suffixes the reader never looks up give way to shorter ones.
  EXPECT_EQ(split("a.b.c.d.e.kawasaki.jp"), "a.b.c.d.e.kawasaki + jp");
  EXPECT_EQ(split("x.s3.dualstack.eu-west-1.amazonaws.com"),
            "x.s3.dualstack.eu-west-1.amazonaws + com");
  EXPECT_THROW(split("co.uk"), std::invalid_argument);
  EXPECT_THROW(split("localhost"), std::invalid_argument);
}

// Every listed domain is white for its organisation, its subdomains too unless exact, and
// the brand under another suffix is not white but keyed to the organisation listing it
// under the most suffixes.
TEST(WhiteDomainsCompiler, RoundTrip) {
  const auto set = Compile(
      "# brands\n"
      "101 paypal.com\n"
      "101 PayPal.co.uk.\r\n"
      "101 paypal.de   # comment\n"
      "\n"
      "105 paypal.fr\n"
      "102 examplebank.com exact\n"
      "103 mail.example.org\n"
      "104 brand.github.io\n"
      "106 a.b.c.d.e.kawasaki.jp\n");
  for (const auto& [host, answer] : std::vector<std::pair<std::string, std::string>>{
           {"paypal.com", "101"},
           {"www.paypal.co.uk", "101"},
           {"a.b.paypal.de", "101"},
           {"paypal.fr", "105"},
           {"paypal.it", "101 other"},
           {"paypal.com.evil.net", "0"},
           {"examplebank.com", "102"},
           {"www.examplebank.com", "102 partial"},
           {"examplebank.net", "102 other"},
           {"mail.example.org", "103"},
           {"x.mail.example.org", "103"},
           {"example.org", "0"},
           {"brand.github.io", "104"},
           {"other.github.io", "0"},
           {"a.b.c.d.e.kawasaki.jp", "106"},
       }) {
    EXPECT_EQ(Show(set, host), answer) << host;
  }
}

TEST(WhiteDomainsCompiler, ErrorsNameTheLine) {
  const std::pair<std::string, std::string> cases[] = {
      {"1\n", "white_domains.txt:1: expected ORG_ID DOMAIN [exact]"},
      {"# c\n\n1 a.com exact extra\n", "white_domains.txt:3: expected ORG_ID DOMAIN [exact]"},
      {"0 a.com\n", "white_domains.txt:1: organisation id must be 1 to 65535, got 0"},
      {"65536 a.com\n", "white_domains.txt:1: organisation id must be 1 to 65535, got 65536"},
      {"1 a.com Exact\n", "white_domains.txt:1: third field must be \"exact\", got Exact"},
      {"1 pay_pal.com\n",
       "white_domains.txt:1: domain pay_pal.com has a character outside a-z 0-9 - ."},
      {"1 a..com\n", "white_domains.txt:1: domain a..com has an empty label"},
      {"1 co.uk\n", "white_domains.txt:1: domain co.uk is a public suffix"},
      {"1 a.com\n1 a.com exact\n", "white_domains.txt:2: a.com is listed with and without exact"},
      {"1 paypal.com\n2 paypal.com\n",
       "white_domains.txt:2: paypal.com would not be found white for organisation 2: key=1 "
       "partial=0 other_suffix=0"},
      {"1 paypal.com\n2 login.paypal.com\n",
       "white_domains.txt:2: login.paypal.com would not be found white for organisation 2: key=1 "
       "partial=0 other_suffix=0"},
  };
  for (const auto& [text, error] : cases) EXPECT_EQ(ErrorOf(text), error) << text;
  EXPECT_EQ(ErrorOf(""), "no error");
}

}  // namespace
