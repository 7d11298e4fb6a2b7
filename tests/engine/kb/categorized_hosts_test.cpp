// The categorised hosts database: sections, digests, path prefixes, traces and faults.
#include "engine/kb/categorized_hosts.h"

#include <gtest/gtest.h>

#include "engine/common/error.h"
#include "engine/kb/md5.h"
#include "tests/support/kb_test_support.h"
#include "tests/support/kbdb_test_support.h"
#include "tools/kbtools/hpdb_writer.h"

namespace {

using hpdb::HashedCatHostsPathes;
using kbdb_test::Entry;
using kbdb_test::TraceCapture;

std::string Le(std::uint64_t value, int width) {
  std::string out;
  for (int i = 0; i < width; ++i) out += static_cast<char>((value >> (8 * i)) & 0xFF);
  return out;
}

std::string Section(char type, const std::string& payload) {
  return std::string(1, type) + Le(payload.size(), 2) + payload;
}

std::string HostSection(const std::string& host, std::uint16_t category) {
  const ap::Md5Digest digest = ap::Md5Of(host);
  return Section('h', Le(category, 2) + std::string(digest.begin(), digest.end()));
}

std::string MaskSection(std::uint64_t mask) { return Section('m', Le(mask, 8)); }

std::string PathSection(const std::string& path, std::uint16_t category) {
  return Section('p', Le(category, 2) + path);
}

// "found category mask no_paths" or "absent".
std::string Ask(const HashedCatHostsPathes& db, const std::string& host, const std::string& path) {
  std::uint16_t category = 0xEEEE;
  std::uint64_t mask = 0xEEEE;
  bool no_paths = false;
  if (!db.lookup(host, path, category, mask, no_paths)) {
    return category == 0xEEEE && mask == 0xEEEE ? "absent" : "absent but written";
  }
  return std::to_string(category) + " " + std::to_string(mask) + (no_paths ? " no_paths" : "");
}

std::string ErrorOf(const std::string& bytes) {
  return pelmix::testing::ErrorOf([&] { HashedCatHostsPathes db(Entry(bytes)); });
}

TEST(HashedCatHostsPathes, FirstMatchingPrefixInFileOrder) {
  const HashedCatHostsPathes db(Entry(HostSection("h.com", 1) + PathSection("/a/", 2) +
                                      PathSection("/a/b", 3) + PathSection("/x", 4)));
  EXPECT_EQ(Ask(db, "h.com", "/a/b"), "2 0");
  EXPECT_EQ(Ask(db, "h.com", "/a/bc"), "2 0");
  EXPECT_EQ(Ask(db, "h.com", "/a"), "1 0");
  EXPECT_EQ(Ask(db, "h.com", "/x"), "4 0");
  EXPECT_EQ(Ask(db, "h.com", "/x/"), "1 0");
  EXPECT_EQ(Ask(db, "h.com", "/xy"), "1 0");
  EXPECT_EQ(Ask(db, "other.com", "/a/"), "absent");
}

TEST(HashedCatHostsPathes, FoldsAsciiCaseOnly) {
  const HashedCatHostsPathes db(
      Entry(HostSection("h\xc3\x89.com", 5) + PathSection("/\xc3\x89t\xc3\xa9/", 6)));
  EXPECT_EQ(Ask(db, "H\xc3\x89.COM", "/\xc3\x89T\xc3\xa9/page"), "6 0");
  EXPECT_EQ(Ask(db, "h\xc3\xa9.com", "/"), "absent");
  EXPECT_EQ(Ask(db, "H\xc3\x89.com", "/\xc3\xa9t\xc3\xa9/"), "5 0");
}

TEST(HashedCatHostsPathes, RepeatedHostKeepsMaskAndPaths) {
  const HashedCatHostsPathes db(Entry(HostSection("h.com", 1) + MaskSection(0x5) +
                                      PathSection("/p/", 2) + HostSection("g.com", 3) +
                                      HostSection("h.com", 9) + MaskSection(0x30)));
  EXPECT_EQ(db.host_count(), 2u);
  EXPECT_EQ(Ask(db, "h.com", "/"), "9 48");
  EXPECT_EQ(Ask(db, "h.com", "/p/q"), "2 48");
  EXPECT_EQ(Ask(db, "g.com", "/"), "3 0 no_paths");
}

TEST(HashedCatHostsPathes, TracesWhatItSkips) {
  TraceCapture trace;
  const HashedCatHostsPathes db(
      Entry(MaskSection(1) + PathSection("/early", 1) + Section('h', "short") +
            Section('m', "short") + Section('p', "x") + Section('z', std::string(3000, 'q')) +
            HostSection("h.com", 7) + Section('m', std::string(9, '\0'))));
  EXPECT_EQ(Ask(db, "h.com", "/"), "7 0 no_paths");
  const std::vector<TraceCapture::Line> expected = {{"HDBP: mask without host", 1},
                                                    {"HDBP: path without host", 1},
                                                    {"HPDB: host section size mismatch", 1},
                                                    {"HPDB: mask section size mismatch", 1},
                                                    {"HPDB: path section too small", 1},
                                                    {"HPDB: mask section size mismatch", 1},
                                                    {"HPDB: 1 hosts loaded", 0}};
  EXPECT_EQ(trace.lines(), expected);
}

TEST(HashedCatHostsPathes, MissingEntryIsAnEmptyDatabase) {
  TraceCapture trace;
  const HashedCatHostsPathes db(nullptr);
  EXPECT_EQ(db.host_count(), 0u);
  EXPECT_EQ(Ask(db, "h.com", "/"), "absent");
  EXPECT_EQ(trace.lines(),
            (std::vector<TraceCapture::Line>{{"HPDB: null source results empty DB!", 1}}));
}

TEST(HashedCatHostsPathes, TruncatedAndDamagedEntries) {
  const std::string good = HostSection("h.com", 1) + MaskSection(2) + PathSection("/p", 3);
  EXPECT_EQ(ErrorOf(good), "no error");
  // Every cut: inside a header's size, inside a payload, or right after a section.
  for (std::size_t size = 1; size < good.size(); ++size) {
    const std::string cut = good.substr(0, size);
    const std::size_t in_section = size < 21 ? size : size < 32 ? size - 21 : size - 32;
    std::string expected = "HDBP: Can't read";
    if (in_section == 0) expected = "no error";
    if (in_section == 1 || in_section == 2) expected = "HPDB: Invalid db format";
    EXPECT_EQ(ErrorOf(cut), expected) << size;
  }
  EXPECT_EQ(ErrorOf(Section('p', Le(3, 2))), "HDBP: Can't read");  // an empty path
  EXPECT_EQ(ErrorOf(std::string("z") + Le(10, 2) + "abc"), "HPDB: invalid section size");
  EXPECT_EQ(ErrorOf(std::string("h") + Le(17, 2) + "abc"), "HPDB: invalid section size");
}

// A failing read is not the end of the entry.
TEST(HashedCatHostsPathes, ReadFailureIsAnError) {
  auto entry = Entry(HostSection("h.com", 1) + HostSection("g.com", 2));
  entry->fail_after = 21;
  EXPECT_EQ(pelmix::testing::ErrorOf([&] { HashedCatHostsPathes db(entry); }), "HDBP: Can't read");
}

// A database several load buffers long: sections straddle every buffer edge, and an entry
// that hands out its bytes in small pieces gives the same database as one that reads whole.
TEST(HashedCatHostsPathes, LargeDatabaseWholeAndInPieces) {
  std::string bytes;
  std::size_t hosts = 0;
  while (bytes.size() < 3 * hpdb::kLoadBufferSize + 17) {
    const std::string host = std::string("h") + std::to_string(hosts) + ".example";
    bytes += HostSection(host, static_cast<std::uint16_t>(hosts % 9)) + MaskSection(hosts);
    if (hosts % 5 == 0) bytes += PathSection(std::string("/p") + std::to_string(hosts) + "/", 100);
    ++hosts;
  }
  for (const std::uint64_t max_read : {0, 1, 7, 1000, 65537}) {
    auto entry = Entry(bytes);
    entry->max_read = max_read;
    const HashedCatHostsPathes db(entry);
    ASSERT_EQ(db.host_count(), hosts) << max_read;
    for (const std::size_t i : {std::size_t{0}, hosts / 2, hosts - 1}) {
      const std::string host = std::string("h") + std::to_string(i) + ".example";
      const std::string tail = i % 5 == 0 ? "" : " no_paths";
      EXPECT_EQ(Ask(db, host, "/"), std::to_string(i % 9) + " " + std::to_string(i) + tail);
      if (i % 5 == 0) {
        EXPECT_EQ(Ask(db, host, std::string("/p") + std::to_string(i) + "/x"),
                  std::string("100 ") + std::to_string(i));
      }
    }
  }
  // A failure after the first buffers is still an error, not a quiet end of the list.
  auto failing = Entry(bytes);
  failing->fail_after = static_cast<std::int64_t>(2 * hpdb::kLoadBufferSize + 5);
  EXPECT_EQ(pelmix::testing::ErrorOf([&] { HashedCatHostsPathes db(failing); }),
            "HDBP: Can't read");
}

TEST(HashedCatHostsPathes, ReadsWhatTheWriterWrites) {
  pelmix::kbtools::HpdbWriter writer;
  writer.AddHost("Phish.Example", 3, 0x8000000000000001ull);
  writer.AddPath("phish.example", "/Login/", 4);
  writer.AddHost("plain.example", 7);
  const std::string bytes = writer.Build();
  EXPECT_EQ(bytes, HostSection("phish.example", 3) + MaskSection(0x8000000000000001ull) +
                       PathSection("/login/", 4) + HostSection("plain.example", 7));
  const HashedCatHostsPathes db(Entry(bytes));
  EXPECT_EQ(Ask(db, "phish.example", "/login/x"), "4 9223372036854775809");
  EXPECT_EQ(Ask(db, "plain.example", "/"), "7 0 no_paths");
}

}  // namespace
