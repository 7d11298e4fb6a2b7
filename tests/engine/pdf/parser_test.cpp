#include "engine/pdf/parser.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <random>

#include "engine/pdf/memory_file.h"
#include "engine/pdf/scan.h"
#include "tests/engine/pdf/pdf_test_support.h"

namespace {

using pdf_test::EventLog;
using pdf_test::Object;
using pdf_test::StreamObject;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

std::vector<std::string> Parse(std::string_view bytes, bool finish = false) {
  EventLog log;
  pdf::Parser parser(log);
  parser.feed(bytes);
  if (finish) parser.finish();
  return log.events;
}

TEST(PdfParser, ImageStreamObject) {
  EXPECT_THAT(Parse("12 0 obj\r\n<< /Subtype /Image /Length 5 >>\r\nstream\r\nABCDE\r\n"
                    "endstream\r\nendobj"),
              ElementsAre("obj 12 0", "stream image", "data:ABCDE\r\n", "endstream", "endobj"));
  // "stream" ends its line with CR LF or LF, never with CR alone or anything else.
  EXPECT_THAT(Parse("12 0 obj\n<< /Length 5 >>\nstream\nAB\rE\nendstream\nendobj"),
              ElementsAre("obj 12 0", "stream", "data:AB\rE\n", "endstream", "endobj"));
  EXPECT_THAT(Parse("1 0 obj <<>>stream\rAB\nendstream endobj 2 0 obj <<>>stream ABC endobj"),
              ElementsAre("obj 1 0", "endobj", "obj 2 0", "endobj"));
}

TEST(PdfParser, ImageFlagNeedsExactNamePair) {
  const auto image = [](std::string_view dict) {
    const std::vector<std::string> events =
        Parse("1 0 obj " + std::string(dict) + "\r\nstream\r\nX\r\nendstream endobj");
    return events.size() > 1 && events[1] == "stream image";
  };
  EXPECT_TRUE(image("<</Subtype/Image/Width 3>>"));
  EXPECT_FALSE(image("<</Subtype/Image>>"));  // the value reads "Image>>"
  EXPECT_FALSE(image("<< /Subtype /Images >>"));
  EXPECT_FALSE(image("<< /Width 3 /Subtype /Image >>"));  // a number ends the scan
  // White space between a key and its value is skipped, however much there is.
  EXPECT_TRUE(image("<< /Subtype  /Image /W 1 >>"));
  EXPECT_TRUE(image("<< /Subtype\r\n/Image\r\n/W 1 >>"));
}

TEST(PdfParser, UriStrings) {
  EXPECT_THAT(Parse("3 0 obj << /S /URI /URI (http://a.example/x) >> endobj"),
              ElementsAre("obj 3 0", "link:http://a.example/x", "endobj"));
  // After a reference, the next string of the object is taken; empty strings are dropped.
  EXPECT_THAT(Parse("3 0 obj << /URI 7 0 R /X (x) /URI () /URI (y) >> endobj"),
              ElementsAre("obj 3 0", "link:x", "link:y", "endobj"));
  // No escape processing: the first ")" ends the link.
  EXPECT_THAT(Parse("3 0 obj << /URI (a\\)b) >> endobj"),
              ElementsAre("obj 3 0", "link:a\\", "endobj"));
}

TEST(PdfParser, ObjectHeaders) {
  EXPECT_THAT(Parse("1  0 obj << >> endobj"), IsEmpty());
  EXPECT_THAT(Parse("% 1 0 obj\n2 0 obj 5 endobj"), ElementsAre("obj 2 0", "endobj"));
  EXPECT_THAT(Parse("4294967297 4294967298 obj 5 endobj"), ElementsAre("obj 1 2", "endobj"));
  EXPECT_THAT(Parse("1 0 objx 2 0 obj"), ElementsAre("obj 1 0"));
  // References and cross-reference entries outside objects do not stop the scan.
  EXPECT_THAT(Parse("xref\n0 2\n0000000000 65535 f \n0000000017 00000 n\r\n"
                    "trailer << /Root 1 0 R >>\n3 0 obj << /URI (u) >> endobj"),
              ElementsAre("obj 3 0", "link:u", "endobj"));
}

TEST(PdfParser, KeywordLookalikesInsideStreams) {
  const std::string data = "xendoby endstreaX eendobj";
  EXPECT_THAT(Parse(StreamObject(1, "", "e endstrea endo") + StreamObject(2, "", data)),
              ElementsAre("obj 1 0", "stream", "data:e endstrea endo\r\n", "endstream", "endobj",
                          "obj 2 0", "stream", "data:xendoby endstreaX e", "endstream", "endobj"));
}

TEST(PdfParser, ObjectEndResetsTheDictionaryScan) {
  // An image stream object must not pass its flag on, and a stream object whose dictionary
  // scan ended must not hide the next object's dictionary.
  EXPECT_THAT(Parse(StreamObject(1, "/Subtype /Image", "I") + StreamObject(2, "", "C") +
                    StreamObject(3, "/N 1", "D") + StreamObject(4, "/Subtype /Image", "J")),
              ElementsAre("obj 1 0", "stream image", "data:I\r\n", "endstream", "endobj", "obj 2 0",
                          "stream", "data:C\r\n", "endstream", "endobj", "obj 3 0", "stream",
                          "data:D\r\n", "endstream", "endobj", "obj 4 0", "stream image",
                          "data:J\r\n", "endstream", "endobj"));
  // "endobj" inside a stream ends both.
  EXPECT_THAT(Parse("1 0 obj <<>>\r\nstream\r\nABendobj"),
              ElementsAre("obj 1 0", "stream", "data:AB", "endstream", "endobj"));
}

TEST(PdfParser, EndOfDataClosesWhatIsOpen) {
  const std::string cut = "1 0 obj << /L 3 >>\r\nstream\r\nABCend";
  EXPECT_THAT(Parse(cut), ElementsAre("obj 1 0", "stream"));
  EXPECT_THAT(Parse(cut, true),
              ElementsAre("obj 1 0", "stream", "data:ABCend", "endstream", "endobj"));
  EXPECT_THAT(Parse("2 0 obj << /URI (http://cut", true),
              ElementsAre("obj 2 0", "link:http://cut", "endobj"));
  EXPECT_THAT(Parse("2 0 ob", true), IsEmpty());
}

// Objects with every kind of event, comments, references and keyword fragments.
std::string MixedObjects() {
  std::string doc = "%PDF-1.7\n%\xE2\xE3\xCF\xD3\n";
  doc += Object(1, "<< /Type /Catalog /Pages 2 0 R /URI (http://one.example/) >>");
  doc += StreamObject(2, "/Subtype /Image /Width 2",
                      std::string("\0\xFF"
                                  "endob\r\n",
                                  9));
  doc += StreamObject(3, "/Filter /FlateDecode", "endstrea(m) /URI (not a link)");
  doc += Object(4, "[ 1 2 /URI (ignored) ]");
  doc += "xref\n0 5\n0000000000 65535 f \r\ntrailer\n<< /Size 5 /Root 1 0 R >>\n%%EOF\n";
  return doc + Object(5, "<< /A << /S /URI /URI (http://two.example/?q=(1) >> >>");
}

std::vector<std::string> ParseInChunks(std::string_view doc, std::size_t maxChunk, unsigned seed) {
  EventLog log;
  pdf::Parser parser(log);
  std::mt19937 random(seed);
  while (!doc.empty()) {
    const std::size_t n = std::min<std::size_t>(doc.size(), 1 + random() % maxChunk);
    parser.feed(doc.substr(0, n));
    doc.remove_prefix(n);
  }
  parser.finish();
  return log.events;
}

TEST(PdfParser, ChunkInvariance) {
  const std::string doc = MixedObjects() + "6 0 obj << /URI (http://cut";
  const std::vector<std::string> whole = Parse(doc, true);
  ASSERT_EQ(whole.size(), 21u);
  EXPECT_THAT(std::vector(whole.begin() + 13, whole.end()),
              ElementsAre("obj 4 0", "endobj", "obj 5 0", "link:http://two.example/?q=(1", "endobj",
                          "obj 6 0", "link:http://cut", "endobj"));

  EXPECT_EQ(ParseInChunks(doc, 1, 0), whole);
  for (unsigned seed = 1; seed <= 20; ++seed) EXPECT_EQ(ParseInChunks(doc, 17, seed), whole);

  // The scan entry's 1000-byte blocks, on a document long enough to need several.
  std::string big;
  for (int i = 0; i < 40; ++i) big += MixedObjects();
  pdf::MemoryFile file(big);
  EventLog log;
  pdf::Parser parser(log);
  pdf::FeedFile(file, parser);
  EXPECT_EQ(log.events, Parse(big, true));
  EXPECT_EQ(log.events, ParseInChunks(big, 3000, 7));
}

// Hostile runs are fed in 1 MB pieces, 100 times, so the test itself stays small.
void FeedRun(pdf::Parser& parser, char c, std::size_t megabytes = 100) {
  const std::string piece(1 << 20, c);
  for (std::size_t i = 0; i < megabytes; ++i) parser.feed(piece);
}

TEST(PdfParser, HostileRunsCostNoMemory) {
  EventLog log;
  pdf::Parser parser(log);
  FeedRun(parser, '0');  // a 100 MB object number: its value is still read
  parser.feed("7 0 obj << /");
  FeedRun(parser, 'A');  // a 100 MB key, cut to a name that matches nothing
  parser.feed("/Image /Subtype /Image");
  FeedRun(parser, 'x');  // a 100 MB value: "Imagexxx..." must not read as "Image"
  parser.feed(" >>\r\nstream\r\n.\r\nendstream endobj ");
  parser.feed("8 0 obj << /URI (");
  FeedRun(parser, 'u');  // a string that never ends
  parser.finish();
  EXPECT_THAT(log.events,
              ElementsAre("obj 7 0", "stream", "data:.\r\n", "endstream", "endobj", "obj 8 0",
                          "link:" + std::string(pdf::kMaxLinkLength, 'u'), "endobj"));
}

}  // namespace
