#include "engine/kb/packed_file.h"

#include <gtest/gtest.h>

#include <boost/function/function_base.hpp>
#include <random>

#include "engine/common/error.h"
#include "engine/kb/crc32.h"
#include "framework/uvo/exception.h"
#include "tests/support/kb_test_support.h"
#include "tools/kbtools/container_writer.h"

namespace {

using pelmix::kbtools::ContainerWriter;
using pelmix::testing::GetLe32;
using pelmix::testing::OpenPacked;
using pelmix::testing::PutLe;
using pelmix::testing::RecordAt;
using pelmix::testing::Reseal;

std::string Pattern(std::size_t size, unsigned seed) {
  std::mt19937 random(seed);
  std::string bytes(size, '\0');
  for (char& c : bytes) c = static_cast<char>(random());
  return bytes;
}

using pelmix::testing::ErrorOf;

std::vector<std::pair<std::string, std::uint64_t>> Listing(ap::PackedFile& packed) {
  std::vector<std::pair<std::string, std::uint64_t>> listing;
  packed.enumerate(
      [&](const std::string& name, std::uint64_t size) { listing.emplace_back(name, size); });
  return listing;
}

std::string ReadAll(ap::ReadableFileI& file, std::size_t chunk) {
  std::string out;
  std::string buffer(chunk, '\0');
  for (;;) {
    const std::int64_t got = file.file_read(buffer.data(), chunk);
    if (got <= 0) break;
    out.append(buffer, 0, static_cast<std::size_t>(got));
  }
  return out;
}

// Three small entries: "a" (10 bytes), "b" (1 byte), "v3.cfg".
std::string SmallContainer() {
  ContainerWriter writer;
  writer.Add("v3.cfg", "dbstamp=7;\n");
  writer.Add("a", "0123456789");
  writer.Add("b", "x");
  return writer.Build();
}

TEST(Crc32, IsTheIsoHdlcChecksum) {
  EXPECT_EQ(ap::Crc32Of("123456789", 9), 0xCBF43926u);
  const std::string bytes = Pattern(10000, 1);
  EXPECT_EQ(ap::Crc32Of(bytes.data(), bytes.size()),
            pelmix::testing::ZlibCrc(bytes.data(), bytes.size()));
  ap::Crc32 pieces;
  pieces.Update(bytes.data(), 4097);
  pieces.Update(bytes.data() + 4097, bytes.size() - 4097);
  EXPECT_EQ(pieces.Value(), ap::Crc32Of(bytes.data(), bytes.size()));
}

TEST(ContainerWriter, LaysOutHeaderTableRecordsThenData) {
  ContainerWriter writer;
  writer.Add("bb", "xyz");
  writer.Add("a", "");
  const std::string bytes = writer.Build();
  // header 15, table 8, records 23 and 24, data 3
  ASSERT_EQ(bytes.size(), 73u);
  EXPECT_EQ(bytes.substr(0, 3), "PMK");
  EXPECT_EQ(GetLe32(bytes, 3), 73u);
  EXPECT_EQ(GetLe32(bytes, 7), pelmix::testing::ZlibCrc(bytes.data() + 11, 62));
  EXPECT_EQ(GetLe32(bytes, 11), 2u);
  EXPECT_EQ(GetLe32(bytes, 15), 0u) << "record of \"a\" first: names are sorted";
  EXPECT_EQ(GetLe32(bytes, 19), 23u);
  const std::string record_a(
      "\0\0\0\0\0\0\0\0"
      "\x46\0\0\0\0\0\0\0"
      "\0\0\0\0"
      "\x01\0"
      "a",
      23);
  EXPECT_EQ(bytes.substr(23, 23), record_a);
  EXPECT_EQ(bytes.substr(46, 8), std::string("\x03\0\0\0\0\0\0\0", 8));
  EXPECT_EQ(bytes.substr(54, 8), std::string("\x46\0\0\0\0\0\0\0", 8));
  EXPECT_EQ(GetLe32(bytes, 62), pelmix::testing::ZlibCrc("xyz", 3));
  EXPECT_EQ(bytes.substr(66, 4), std::string("\x02\0"
                                             "bb",
                                             4));
  EXPECT_EQ(bytes.substr(70), "xyz");
}

TEST(ContainerWriter, RefusesWhatAReaderCouldNotSee) {
  ContainerWriter writer;
  writer.Add("name", "1");
  EXPECT_THROW(writer.Add("name", "2"), std::invalid_argument);
  EXPECT_THROW(writer.Add(std::string(65536, 'n'), ""), std::invalid_argument);
  EXPECT_NO_THROW(writer.Add(std::string(65535, 'n'), ""));
}

TEST(PackedFile, RoundTripInOddChunks) {
  const std::vector<std::pair<std::string, std::string>> entries = {
      {"one", Pattern(1, 2)},
      {"page", Pattern(4096, 3)},
      {"page+1", Pattern(4097, 4)},
      {"mebi", Pattern(1 << 20, 5)},
      {"empty", ""},
      {"dir/nested name", Pattern(777, 6)},
  };
  ContainerWriter writer;
  for (const auto& [name, data] : entries) writer.Add(name, data);
  const auto packed = OpenPacked(writer.Build());

  EXPECT_EQ(packed->entry_count(), entries.size());
  const auto listing = Listing(*packed);
  std::vector<std::pair<std::string, std::uint64_t>> expected;
  for (const auto& [name, data] : entries) expected.emplace_back(name, data.size());
  std::sort(expected.begin(), expected.end());
  EXPECT_EQ(listing, expected);

  for (const auto& [name, data] : entries) {
    for (const std::size_t chunk : {1u, 7u, 4095u, 4097u, 65537u}) {
      if (data.size() > 100000 && chunk < 4095) continue;  // byte steps over 1 MiB: slow, no gain
      const auto entry = packed->open(name);
      if (data.empty()) {
        EXPECT_EQ(entry, nullptr) << "an empty entry opens as nothing";
        continue;
      }
      ASSERT_NE(entry, nullptr) << name;
      EXPECT_EQ(entry->file_size(), static_cast<std::int64_t>(data.size()));
      EXPECT_EQ(ReadAll(*entry, chunk), data) << name << " in chunks of " << chunk;
    }
  }
}

TEST(PackedFile, MarkerIsSkippedAndNamesMatchExactly) {
  std::string bytes = SmallContainer();
  bytes.replace(0, 3, "\xff\x00Z", 3);
  const auto packed = OpenPacked(bytes);
  EXPECT_NE(packed->open("v3.cfg"), nullptr);
  EXPECT_EQ(packed->open("V3.cfg"), nullptr);
  EXPECT_EQ(packed->open("v3.cfg "), nullptr);
  EXPECT_EQ(packed->open("v3.cf"), nullptr);
  EXPECT_EQ(packed->open(""), nullptr);
}

TEST(PackedFile, AnyDamagedBodyByteIsRefused) {
  const std::string good = SmallContainer();
  for (std::size_t at = 3; at < good.size(); ++at) {
    for (const char flip : {'\x01', '\x80'}) {
      std::string bad = good;
      bad[at] = static_cast<char>(bad[at] ^ flip);
      std::string outcome;
      try {
        OpenPacked(bad);
        outcome = "opened";
      } catch (const ap::Error& e) {
        outcome = e.what();
      } catch (const uvo::CheckFailedException& e) {
        outcome = "past the end";
      }
      if (at >= 7) {
        EXPECT_EQ(outcome, "Control summ is invalid") << "byte " << at;
      } else {
        // total_length: a shorter one sums other bytes; a longer one runs past the file,
        // which the adapter refuses before the sum is compared.
        EXPECT_TRUE(outcome == "Control summ is invalid" || outcome == "past the end")
            << "byte " << at << ": " << outcome;
      }
    }
  }
}

TEST(PackedFile, DamagedEntryFailsOnlyWhenOpened) {
  std::string bytes = SmallContainer();
  const ap::PackedFile::Record a = OpenPacked(bytes)->record(0);
  ASSERT_EQ(a.name, "a");
  const auto data_of_a = static_cast<std::size_t>(a.data_offset);
  bytes[data_of_a + 3] ^= 0x20;
  Reseal(bytes);
  const auto packed = OpenPacked(bytes);
  EXPECT_EQ(ErrorOf([&] { packed->open("a"); }), "Failed to create ReadableFile crc error");
  EXPECT_NE(packed->open("b"), nullptr);
  EXPECT_NE(packed->open("v3.cfg"), nullptr);
  // Every open checks again.
  EXPECT_EQ(ErrorOf([&] { packed->open("a"); }), "Failed to create ReadableFile crc error");
}

TEST(PackedFile, DuplicateNamesOpenTheFirstInTableOrder) {
  ContainerWriter writer;
  writer.Add("dup1", "first");
  writer.Add("dup2", "second");
  std::string bytes = writer.Build();
  const std::size_t second = RecordAt(bytes, 1);
  ASSERT_EQ(bytes.substr(second + 22, 4), "dup2");
  bytes[second + 25] = '1';
  Reseal(bytes);
  const auto packed = OpenPacked(bytes);
  const auto entry = packed->open("dup1");
  ASSERT_NE(entry, nullptr);
  EXPECT_EQ(ReadAll(*entry, 64), "first");
  EXPECT_EQ(Listing(*packed),
            (std::vector<std::pair<std::string, std::uint64_t>>{{"dup1", 5}, {"dup1", 6}}));
}

TEST(PackedFile, OpenedEntrySeekAndRead) {
  const auto packed = OpenPacked(SmallContainer());
  auto entry = packed->open("a");
  ASSERT_NE(entry, nullptr);
  char out[100] = {};
  EXPECT_EQ(entry->file_size(), 10);
  EXPECT_EQ(entry->file_seek(9), 9);
  EXPECT_EQ(entry->file_seek(10), -1);
  EXPECT_EQ(entry->file_seek(-1), -1);
  EXPECT_EQ(entry->file_read(out, 100), 1) << "refused seeks must leave the position at 9";
  EXPECT_EQ(out[0], '9');
  EXPECT_EQ(entry->file_seek(4), 4);
  EXPECT_EQ(entry->file_read(out, 100), 6);
  EXPECT_EQ(std::string(out, 6), "456789");
  EXPECT_EQ(entry->file_read(out, 100), 0);
  EXPECT_EQ(entry->file_seek(0), 0);
  EXPECT_EQ(entry->file_read(out, 0), 0);
  EXPECT_EQ(entry->file_read(out, 3), 3);
  EXPECT_EQ(std::string(out, 3), "012");
}

TEST(PackedFile, EntriesAreIndependentAndOutliveTheContainer) {
  auto packed = OpenPacked(SmallContainer());
  const auto a = packed->open("a");
  const auto b = packed->open("b");
  const auto a2 = packed->open("a");
  packed.reset();
  char out[4];
  ASSERT_EQ(a->file_read(out, 2), 2);
  ASSERT_EQ(b->file_read(out + 2, 1), 1);
  ASSERT_EQ(a2->file_read(out + 3, 1), 1);
  ASSERT_EQ(a->file_read(out, 1), 1);
  EXPECT_EQ(out[0], '2');
  EXPECT_EQ(std::string(out + 1, 3), "1x0");
}

TEST(PackedFile, EnumerateVisitsEveryEntryOnce) {
  const auto packed = OpenPacked(SmallContainer());
  int calls = 0;
  bool found = false;
  packed->enumerate([&](const std::string& name, std::uint64_t) {
    ++calls;
    if (name == "a") found = true;  // a caller that found what it wanted cannot stop the walk
  });
  EXPECT_TRUE(found);
  EXPECT_EQ(calls, 3);
  EXPECT_EQ(pelmix::testing::ErrorOf<boost::bad_function_call>([&] { packed->enumerate({}); }),
            "call to empty boost::function");
}

}  // namespace
