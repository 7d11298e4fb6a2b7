// Containers built to hurt the reader. Each must end in ap::Error or the adapter's own
// refusal, never in a crash or an allocation the file's real size does not justify.
#include <gtest/gtest.h>

#include <map>
#include <random>

#include "engine/common/error.h"
#include "engine/kb/packed_file.h"
#include "framework/uvo/exception.h"
#include "tests/support/kb_test_support.h"
#include "tools/kbtools/container_writer.h"

namespace {

using pelmix::kbtools::ContainerWriter;
using pelmix::testing::MemoryFile;
using pelmix::testing::OpenPacked;
using pelmix::testing::PutLe;
using pelmix::testing::RecordAt;
using pelmix::testing::Reseal;

std::string Sample() {
  ContainerWriter writer;
  writer.Add("lexdb.txt", std::string(5000, 'l'));
  writer.Add("orgs", "bank\nshop\n");
  writer.Add("v3.cfg", "dbstamp=1;\n");
  return writer.Build();
}

// Opens the container, lists it and reads every entry; returns what stopped it.
std::string Exercise(std::shared_ptr<ap::FileIO> handle) {
  try {
    ap::PackedFile packed(std::move(handle));
    std::vector<std::string> names;
    packed.enumerate([&](const std::string& name, std::uint64_t) { names.push_back(name); });
    for (const std::string& name : names) {
      if (const auto entry = packed.open(name)) {
        char buffer[4096];
        while (entry->file_read(buffer, sizeof buffer) > 0) {
        }
      }
    }
    return "ok";
  } catch (const ap::Error& e) {
    return e.what();
  } catch (const uvo::CheckFailedException&) {
    return "adapter refused";
  }
}

std::string ExerciseBytes(const std::string& bytes) {
  return Exercise(pelmix::testing::AdapterOver(bytes));
}

std::string ExerciseLenient(const std::string& bytes) {
  return Exercise(std::make_shared<MemoryFile>(std::make_shared<const std::string>(bytes)));
}

TEST(PackedFileHostile, EveryTruncationFails) {
  const std::string good = Sample();
  ASSERT_EQ(ExerciseBytes(good), "ok");
  for (std::size_t length = 0; length < good.size(); ++length) {
    const std::string cut = good.substr(0, length);
    EXPECT_NE(ExerciseBytes(cut), "ok") << length;
    EXPECT_NE(ExerciseLenient(cut), "ok") << length;
  }
}

TEST(PackedFileHostile, ShortBodyFailsEvenWhenItsSumMatches) {
  // The stored sum is made over the bytes that are there; total_length still claims more.
  std::string cut = Sample().substr(0, 3000);
  Reseal(cut);
  EXPECT_EQ(ExerciseLenient(cut), "Control summ is invalid");
  EXPECT_EQ(ExerciseBytes(cut), "adapter refused");
}

TEST(PackedFileHostile, EntryCutShortFailsEvenWhenItsSumMatches) {
  std::string bytes = Sample();
  const std::size_t record = RecordAt(bytes, 0);  // lexdb.txt, 5000 bytes
  PutLe(bytes, record, 6000, 8);                  // reaches past the end of the file
  const std::uint64_t offset = pelmix::testing::GetLe32(bytes, record + 8);
  PutLe(bytes, record + 16, pelmix::testing::ZlibCrc(bytes.data() + offset, bytes.size() - offset),
        4);
  Reseal(bytes);
  EXPECT_EQ(ExerciseLenient(bytes), "Failed to create ReadableFile crc error");
  EXPECT_EQ(ExerciseBytes(bytes), "adapter refused");
}

TEST(PackedFileHostile, TotalLengthBelowElevenWraps) {
  for (const std::uint32_t length : {0u, 10u}) {
    std::string bytes = Sample();
    PutLe(bytes, 3, length, 4);
    EXPECT_EQ(ExerciseBytes(bytes), "adapter refused") << length;
    EXPECT_EQ(ExerciseLenient(bytes), "Control summ is invalid") << length;
  }
}

TEST(PackedFileHostile, EntryCountBeyondTheContainerIsRefusedBeforeAllocating) {
  const std::string good = Sample();
  const std::uint32_t fits = (static_cast<std::uint32_t>(good.size()) - 15) / 4;
  for (const std::uint32_t count : {0xFFFFFFFFu, 0x40000000u, fits + 1}) {
    std::string bytes = good;
    PutLe(bytes, 11, count, 4);
    Reseal(bytes);
    EXPECT_EQ(ExerciseBytes(bytes), "PackedFile: entry count exceeds the container") << count;
  }
  // As many slots as the length can hold is accepted; the garbage they point at is not.
  std::string bytes = good;
  PutLe(bytes, 11, fits, 4);
  Reseal(bytes);
  EXPECT_NE(ExerciseBytes(bytes), "PackedFile: entry count exceeds the container");
}

TEST(PackedFileHostile, RecordOffsetsPastTheEnd) {
  std::string past = Sample();
  PutLe(past, 15 + 4, 0x00100000u, 4);
  Reseal(past);
  EXPECT_EQ(ExerciseBytes(past), "adapter refused");
  // The 32-bit sum wraps this one back into the header, where it reads nonsense.
  std::string wrapped = Sample();
  PutLe(wrapped, 15 + 4, 0xFFFFFFF0u, 4);
  Reseal(wrapped);
  EXPECT_NE(ExerciseBytes(wrapped), "ok");
}

TEST(PackedFileHostile, HugeNameLengthAndDataFields) {
  std::string bytes = Sample();
  PutLe(bytes, RecordAt(bytes, 2) + 20, 65535, 2);  // the last record's name runs off the end
  Reseal(bytes);
  EXPECT_EQ(ExerciseBytes(bytes), "adapter refused");
  EXPECT_EQ(ExerciseLenient(bytes), "ok") << "a short name read just yields a shorter name";

  for (const std::uint64_t value : {0xFFFFFFFFFFFFFFFFull, 0x8000000000000000ull, 1ull << 40}) {
    std::string size = Sample();
    PutLe(size, RecordAt(size, 1), value, 8);
    Reseal(size);
    EXPECT_NE(ExerciseBytes(size), "ok") << value;
    EXPECT_EQ(ExerciseLenient(size), "Failed to create ReadableFile crc error") << value;

    std::string offset = Sample();
    PutLe(offset, RecordAt(offset, 1) + 8, value, 8);
    Reseal(offset);
    EXPECT_NE(ExerciseBytes(offset), "ok") << value;
    EXPECT_NE(ExerciseLenient(offset), "ok") << value;
  }
}

TEST(PackedFileHostile, RandomStructureDamageNeverEscapes) {
  // Mutations behind a valid body sum reach every field parser; anything other than the
  // two expected failure kinds escapes Exercise and fails the test.
  const std::string good = Sample();
  std::mt19937 random(20240611);
  const std::size_t structure_end = RecordAt(good, 2) + 22 + 6;
  std::map<std::string, int> outcomes;
  for (int round = 0; round < 3000; ++round) {
    std::string bytes = good;
    const int edits = 1 + static_cast<int>(random() % 4);
    for (int i = 0; i < edits; ++i) {
      bytes[11 + random() % (structure_end - 11)] = static_cast<char>(random());
    }
    Reseal(bytes);
    std::string outcome;
    EXPECT_NO_THROW(outcome = round % 2 ? ExerciseBytes(bytes) : ExerciseLenient(bytes))
        << "round " << round;
    ++outcomes[outcome];
  }
  // The damage reached several parsers, not one early check.
  EXPECT_GE(outcomes.size(), 4u);
}

}  // namespace
