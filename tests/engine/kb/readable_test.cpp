#include <gtest/gtest.h>

#include <sstream>

#include "engine/common/error.h"
#include "engine/kb/readable_buffer.h"
#include "engine/kb/readable_stream.h"
#include "engine/kb/readable_wtell.h"
#include "tests/support/kb_test_support.h"

namespace {

using pelmix::testing::ErrorOf;

TEST(ReadableBuffer, SeekAndReadOnTenBytes) {
  const char bytes[] = "0123456789";
  util::ReadableBuffer buffer(bytes, 10);
  char out[8] = {};
  EXPECT_EQ(buffer.file_size(), 10);
  EXPECT_EQ(buffer.file_seek(10), -1);
  EXPECT_EQ(buffer.file_seek(-1), -1);
  EXPECT_EQ(buffer.file_read(out, 3), 3) << "refused seeks keep the position at 0";
  EXPECT_EQ(std::string(out, 3), "012");
  EXPECT_EQ(buffer.file_seek(9), 9);
  EXPECT_EQ(buffer.file_read(out, 5), 1);
  EXPECT_EQ(out[0], '9');
  EXPECT_EQ(buffer.file_read(out, 5), 0);
  EXPECT_EQ(ErrorOf([] { util::ReadableBuffer none(nullptr, 4); }),
            "ReadableBuffer: inited with nullptr");
}

TEST(ReadableWTell, TracksThePositionOfTheWrappedFile) {
  EXPECT_EQ(ErrorOf([] { ap::ReadableWTell none(nullptr); }), "null readable for tell");
  const std::string bytes = "abcdefghij";
  auto buffer = std::make_shared<util::ReadableBuffer>(bytes.data(), 10);
  buffer->file_seek(5);
  ap::ReadableWTell tell(buffer);
  EXPECT_EQ(tell.tell(), 0) << "construction rewinds the wrapped file";
  char out[4];
  EXPECT_EQ(tell.file_read(out, 4), 4);
  EXPECT_EQ(tell.tell(), 4);
  EXPECT_EQ(tell.file_seek(20), -1);
  EXPECT_EQ(tell.tell(), 4) << "a refused seek moved neither the file nor the record";
  EXPECT_EQ(tell.file_read(out, 1), 1);
  EXPECT_EQ(out[0], 'e');
  EXPECT_EQ(tell.tell(), 5);
  EXPECT_EQ(tell.file_size(), 10);
}

std::shared_ptr<ap::ReadableFileI> Entry(const std::string& data) {
  return pelmix::testing::PackedOf({{"entry", data}})->open("entry");
}

std::string Lines(int count) {
  std::string text;
  for (int i = 0; i < count; ++i) text += "line " + std::to_string(i) + " of the entry\n";
  return text;
}

TEST(EntryTextStream, ReadsLinesAcrossBufferRefills) {
  const std::string text = Lines(1000);
  ASSERT_GT(text.size(), 3 * 4096u);
  ap::EntryTextStream stream(Entry(text));
  std::string line;
  std::string joined;
  while (std::getline(stream, line)) joined += line + "\n";
  EXPECT_EQ(joined, text);
  EXPECT_TRUE(stream.eof());
  EXPECT_FALSE(stream.bad());
}

TEST(EntryTextStream, PositionsFromStartCurrentAndEnd) {
  const std::string text = Lines(1000);  // several buffers
  ap::EntryTextStream stream(Entry(text));
  std::string word;
  stream >> word;
  EXPECT_EQ(word, "line");
  EXPECT_EQ(stream.tellg(), 4);

  stream.seekg(6000);
  EXPECT_EQ(stream.tellg(), 6000);
  EXPECT_EQ(stream.get(), text[6000]);
  stream.seekg(-10, std::ios_base::cur);  // inside the filled buffer
  EXPECT_EQ(stream.get(), text[5991]);
  stream.seekg(5000, std::ios_base::cur);  // beyond it
  EXPECT_EQ(stream.tellg(), 10992);
  EXPECT_EQ(stream.get(), text[10992]);
  stream.seekg(-3, std::ios_base::end);
  EXPECT_EQ(stream.get(), text[text.size() - 3]);

  stream.seekg(0, std::ios_base::end);  // the end itself is refused by the entry
  EXPECT_TRUE(stream.fail());
  stream.clear();
  stream.seekg(2, std::ios_base::beg);
  EXPECT_EQ(stream.get(), text[2]);
}

TEST(EntryTextStream, TellAtTheEndOfAWhollyBufferedEntry) {
  ap::EntryTextStream stream(Entry("12 34\n"));
  int a = 0, b = 0;
  stream >> a >> b;
  EXPECT_EQ(a, 12);
  EXPECT_EQ(b, 34);
  EXPECT_EQ(stream.tellg(), 5);
  std::string rest;
  std::getline(stream, rest);
  EXPECT_EQ(stream.tellg(), 6) << "asking the place must not seek the entry to its end";
  stream.seekg(-6, std::ios_base::cur);
  EXPECT_EQ(stream.get(), '1');
}

TEST(EntryTextStream, PutbackAreaHoldsFourAfterARefill) {
  const std::string text = Lines(300);
  ap::EntryTextStream stream(Entry(text));
  for (int i = 0; i < 4097; ++i) stream.get();  // the second fill keeps four old characters
  for (int i = 0; i < 5; ++i) ASSERT_TRUE(stream.unget()) << i;
  try {
    stream.unget();
    FAIL() << "a sixth step back must fail the stream";
  } catch (const std::ios_base::failure& e) {
    EXPECT_NE(std::string(e.what()).find("putback buffer full"), std::string::npos) << e.what();
  }
}

// An entry whose reads fail the way a broken host file would.
class FailingEntry final : public ap::ReadableFileI {
 public:
  explicit FailingEntry(bool raise) : raise_(raise) {}
  std::int64_t file_seek(std::int64_t position) override { return position; }
  std::int64_t file_size() override { return 100; }
  std::int64_t file_read(void*, std::uint64_t) override {
    if (raise_) ap::ThrowError("entry went away");
    return -1;
  }

 private:
  bool raise_;
};

TEST(EntryTextStream, ReadFaultsAreNotTakenForTheEnd) {
  ap::EntryTextStream raising(std::make_shared<FailingEntry>(true));
  std::string line;
  EXPECT_EQ(ErrorOf([&] { std::getline(raising, line); }), "entry went away");
  EXPECT_TRUE(raising.bad());

  ap::EntryTextStream failing(std::make_shared<FailingEntry>(false));
  EXPECT_THROW(std::getline(failing, line), std::ios_base::failure);
  EXPECT_TRUE(failing.bad());

  EXPECT_EQ(ErrorOf([] { ap::EntryTextStream none(nullptr); }), "null readable for tell");
}

}  // namespace
