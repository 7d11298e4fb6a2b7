#include "engine/html/data_url_machine.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/engine/html/scan_test_support.h"

namespace {

using html_test::DecodeDataUrl;

TEST(DataUrl, Base64PageIsDecoded) {
  const auto page = DecodeDataUrl(
      "data:text/html;base64,PGh0bWw+PGJvZHk+PGEgaHJlZj0iaHR0cDovL3gudGVzdC8iPmhp\r\n"
      "PC9hPjwvYm9keT48L2h0bWw+==");
  EXPECT_EQ(page.bytes, "<html><body><a href=\"http://x.test/\">hi</a></body></html>");
  EXPECT_EQ(page.mediaType, "text/html");
  EXPECT_EQ(page.errors, 0u);
  EXPECT_EQ(DecodeDataUrl("data:;base64,AP+AYWI=").bytes, std::string("\x00\xff\x80"
                                                                      "ab",
                                                                      5));
}

TEST(DataUrl, OtherwisePercentDecoded) {
  EXPECT_EQ(DecodeDataUrl("data:text/html;charset=utf-8,%3Cb%3e%20x% y%%41").bytes, "<b> x% y%%41");
  // Only hexadecimal digits make a byte; anything else passes through as written.
  EXPECT_EQ(DecodeDataUrl("data:,%zz%4g%g4").bytes, "%zz%4g%g4");
  EXPECT_EQ(DecodeDataUrl("data:,%4").bytes, "");  // a pending escape at the end
  EXPECT_EQ(DecodeDataUrl("data:text/plain;x=base64,QQ==").bytes, "QQ==");
}

TEST(DataUrl, MediaType) {
  EXPECT_EQ(DecodeDataUrl("data:,x").mediaType, "text/plain");
  EXPECT_EQ(DecodeDataUrl("data:;base64,QQ==").mediaType, "text/plain");
  EXPECT_EQ(DecodeDataUrl("data:text/html,x").mediaType, "text/html");
  EXPECT_EQ(DecodeDataUrl("data:image/png;a=b;base64,QQ==").mediaType, "image/png");
  EXPECT_EQ(DecodeDataUrl("data:base64,QQ==").mediaType, "text/plain");
}

TEST(DataUrl, NotADataUrlYieldsNothing) {
  const auto upper = DecodeDataUrl("DATA:text/html,<b>");
  EXPECT_EQ(upper.bytes, "");
  EXPECT_EQ(upper.errors, 18u);  // every byte: the scheme never starts
  EXPECT_EQ(upper.mediaType, "text/plain");
  const auto http = DecodeDataUrl("http://x.test/");
  EXPECT_EQ(http.bytes, "");
  EXPECT_EQ(http.errors, 14u);
}

TEST(DataUrl, JunkBeforeTheSchemeIsSkipped) {
  const auto quoted = DecodeDataUrl("'data:,%41'");
  EXPECT_EQ(quoted.bytes, "A'");
  EXPECT_EQ(quoted.errors, 1u);
  html_test::ByteRecorder recorder;
  utils::DataUrlMachine decoder(recorder);
  try {
    decoder.feed(std::uint8_t{'x'});
    FAIL() << "no error";
  } catch (const ap::Error& e) {
    EXPECT_STREQ(e.what(), utils::DataUrlMachine::kHeaderError);
  }
}

TEST(DataUrl, OverLongHeaderTokensAreCut) {
  const std::string token(5000, 'a');
  const auto cut = DecodeDataUrl("data:" + token + ";base64,QQ==");
  EXPECT_EQ(cut.mediaType, std::string(utils::kMaxDataUrlHeaderToken, 'a'));
  EXPECT_EQ(cut.bytes, "A");
  // A cut token can never pass for "base64".
  EXPECT_EQ(DecodeDataUrl("data:" + token + "base64,QQ==").bytes, "QQ==");
}

// A restarted machine reads the next URL exactly as a new one would, whatever state the last
// URL left it in: mid-escape, mid-base64, in the header, or rejecting junk.
TEST(DataUrl, RestartIsANewMachine) {
  const std::vector<std::string> urls = {"data:text/html;base64,PGI+eDwvYj4=",
                                         "data:image/png,%4",
                                         "data:text/html;charset",
                                         "http://x.test/",
                                         "data:;base64,QUJD",
                                         "data:,%41%zz",
                                         "da",
                                         "data:text/html,<b>x</b>"};
  html_test::ByteRecorder reused;
  utils::DataUrlMachine machine(reused);
  for (const std::string& first : urls) {
    for (const std::string& second : urls) {
      machine.restart();
      machine.offer(first.data(), first.size());
      machine.restart();
      reused.bytes.clear();
      const std::size_t rejected = machine.offer(second.data(), second.size());
      html_test::ByteRecorder fresh;
      utils::DataUrlMachine expected(fresh);
      EXPECT_EQ(rejected, expected.offer(second.data(), second.size())) << first << " | " << second;
      EXPECT_EQ(reused.bytes, fresh.bytes) << first << " | " << second;
      EXPECT_EQ(machine.mediaType(), expected.mediaType()) << first << " | " << second;
      EXPECT_EQ(machine.rejected(), expected.rejected()) << first << " | " << second;
      EXPECT_EQ(machine.inHeader(), expected.inHeader()) << first << " | " << second;
    }
  }
  // Starting over takes nothing more from the heap once the first block is there.
  const std::size_t blocks = machine.arena().heapAllocations();
  for (int i = 0; i < 1000; ++i) {
    machine.restart();
    machine.offer("data:,x", 7);
  }
  EXPECT_EQ(machine.arena().heapAllocations(), blocks);
}

}  // namespace
