#include "engine/pdf/scan.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <random>

#include "engine/pdf/memory_file.h"
#include "tests/engine/pdf/pdf_test_support.h"

namespace {

using pdf_test::ContentObject;
using pdf_test::Deflate;
using pdf_test::Object;
using pdf_test::StreamObject;
using pdf_test::TextLog;
using ::testing::ElementsAre;

// Reads at most `step` bytes at a time (1 + a seeded draw below `step` when `seed` is set),
// fails every read from `failAt` on, or claims one byte more than it was asked for.
class AwkwardFile : public ap::ReadableFileI {
 public:
  AwkwardFile(std::string_view bytes, std::size_t step, unsigned seed = 0)
      : bytes_(bytes), step_(step), random_(seed), seeded_(seed != 0) {}
  std::size_t failAt = SIZE_MAX;
  bool overclaim = false;

  std::int64_t file_seek(std::int64_t) override { return -1; }
  std::int64_t file_size() override { return -1; }
  std::int64_t file_read(void* buffer, std::uint64_t count) override {
    if (position_ >= failAt) return -1;
    std::size_t n = seeded_ ? 1 + random_() % step_ : step_;
    n = std::min(
        {n, static_cast<std::size_t>(count), bytes_.size() - position_, failAt - position_});
    std::memcpy(buffer, bytes_.data() + position_, n);
    position_ += n;
    return static_cast<std::int64_t>(overclaim ? count + 1 : n);
  }

 private:
  std::string_view bytes_;
  std::size_t position_ = 0;
  std::size_t step_;
  std::mt19937 random_;
  bool seeded_;
};

std::vector<std::string> Scan(ap::ReadableFileI& file) {
  TextLog log;
  pdf::Scan(file, log);
  return log.events;
}

std::vector<std::string> Scan(std::string_view bytes) {
  pdf::MemoryFile file(bytes);
  return Scan(file);
}

std::string Page(std::string_view text) {
  return "BT\n/F1 12 Tf\n72 700 Td\n(" + std::string(text) + ") Tj\nET\n";
}

// A linearised file: the first page's cross-reference section and trailer, full of
// references and "n" entries, come before the page and its content.
std::string Linearised() {
  std::string doc = "%PDF-1.5\n%\xE2\xE3\xCF\xD3\n";
  doc += Object(10, "<< /Linearized 1 /L 5000 /H [ 600 150 ] /O 12 /E 4000 /N 1 /T 4800 >>");
  doc +=
      "xref\n10 5\n0000000015 00000 n \n0000000120 00000 n\r\n0000000200 00000 n \n"
      "trailer\n<< /Size 15 /Root 11 0 R /Info 9 0 R /ID [<ab><ab>] /Prev 4700 >>\n"
      "startxref\n0\n%%EOF\n";
  doc += Object(11, "<< /Type /Catalog /Pages 1 0 R >>");
  doc += Object(12, "<< /Type /Page /Contents 13 0 R /Annots [14 0 R] >>");
  doc += ContentObject(13, Page("Sign in to your account"));
  doc += Object(14, "<< /Type /Annot /Subtype /Link /A << /S /URI /URI (http://p.example/) >> >>");
  return doc + "xref\n0 10\n0000000000 65535 f \ntrailer << /Size 10 >>\nstartxref\n120\n%%EOF\n";
}

TEST(PdfScan, RealWorldShapes) {
  EXPECT_THAT(Scan(Linearised()),
              ElementsAre("text:Sign in to your account", "link:http://p.example/"));

  // Links packed into a compressed object stream.
  const std::string objects =
      "14 0 15 48 << /Type /Annot /Subtype /Link /A 15 0 R >>\n"
      "<< /S /URI /URI (http://packed.example/) >>";
  EXPECT_THAT(
      Scan(StreamObject(5, "/Type /ObjStm /N 2 /First 12 /Filter /FlateDecode", Deflate(objects))),
      ElementsAre("link:http://packed.example/"));

  // Text shown by operators that share a line is not seen.
  EXPECT_THAT(Scan(ContentObject(4, "BT /F1 24 Tf 100 700 Td (Hidden) Tj ET\n" + Page("Shown"))),
              ElementsAre("text:Shown"));

  // A file cut off in the middle of a stream: what inflates is still read.
  std::string drawing;
  for (int i = 0; i < 2000; ++i) drawing += std::to_string(i * 7919 % 10007) + " 0 l\n";
  const std::string full =
      ContentObject(1, Page("First")) + ContentObject(2, Page("Second") + drawing);
  EXPECT_THAT(Scan(std::string_view(full).substr(0, full.size() / 2 + 100)),
              ElementsAre("text:First", "text:Second"));
}

TEST(PdfScan, ReadsOfAnySizeGiveTheSameResult) {
  std::string doc = Linearised();
  for (int i = 0; i < 30; ++i) doc += ContentObject(20 + i, Page("Page " + std::to_string(i)));
  const std::vector<std::string> whole = Scan(doc);
  ASSERT_EQ(whole.size(), 32u);
  AwkwardFile bytes(doc, 1);
  EXPECT_EQ(Scan(bytes), whole);
  for (unsigned seed = 1; seed <= 5; ++seed) {
    AwkwardFile pieces(doc, 1500, seed);
    EXPECT_EQ(Scan(pieces), whole);
  }
}

TEST(PdfScan, ReadFailuresEndTheData) {
  const std::string doc = Linearised();
  const std::size_t cut = doc.find("/URI (");
  AwkwardFile failing(doc, 7);
  failing.failAt = cut;
  EXPECT_THAT(Scan(failing), ElementsAre("text:Sign in to your account"));
  // A reader that claims more than it was asked for is not trusted any further.
  AwkwardFile lying(doc, 1000);
  lying.overclaim = true;
  EXPECT_THAT(Scan(lying), ::testing::IsEmpty());
}

}  // namespace
