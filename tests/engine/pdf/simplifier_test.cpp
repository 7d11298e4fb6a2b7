#include "engine/pdf/simplifier.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <random>

#include "tests/engine/pdf/pdf_test_support.h"

namespace {

using pdf_strs::InflateResult;
using pdf_test::Deflate;
using pdf_test::TextLog;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

std::vector<std::string> Text(std::string_view content) {
  TextLog log;
  pdf_strs::ExtractText(content, log);
  return log.events;
}

std::vector<std::string> Links(std::string_view data) {
  TextLog log;
  pdf_strs::ExtractLinks(data, log);
  return log.events;
}

// One stream through the simplifier, as the parser would report it.
std::vector<std::string> Stream(std::string_view raw, bool image = false) {
  TextLog log;
  pdf_strs::Simplifier simplifier(log);
  simplifier.streamBegin(image);
  for (const char c : raw) simplifier.streamByte(c);
  simplifier.streamEnd();
  return log.events;
}

// zlib data of `parts` in order, ended by `flush`; repeat > 1 repeats the middle part.
std::string DeflateParts(std::vector<std::string_view> parts, int flush, std::size_t repeat = 1) {
  z_stream z{};
  deflateInit(&z, Z_BEST_COMPRESSION);
  std::string out;
  char window[1 << 16];
  const auto put = [&](std::string_view data, int mode) {
    z.next_in = reinterpret_cast<Bytef*>(const_cast<char*>(data.data()));
    z.avail_in = static_cast<uInt>(data.size());
    do {
      z.next_out = reinterpret_cast<Bytef*>(window);
      z.avail_out = sizeof window;
      deflate(&z, mode);
      out.append(window, sizeof window - z.avail_out);
    } while (z.avail_out == 0);
  };
  for (std::size_t i = 0; i < parts.size(); ++i) {
    const bool middle = parts.size() == 3 && i == 1;
    for (std::size_t r = 0; r < (middle ? repeat : 1); ++r) put(parts[i], Z_NO_FLUSH);
  }
  put("", flush);
  deflateEnd(&z);
  return out;
}

// Highly compressible data: `prefix`, `megabytes` MB of spaces, `suffix`.
std::string Bomb(std::string_view prefix, std::size_t megabytes, std::string_view suffix) {
  const std::string spaces(1 << 20, ' ');
  return DeflateParts({prefix, spaces, suffix}, Z_FINISH, megabytes);
}

TEST(PdfSimplifier, Decompress) {
  std::string out;
  EXPECT_EQ(pdf_strs::Decompress("", 100, out), InflateResult::kEmpty);
  EXPECT_EQ(out, "");
  EXPECT_EQ(pdf_strs::Decompress("BT (x) Tj ET", 100, out), InflateResult::kError);
  EXPECT_EQ(out, "err");

  std::string text;
  for (int i = 0; i < 5000; ++i) text += "line " + std::to_string(i) + "\n";
  const std::string packed = Deflate(text);
  EXPECT_EQ(pdf_strs::Decompress(packed + "\r\n", 1 << 20, out), InflateResult::kDone);
  EXPECT_EQ(out, text);
  // Data cut short gives what it held; a limit gives exactly that much.
  pdf_strs::Decompress(packed.substr(0, packed.size() / 2), 1 << 20, out);
  EXPECT_GT(out.size(), text.size() / 4);
  EXPECT_EQ(out, text.substr(0, out.size()));
  EXPECT_EQ(pdf_strs::Decompress(packed, 20000, out), InflateResult::kLimit);
  EXPECT_EQ(out, text.substr(0, 20000));
  // A bad block after good ones keeps everything before it, also from the last window.
  const std::string corrupt = DeflateParts({text}, Z_FULL_FLUSH) + "\x07";
  EXPECT_EQ(pdf_strs::Decompress(corrupt, 1 << 20, out), InflateResult::kError);
  EXPECT_EQ(out, text);
}

TEST(PdfSimplifier, TextOperatorsAtLineEnds) {
  EXPECT_THAT(Text("BT\n/F1 12 Tf\n72 712 Td\n(Hello) Tj\nET\n(Outside) Tj"),
              ElementsAre("text:Hello"));
  // TJ strings keep their escapes; "\\)" is an escaped backslash and then the end.
  EXPECT_THAT(Text("  BT\r\n[(A) -120 (B\\)x) 5(C)]TJ \r\n[(D\\\\) (E\\() ] TJ\r\nET"),
              ElementsAre("text:A", "text:B\\)x", "text:C", "text:D\\\\", "text:E\\("));
  // Tj takes the first string only, with no escapes; empty strings are sent.
  EXPECT_THAT(Text("BT\n(a\\) b) (c) Tj\n() Tj\n[(ok) (cut] TJ\n(x) TJ junk\nET"),
              ElementsAre("text:a\\", "text:", "text:ok"));
  // Operators that do not end their line are not seen.
  EXPECT_THAT(Text("BT /F1 12 Tf (Hi) Tj ET\nq BT\n(One) Tj (Two) Tj\nET"),
              ElementsAre("text:One"));
}

TEST(PdfSimplifier, LinkSearch) {
  EXPECT_THAT(Links("<</S/URI/URI(http://a/)>> /URI \r\n (b) /URI 5 0 R /URI(c)/URI"),
              ElementsAre("link:http://a/", "link:b", "link:c"));
  EXPECT_THAT(Links("/URI (open"), IsEmpty());
  const std::string longLink = "/URI (" + std::string(pdf::kMaxLinkLength + 10, 'h') + ")";
  EXPECT_THAT(Links(longLink), ElementsAre("link:" + std::string(pdf::kMaxLinkLength, 'h')));
}

TEST(PdfSimplifier, Streams) {
  const std::string content = "BT\n(Hello) Tj\nET\n<< /URI (http://x.example/) >>\n";
  // Texts of a stream come before its links.
  EXPECT_THAT(Stream(Deflate(content) + "\r\n"),
              ElementsAre("text:Hello", "link:http://x.example/"));
  EXPECT_THAT(Stream(content), IsEmpty());                 // not compressed
  EXPECT_THAT(Stream(Deflate(content), true), IsEmpty());  // an image is never read
  std::string drawing;
  for (int i = 0; i < 3000; ++i) drawing += std::to_string(i * 7919 % 10007) + " 0 l\n";
  const std::string packed = Deflate(content + drawing);
  EXPECT_THAT(Stream(packed.substr(0, packed.size() / 2)),
              ElementsAre("text:Hello", "link:http://x.example/"));
}

TEST(PdfSimplifier, DecompressionBombStopsAtTheLimitAndKeepsWhatItGot) {
  const std::size_t megabytes = 2 * pdf_strs::kMaxInflatedBytes >> 20;
  const std::string bomb =
      Bomb("BT\n(Seen) Tj\nET\n/URI (http://early/)", megabytes, "/URI (http://late/)");
  ASSERT_LT(bomb.size(), pdf_strs::kMaxInflatedBytes / 256);
  EXPECT_THAT(Stream(bomb), ElementsAre("text:Seen", "link:http://early/"));
}

TEST(PdfSimplifier, InflationBudgetOfAScan) {
  const std::string bomb = Bomb("", pdf_strs::kMaxInflatedBytes >> 20, "");
  const std::string page = Deflate("BT\n(Page) Tj\nET");
  TextLog log;
  pdf_strs::Simplifier simplifier(log);
  const auto stream = [&](std::string_view raw) {
    simplifier.streamBegin(false);
    for (const char c : raw) simplifier.streamByte(c);
    simplifier.streamEnd();
  };
  stream(page);
  const std::size_t bombs = pdf_strs::kMaxInflatedBytesPerScan / pdf_strs::kMaxInflatedBytes;
  for (std::size_t i = 0; i + 1 < bombs; ++i) stream(bomb);
  stream(page);  // the budget still holds a page's worth
  for (int i = 0; i < 2; ++i) stream(bomb);
  stream(page);  // spent: no longer inflated
  EXPECT_THAT(log.events, ElementsAre("text:Page", "text:Page"));
}

TEST(PdfSimplifier, OversizedStreamIsReadAsFarAsItIsKept) {
  std::mt19937 random(1);
  std::string noise(pdf_strs::kMaxStreamBytes + (1 << 20), '\0');
  for (char& c : noise) c = static_cast<char>(random() % 255 + 1);
  std::replace(noise.begin(), noise.end(), '\n', ' ');
  const std::string raw = Deflate("BT\n(First) Tj\nET\n" + noise + "\nBT\n(Last) Tj\nET\n");
  ASSERT_GT(raw.size(), pdf_strs::kMaxStreamBytes);
  EXPECT_THAT(Stream(raw), ElementsAre("text:First"));
}

}  // namespace
