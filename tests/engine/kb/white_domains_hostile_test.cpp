// The white-domain set over damaged images: every read stays inside the image, and a
// damaged part answers "not found" instead of a wrong organisation.
#include <gtest/gtest.h>

#include <string>

#include "engine/common/error.h"
#include "engine/kb/white_domains.h"
#include "tests/support/error_of.h"
#include "tests/support/kbdb_test_support.h"
#include "tools/kbtools/wdb_writer.h"

namespace {

using wd::WhiteDomains;

struct Host {
  const char* name;
  std::uint16_t org;
};

// Names of several coded lengths, so that the image has several buckets.
constexpr Host kHosts[] = {{"ab.com", 1},
                           {"paypal.com", 2},
                           {"paypal.de", 2},
                           {"www.bank.co.uk", 3},
                           {"bank.co.uk", 3},
                           {"shop.net", 4},
                           {"a-very-long-brand-name.org", 5},
                           {"x9.io", 6}};

std::vector<std::uint8_t> GoodImage() {
  pelmix::kbtools::WdbWriter writer;
  writer.Add(1, "ab", "com", false);
  writer.Add(2, "paypal", "com", false);
  writer.Add(2, "paypal", "de", false);
  writer.Add(3, "bank", "co.uk", true);
  writer.Add(4, "shop", "net", false);
  writer.Add(5, "a-very-long-brand-name", "org", false);
  writer.Add(6, "x9", "io", false);
  const std::string bytes = writer.Build();
  return std::vector<std::uint8_t>(bytes.begin(), bytes.end());
}

void PutBe32(std::vector<std::uint8_t>& image, std::size_t at, std::uint32_t value) {
  for (int i = 0; i < 4; ++i) image[at + i] = static_cast<std::uint8_t>(value >> (8 * (3 - i)));
}

TEST(WhiteDomainsHostile, GoodImageAnswersEveryHost) {
  const WhiteDomains set(GoodImage());
  for (const Host& host : kHosts) {
    const wd::DomainResult r = set.Lookup(host.name);
    EXPECT_EQ(r.key, host.org) << host.name;
    // www.bank.co.uk is listed as exact: found, but partial.
    EXPECT_EQ(r.partial_flag, std::string(host.name) == "www.bank.co.uk" ? 1 : 0) << host.name;
  }
}

// Every prefix of the image: a host is never made white for another organisation.
TEST(WhiteDomainsHostile, TruncatedImagesNeverAnswerWrongly) {
  const std::vector<std::uint8_t> good = GoodImage();
  for (std::size_t size = 0; size < good.size(); ++size) {
    const WhiteDomains set(std::vector<std::uint8_t>(good.begin(), good.begin() + size));
    for (const Host& host : kHosts) {
      const wd::DomainResult r = set.Lookup(host.name);
      if (r.partial_flag == 0 && r.other_suffix_flag == 0 && r.key != 0) {
        EXPECT_EQ(r.key, host.org) << host.name << " in " << size << " bytes";
      }
    }
  }
  // Cut inside the last bucket: its whole entries still answer, the cut one does not.
  const WhiteDomains cut(std::vector<std::uint8_t>(good.begin(), good.end() - 1));
  EXPECT_EQ(cut.Lookup("a-very-long-brand-name.org").key, 0);
}

TEST(WhiteDomainsHostile, OffsetsOutsideTheImageHoldNothing) {
  std::vector<std::uint8_t> image = GoodImage();
  const std::size_t largest = image[0];
  // Every bucket starting past the end, or a table longer than the image: nothing is found,
  // nothing is read outside.
  for (const std::uint32_t bad : {0xFFFFFFFFu, static_cast<std::uint32_t>(image.size() + 1)}) {
    std::vector<std::uint8_t> damaged = image;
    for (std::size_t k = 0; k < largest; ++k) PutBe32(damaged, 1 + 4 * k, bad);
    const WhiteDomains set(damaged);
    for (const Host& host : kHosts) EXPECT_EQ(set.Lookup(host.name).key, 0) << host.name;
  }
  std::vector<std::uint8_t> no_table = {200, 0, 0};
  EXPECT_EQ(WhiteDomains(no_table).Lookup("paypal.com").key, 0);
}

// One entry whose lengths lie: a name list longer than its bucket, a suffix count longer
// than its list.
TEST(WhiteDomainsHostile, EntriesThatClaimTooMuchAreAbsent) {
  pelmix::kbtools::WdbWriter writer;
  writer.Add(7, "brand", "com", false);
  const std::string bytes = writer.Build();
  const std::vector<std::uint8_t> good(bytes.begin(), bytes.end());
  const std::size_t entry = 1 + 4 * static_cast<std::size_t>(good[0]);
  ASSERT_EQ(WhiteDomains(good).Lookup("brand.com").key, 7);

  std::vector<std::uint8_t> long_list = good;
  long_list[entry + 5] = 0xFF;  // n
  EXPECT_EQ(WhiteDomains(long_list).Lookup("brand.com").key, 0);

  std::vector<std::uint8_t> long_count = good;
  long_count[entry + 9] = 2;  // c: two suffixes, one present
  const wd::DomainResult r = WhiteDomains(long_count).Lookup("brand.com");
  EXPECT_EQ(r.key, 0);
  EXPECT_EQ(r.other_suffix_flag, 1);
}

TEST(WhiteDomainsHostile, EntryFaults) {
  // A failing read, and an entry that delivers less than its size: a set silently missing
  // domains would pass for a sound one.
  auto failing = kbdb_test::Entry(std::string(100, 'x'));
  failing->fail_after = 0;
  auto short_entry = kbdb_test::Entry(std::string(100, 'x'));
  short_entry->short_by = 5;
  for (const auto& entry : {failing, short_entry}) {
    EXPECT_EQ(pelmix::testing::ErrorOf([&] { WhiteDomains set(entry); }),
              "WhiteDomains: entry read failed");
  }
  auto huge = kbdb_test::Entry("x");
  huge->short_by = static_cast<std::int64_t>(wd::kMaxImageSize);
  EXPECT_EQ(pelmix::testing::ErrorOf([&] { WhiteDomains set(huge); }),
            "WhiteDomains: entry is too large");
}

}  // namespace
