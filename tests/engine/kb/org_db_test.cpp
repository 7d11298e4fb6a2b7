// The organisations database: ids and categories from "orgs", searched by id.
#include "engine/kb/org_db.h"

#include <gtest/gtest.h>

#include <sstream>

#include "engine/common/error.h"
#include "tests/support/error_of.h"
#include "tests/support/kbdb_test_support.h"

namespace {

ap::SimpleOrgDB FromText(const std::string& text) {
  return ap::SimpleOrgDB(kbdb_test::Entry(text));
}

// "found category" for every id asked.
std::string Answers(const ap::SimpleOrgDB& orgs, std::initializer_list<std::uint64_t> ids) {
  std::string out;
  for (const std::uint64_t id : ids) {
    ap::OrgResult result;
    result.org_id = 999;
    const bool found = orgs.find_org(id, result);
    out += std::to_string(id) + ":" + (found ? "found " : "absent ") +
           std::to_string(result.org_id) + "/" + std::to_string(result.category) + " ";
  }
  return out;
}

TEST(SimpleOrgDB, StopsAtTheFirstIdOutOfOrder) {
  const auto orgs = FromText("5 1\nFive\n7 2\nSeven\n7 3\nAgain\n9 4\nNine\n");
  EXPECT_EQ(orgs.size(), 2u);
  EXPECT_EQ(Answers(orgs, {5, 7, 9, 6}), "5:found 5/1 7:found 7/2 9:absent 999/6 6:absent 999/6 ");
}

TEST(SimpleOrgDB, CategoriesOutsideZeroToNineAreSix) {
  const auto orgs = FromText("1 12\nA\n2 -1\nB\n3 x\nC\n4 0 trailing words\nD\n5 9\nE\n6\n");
  EXPECT_EQ(Answers(orgs, {1, 2, 3, 4, 5, 6}),
            "1:found 1/6 2:found 2/6 3:found 3/6 4:found 4/0 5:found 5/9 6:found 6/6 ");
}

TEST(SimpleOrgDB, OddLineCountAndNoFinalLineFeed) {
  EXPECT_EQ(Answers(FromText("1 1\nA\n2 2"), {1, 2}), "1:found 1/1 2:found 2/2 ");
  EXPECT_EQ(Answers(FromText("1 1\nA\n2 2\n"), {2}), "2:found 2/2 ");
}

// A record without a readable id ends loading; the stream never reaches its end, so a
// loop waiting for it would never stop.
TEST(SimpleOrgDB, StopsAtAnUnreadableId) {
  const auto orgs = FromText("1 1\nA\nnot-a-number 2\nB\n3 3\nC\n");
  EXPECT_EQ(orgs.size(), 1u);
  EXPECT_EQ(FromText("\n").size(), 0u);
  EXPECT_EQ(FromText("   \n\n").size(), 0u);
}

// Ids are kept in 24 bits and ordered by what is kept, so the search stays sound.
TEST(SimpleOrgDB, IdsBeyondTwentyFourBits) {
  const auto orgs = FromText("5 1\nA\n16777223 2\nB\n16777226 3\nC\n");
  EXPECT_EQ(orgs.size(), 3u);
  EXPECT_EQ(Answers(orgs, {7, 10, 16777223, 1ull << 40}),
            "7:found 7/2 10:found 10/3 16777223:absent 999/6 1099511627776:absent 999/6 ");
  const auto wrapped = FromText("5 1\nA\n16777216 2\nB\n");  // keeps 0, not above 5
  EXPECT_EQ(wrapped.size(), 1u);
}

TEST(SimpleOrgDB, MissingEntry) {
  EXPECT_EQ(
      pelmix::testing::ErrorOf([&] { ap::SimpleOrgDB orgs(std::shared_ptr<ap::ReadableFileI>{}); }),
      "Failed to load orgs db - null file");
  std::istringstream failed;
  failed.setstate(std::ios_base::failbit);
  EXPECT_EQ(pelmix::testing::ErrorOf([&] { ap::SimpleOrgDB orgs(failed); }),
            "Failed to load orgs db");
}

// Damaged text: any prefix and any byte changed load something or nothing, never fail or
// hang, and what loads stays sorted: every id kept can be found again.
std::size_t Findable(const ap::SimpleOrgDB& orgs) {
  std::size_t found = 0;
  ap::OrgResult result;
  for (std::uint64_t id = 0; id < 100000; ++id) found += orgs.find_org(id, result) ? 1 : 0;
  return found;
}

TEST(SimpleOrgDB, DamagedText) {
  const std::string good = "1 1\nOne\n2 2\nTwo\n30 3\nThirty\n400 4\nFour hundred\n";
  for (std::size_t size = 0; size <= good.size(); size += 3) {
    const auto orgs = FromText(good.substr(0, size));
    EXPECT_EQ(Findable(orgs), orgs.size());
  }
  for (std::size_t at = 0; at < good.size(); ++at) {
    for (const char c : {'\0', '\n', ' ', '9', 'x'}) {
      std::string text = good;
      text[at] = c;
      const auto orgs = FromText(text);
      EXPECT_EQ(Findable(orgs), orgs.size()) << at << " " << int{c};
    }
  }
}

}  // namespace
