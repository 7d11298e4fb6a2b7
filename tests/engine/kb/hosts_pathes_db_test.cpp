// The share-link list: exact (host, path) pairs.
#include "engine/kb/hosts_pathes_db.h"

#include <gtest/gtest.h>

#include <sstream>

#include "engine/common/error.h"
#include "engine/kb/packed_file.h"
#include "tests/support/kb_test_support.h"

namespace {

ap::HostsPathesDB FromText(const std::string& text) {
  std::istringstream in(text);
  return ap::HostsPathesDB(in);
}

TEST(HostsPathesDB, ExactPairsOnly) {
  const auto db = FromText("docs.example.com /share\n");
  EXPECT_TRUE(db.contains("docs.example.com", "/share"));
  EXPECT_FALSE(db.contains("docs.example.com", "/share/"));
  EXPECT_FALSE(db.contains("docs.example.com", "/shar"));
  EXPECT_FALSE(db.contains("docs.example.com", "/other"));
  EXPECT_FALSE(db.contains("DOCS.EXAMPLE.COM", "/share"));
  EXPECT_FALSE(db.contains("example.com", "/share"));
  const std::string host = "docs.example.com", path = "/share";
  EXPECT_TRUE(
      db.contains(host.data(), host.data() + host.size(), path.data(), path.data() + path.size()));
}

TEST(HostsPathesDB, TokensPairAcrossAnyWhitespace) {
  const auto db = FromText("a.com /x a.com\t/y\n\nb.com\n/z\r\na.com /x\nlonely.com");
  EXPECT_EQ(db.host_count(), 2u);
  EXPECT_TRUE(db.contains("a.com", "/x"));
  EXPECT_TRUE(db.contains("a.com", "/y"));
  EXPECT_TRUE(db.contains("b.com", "/z"));
  EXPECT_FALSE(db.contains("lonely.com", ""));
  EXPECT_EQ(FromText("\n").host_count(), 0u);
}

// Through the container: a missing entry fails the load, a single line feed is empty.
TEST(HostsPathesDB, LoadsFromTheContainer) {
  const auto packed = pelmix::testing::PackedOf({{"share_links.txt", "h.com /p\n"}});
  EXPECT_TRUE(ap::LoadHostsPathesDB(*packed)->contains("h.com", "/p"));
  const auto without = pelmix::testing::PackedOf({{"share_links.txt", ""}});
  EXPECT_EQ(pelmix::testing::ErrorOf([&] { ap::LoadHostsPathesDB(*without); }),
            "null readable for tell");
}

}  // namespace
