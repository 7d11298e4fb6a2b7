// The white-domain set: the name code, the suffix filter and checksum, and Lookup over
// images made by hand and by the writer.
#include "engine/kb/white_domains.h"

#include <gtest/gtest.h>

#include <set>
#include <string>

#include "engine/common/error.h"
#include "engine/kb/fletcher16.h"
#include "engine/kb/spooky_hash.h"
#include "engine/kb/test_white_doms.h"
#include "tests/support/error_of.h"
#include "tests/support/kbdb_test_support.h"
#include "tools/kbtools/wdb_writer.h"

namespace {

using wd::DomainResult;
using wd::HuffmanSpooky;
using wd::WhiteDomains;

struct Listing {
  std::uint16_t org;
  const char* name;
  const char* suffix;
  bool exact = false;
};

WhiteDomains Set(std::initializer_list<Listing> listings) {
  pelmix::kbtools::WdbWriter writer;
  for (const Listing& l : listings) writer.Add(l.org, l.name, l.suffix, l.exact);
  const std::string bytes = writer.Build();
  return WhiteDomains(std::vector<std::uint8_t>(bytes.begin(), bytes.end()));
}

std::string Show(const DomainResult& r) {
  return "key=" + std::to_string(r.key) + " partial=" + std::to_string(r.partial_flag) +
         " other=" + std::to_string(r.other_suffix_flag);
}

// The code table is a prefix code (no code starts another), or names would be ambiguous;
// a mistyped code usually breaks that.
TEST(WhiteDomains, CodeTableIsAPrefixCode) {
  std::set<std::string> codes;
  for (int s = 0; s < wd::kSymbolCount; ++s) {
    std::string code;
    for (int b = HuffmanSpooky::BitLength(s) - 1; b >= 0; --b) {
      code += ((HuffmanSpooky::Bits(s) >> b) & 1) ? '1' : '0';
    }
    codes.insert(code);
  }
  ASSERT_EQ(codes.size(), static_cast<std::size_t>(wd::kSymbolCount));
  for (const std::string& a : codes) {
    for (const std::string& b : codes) {
      if (a != b) {
        EXPECT_NE(b.rfind(a, 0), 0u) << a << " is a prefix of " << b;
      }
    }
  }
}

TEST(WhiteDomains, NamesPackMostSignificantBitFirst) {
  std::uint8_t packed[wd::kMaxCodedLength];
  // "ab" = 010 11101, "e." = 0001 011110110 + three zero bits.
  ASSERT_EQ(HuffmanSpooky::Pack("ab", packed), 1);
  EXPECT_EQ(packed[0], 0x5D);
  ASSERT_EQ(HuffmanSpooky::Pack("E.", packed), 2);
  EXPECT_EQ(packed[0], 0x17);
  EXPECT_EQ(packed[1], 0xB0);
  EXPECT_EQ(HuffmanSpooky::Code("ab").code, ap::SpookyHash32("\x5D", 1, 0));
  EXPECT_EQ(HuffmanSpooky::Code("AB").code, HuffmanSpooky::Code("ab").code);
  EXPECT_EQ(HuffmanSpooky::Code("a_b").code, 0u);
  // 255 bytes is the longest code: 510 "e" (4 bits each) fit, 511 do not.
  EXPECT_EQ(HuffmanSpooky::Code(std::string(510, 'e')).length, 255u);
  EXPECT_EQ(HuffmanSpooky::Code(std::string(511, 'e')).code, 0u);
}

TEST(WhiteDomains, SuffixFilter) {
  for (const char* good : {"", "com", "co.uk", "abcdef.com", "a-b.c.d", "xn--p1ai", "com1"}) {
    EXPECT_TRUE(wd::SuffixPasses(good)) << good;
  }
  for (const char* bad : {"abcdefg.com", "1a.com", "co_uk", "co.uk/", "a.b1.c"}) {
    EXPECT_FALSE(wd::SuffixPasses(bad)) << bad;
  }
  EXPECT_EQ(wd::SuffixChecksum("CO.UK"), ap::Fletcher16Of("co.uk", 5));
}

// An image assembled byte by byte: the reader and the writer must not merely agree with
// each other.
TEST(WhiteDomains, ReadsAHandMadeImage) {
  std::uint8_t packed[wd::kMaxCodedLength];
  ASSERT_EQ(HuffmanSpooky::Pack("ab", packed), 1);
  const std::uint32_t code = ap::SpookyHash32(packed, 1, 0);
  const std::uint16_t com = ap::Fletcher16Of("com", 3);
  const std::uint16_t net = ap::Fletcher16Of("net", 3);
  std::vector<std::uint8_t> image = {1, 0, 0, 0, 5};  // M = 1, bucket 1 at offset 5
  for (int i = 3; i >= 0; --i) image.push_back(static_cast<std::uint8_t>(code >> (8 * i)));
  // Two organisations: 7 with net, 9 with com (exact).
  for (const int b :
       {0, 14, 0, 7, 0, 1, net >> 8, net & 0xFF, 0, 0, 9, 0, 1, com >> 8, com & 0xFF, 1}) {
    image.push_back(static_cast<std::uint8_t>(b));
  }
  const WhiteDomains set(image);
  EXPECT_EQ(Show(set.Lookup("ab.com")), "key=9 partial=0 other=0");
  EXPECT_EQ(Show(set.Lookup("ab.net")), "key=7 partial=0 other=0");
  EXPECT_EQ(Show(set.Lookup("x.ab.com")), "key=9 partial=1 other=0");
  EXPECT_EQ(Show(set.Lookup("x.ab.net")), "key=7 partial=0 other=0");
  EXPECT_EQ(Show(set.Lookup("ab.org")), "key=7 partial=0 other=1");
}

TEST(WhiteDomains, HostsThatCannotMatch) {
  const WhiteDomains set = Set({{1, "paypal", "com"}});
  for (const char* host : {"", ".", "com", "paypal", ".paypal.com", "pay_pal.com"}) {
    EXPECT_EQ(Show(set.Lookup(host)), "key=0 partial=0 other=0") << host;
  }
  EXPECT_EQ(Show(set.Lookup("PayPal.COM.")), "key=1 partial=0 other=0");
  // A candidate with "_" is skipped, the others are still tried.
  EXPECT_EQ(Show(set.Lookup("my_host.paypal.com")), "key=1 partial=0 other=0");
  // An empty label gives an empty candidate, which is skipped; ".com" is a suffix too.
  EXPECT_EQ(Show(set.Lookup("a..paypal.com")), "key=1 partial=0 other=0");
  EXPECT_EQ(Show(set.Lookup("paypal..com")), "key=1 partial=0 other=1");
  // The empty suffix passes the filter; the name is found, but not under it.
  EXPECT_EQ(Show(set.Lookup("paypal..")), "key=1 partial=0 other=1");
}

// Listed names under suffixes of one to four labels: the fourth is never looked up.
TEST(WhiteDomains, SuffixesOfOneToFourLabels) {
  pelmix::kbtools::WdbWriter writer;
  writer.Add(1, "one", "com", false);
  writer.Add(2, "two", "co.uk", false);
  writer.Add(3, "three", "a.b.cc", false);
  std::string bytes = writer.Build();
  const WhiteDomains set(std::vector<std::uint8_t>(bytes.begin(), bytes.end()));
  EXPECT_EQ(set.Lookup("one.com").key, 1);
  EXPECT_EQ(set.Lookup("www.two.co.uk").key, 2);
  EXPECT_EQ(set.Lookup("x.y.three.a.b.cc").key, 3);
  EXPECT_EQ(Show(set.Lookup("three.b.cc")), "key=3 partial=0 other=1");
  // The writer refuses a four-label suffix, so that image is made by hand.
  EXPECT_THROW(writer.Add(4, "four", "a.b.c.dd", false), std::invalid_argument);

  std::uint8_t packed[wd::kMaxCodedLength];
  const int length = HuffmanSpooky::Pack("four", packed);
  const std::uint32_t code = ap::SpookyHash32(packed, static_cast<std::size_t>(length), 0);
  const std::uint16_t sum = wd::SuffixChecksum("a.b.c.dd");
  std::vector<std::uint8_t> image(1 + 4 * static_cast<std::size_t>(length), 0);
  image[0] = static_cast<std::uint8_t>(length);
  for (int k = 0; k < length; ++k) image[4 + 4 * k] = static_cast<std::uint8_t>(image.size());
  for (int i = 3; i >= 0; --i) image.push_back(static_cast<std::uint8_t>(code >> (8 * i)));
  for (const int b : {0, 7, 0, 4, 0, 1, sum >> 8, sum & 0xFF, 0}) {
    image.push_back(static_cast<std::uint8_t>(b));
  }
  EXPECT_EQ(Show(WhiteDomains(image).Lookup("four.a.b.c.dd")), "key=0 partial=0 other=0");
}

TEST(WhiteDomains, OtherSuffixFallsBackToTheOrganisationWithMostSuffixes) {
  const WhiteDomains set = Set({{5, "brand", "com"},
                                {6, "brand", "net"},
                                {6, "brand", "org"},
                                {6, "brand", "de"},
                                {7, "brand", "fr"},
                                {7, "brand", "it"}});
  EXPECT_EQ(Show(set.Lookup("brand.co")), "key=6 partial=0 other=1");
  EXPECT_EQ(Show(set.Lookup("login.brand.biz")), "key=6 partial=0 other=1");
  EXPECT_EQ(Show(set.Lookup("brand.it")), "key=7 partial=0 other=0");
  EXPECT_EQ(Show(set.Lookup("brand.com")), "key=5 partial=0 other=0");
}

TEST(WhiteDomains, ExactNamesRefuseOneExtraLabel) {
  const WhiteDomains set = Set({{3, "bank", "com", true}, {4, "shop", "com", false}});
  EXPECT_EQ(Show(set.Lookup("bank.com")), "key=3 partial=0 other=0");
  EXPECT_EQ(Show(set.Lookup("www.bank.com")), "key=3 partial=1 other=0");
  EXPECT_EQ(Show(set.Lookup("a.b.bank.com")), "key=3 partial=1 other=0");
  EXPECT_EQ(Show(set.Lookup("www.shop.com")), "key=4 partial=0 other=0");
}

TEST(TestWhiteDoms, CombinesTheSetWithTheOrganisations) {
  pelmix::kbtools::WdbWriter writer;
  writer.Add(42, "brand", "com", false);
  const std::string wdb = writer.Build();
  TestWhiteDoms white(kbdb_test::Entry(wdb), kbdb_test::Entry("42 3\nBrand\n"));
  const std::string host = "www.brand.com";
  const ap::WhiteDomainRecord record = white.Lookup(host.data(), host.data() + host.size());
  EXPECT_EQ(record.key, 42u);
  EXPECT_TRUE(ap::IsWhite(record));
  ap::OrgResult org;
  EXPECT_TRUE(white.find_org(42, org));
  EXPECT_EQ(org.category, 3);
  EXPECT_FALSE(white.IsCategorised(host.data(), host.data() + 3, host.data(), host.data()));
  EXPECT_FALSE(white.IsShareLink(host.data(), host.data() + 3, host.data(), host.data()));

  EXPECT_EQ(pelmix::testing::ErrorOf<std::runtime_error>(
                [&] { TestWhiteDoms missing(nullptr, kbdb_test::Entry("1 1\n")); }),
            "null pointer to readable in WhiteDomains");
  EXPECT_EQ(
      pelmix::testing::ErrorOf([&] { TestWhiteDoms missing(kbdb_test::Entry(wdb), nullptr); }),
      "Failed to load orgs db - null file");
}

}  // namespace
