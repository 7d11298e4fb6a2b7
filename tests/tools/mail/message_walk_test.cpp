#include "tools/mail/message_walk.h"

#include <gtest/gtest.h>

#include "tests/tools/mail/mail_test_support.h"

namespace {

using pelmix::mail::Limit;
using pelmix::mail::WalkMessage;
using pelmix::mail::WalkReport;
using pelmix::mail_test::Corpus;
using pelmix::mail_test::RecordingSink;

struct CorpusCase {
  const char* file;
  std::vector<std::string> events;
  std::vector<std::string_view> warnings;
};

// Names the case by its file in test listings.
void PrintTo(const CorpusCase& c, std::ostream* out) { *out << c.file; }

class CorpusWalk : public ::testing::TestWithParam<CorpusCase> {};

TEST_P(CorpusWalk, HandsOverWhatASessionTakes) {
  const CorpusCase& c = GetParam();
  RecordingSink sink;
  const WalkReport report = WalkMessage(Corpus(c.file), sink);
  EXPECT_TRUE(report.readable) << report.error;
  EXPECT_EQ(report.limits, 0u);
  EXPECT_EQ(sink.events, c.events);
  EXPECT_EQ(pelmix::mail::WarningNames(report.warnings), c.warnings);
}

INSTANTIATE_TEST_SUITE_P(
    Corpus, CorpusWalk,
    ::testing::Values(
        // Both alternatives are text; the plain one's links come once each, in order, with the
        // sentence's punctuation and the closing bracket left out.
        CorpusCase{"alternative.eml",
                   {"S0 Your account needs attention",
                    "T1 text/plain us-ascii | Dear customer,\n\nplease confirm your details at "
                    "https://secure-login.bank.example/verify?id=42.\nQuestions? See "
                    "www.bank.example/help (or HTTP://Bank.Example/faq).\nAgain: "
                    "https://secure-login.bank.example/verify?id=42\n",
                    "U https://secure-login.bank.example/verify?id=42",
                    "U http://www.bank.example/help", "U HTTP://Bank.Example/faq",
                    "T1 text/html us-ascii | <html><body><p>Dear customer,</p>\n<p>please <a "
                    "href=\"https://secure-login.bank.example/verify?id=42\">confirm your "
                    "details</a>.</p>\n</body></html>\n"},
                   {}},
        // multipart/mixed > related > alternative: an inline image without a name is only an
        // image, a named one is an attachment too, and a named text part is an attachment.
        CorpusCase{
            "nested.eml",
            {"S0 Nested parts", "T3 text/plain utf-8 | Plain body, see http://shop.example/offer",
             "U http://shop.example/offer",
             "T3 text/html utf-8 | <p>HTML body <img src=\"cid:logo@shop\"></p>", "I2 image/png 48",
             "A1 prices.csv|text/csv|19", "A1 photo.jpg|image/jpeg|8", "I1 image/jpeg 8"},
            {}},
        // The forwarded message is an attachment and is walked too; its links are new only when
        // the outer message has not given them already.
        CorpusCase{"forwarded.eml",
                   {"S0 Fwd: look at this",
                    "T1 text/plain | Bob, is this real? I got it from www.phish.example",
                    "U http://www.phish.example", "A1 original.eml|message/rfc822|416",
                    "S2 Verify your account \xE2\x80\x93 now",
                    "T3 text/plain utf-8 | Go to http://phish.example/login and www.phish.example "
                    "today.",
                    "U http://phish.example/login",
                    "T3 text/html utf-8 | <p>Log in at <a href=\"http://phish.example/login\">your "
                    "bank</a></p>"},
                   {}},
        // base64 and quoted-printable are decoded (a soft break inside a link joins it); an
        // unknown or missing charset leaves the bytes as they are.
        CorpusCase{
            "encodings.eml",
            {"S0 Encodings",
             "T1 text/plain UTF-8 | Gr\xC3\xBC\xC3\x9F"
             "e aus K\xC3\xB6ln: https://k\xC3\xB6ln.example/stra\xC3\x9F"
             "e\n",
             "U https://k\xC3\xB6ln.example/stra\xC3\x9F"
             "e",
             "T1 text/plain utf-8 | Caf\xC3\xA9 open at https://cafe.example/a-very-long-path/"
             "that/gets/split/by/the/quoted/printable/encoder/into/two/lines?x=1\n",
             "U https://cafe.example/a-very-long-path/that/gets/split/by/the/quoted/"
             "printable/encoder/into/two/lines?x=1",
             "T1 text/plain x-no-such-charset | Unknown charset: caf\xE9",
             "T1 text/plain | Undeclared: caf\xE9"},
            {}},
        // Adjacent encoded words in two charsets join without the blank between them.
        CorpusCase{"subject-two-charsets.eml",
                   {"S0 \xD0\xA1\xD1\x87\xD1\x91\xD1\x82"
                    "f\xC3\xBCr M\xC3\xA4rz paid",
                    "T0 text/plain us-ascii | Body.\n"},
                   {}},
        CorpusCase{"latin1-html.eml",
                   {"S0 Caf\xC3\xA9",
                    "T0 text/html ISO-8859-1>utf8 | <html><head><title>Caf\xC3\xA9</title></head>"
                    "<body><p>Bienvenue \xC3\xA0 la caf\xC3\xA9t\xC3\xA9ria. Connectez-vous <a "
                    "href=\"http://cafe.example/\">ici</a>.</p></body></html>\n"},
                   {}},
        CorpusCase{"rfc2231.eml",
                   {"S0 Invoice", "T1 text/plain | See the attachment.",
                    "A1 Rechnung f\xC3\xBCr M\xC3\xA4rz.exe|application/octet-stream|32"},
                   {}},
        CorpusCase{"pdf-attachment.eml",
                   {"S0 Your invoice", "T1 text/plain us-ascii | Please find the invoice attached.",
                    "A1 invoice.pdf|application/pdf|207"},
                   {}},
        // Cut inside a base64 attachment with no closing boundary: what arrived is handed on.
        CorpusCase{"truncated.eml",
                   {"S0 Truncated", "T1 text/plain | Visit https://cut.example/ before it is gone.",
                    "U https://cut.example/", "A1 cut.pdf|application/pdf|39"},
                   {"truncated message"}}),
    [](const ::testing::TestParamInfo<CorpusCase>& info) {
      std::string name = info.param.file;
      for (char& c : name) {
        if (!std::isalnum(static_cast<unsigned char>(c))) c = '_';
      }
      return name;
    });

TEST(MessageWalk, AttachmentDataIsTransferDecoded) {
  RecordingSink sink;
  WalkMessage(Corpus("pdf-attachment.eml"), sink);
  ASSERT_EQ(sink.attachments.size(), 1u);
  EXPECT_TRUE(sink.attachments[0].starts_with("%PDF-1.4\n1 0 obj"));
  EXPECT_TRUE(sink.attachments[0].ends_with("%%EOF\n"));

  RecordingSink rfc2231;
  WalkMessage(Corpus("rfc2231.eml"), rfc2231);
  ASSERT_EQ(rfc2231.attachments.size(), 1u);
  EXPECT_TRUE(rfc2231.attachments[0].starts_with("MZ\x90"));
}

TEST(MessageWalk, UnreadableInputsAreReportedNotWalked) {
  struct Case {
    std::string bytes;
    const char* error;
  };
  const Case cases[] = {
      {Corpus("garbage.bin"), "no message header found"},
      {"", "empty message"},
      {"just a line of prose, no header\n\nmore\n", "no message header found"},
  };
  for (const Case& c : cases) {
    RecordingSink sink;
    const WalkReport report = WalkMessage(c.bytes, sink);
    EXPECT_FALSE(report.readable);
    EXPECT_EQ(report.error, c.error);
    EXPECT_TRUE(sink.events.empty());
  }
}

TEST(MessageWalk, HeaderOnlyAndBareMessages) {
  struct Case {
    std::string message;
    std::vector<std::string> events;
  };
  const Case cases[] = {
      // No Content-Type: plain text; no Subject header: no subject event.
      {"From: a@example.org\n\nhi www.x.example\n",
       {"T0 text/plain | hi www.x.example\n", "U http://www.x.example"}},
      {"Subject: only headers\n", {"S0 only headers", "T0 text/plain | "}},
      // A disposition of attachment without a name is still an attachment, never text.
      {"Content-Type: text/plain\nContent-Disposition: attachment\n\nhttp://x.example/\n",
       {"A0 |text/plain|18"}},
      // Upper-case types are folded; parameters never reach the type.
      {"Content-Type: Text/HTML; charset=\"utf-8\"; format=flowed\n\n<b>x</b>",
       {"T0 text/html utf-8 | <b>x</b>"}},
      // Raw 8-bit subject bytes: UTF-8 when they are, else windows-1252.
      {"Subject: caf\xE9 \x80\n\n", {"S0 caf\xC3\xA9 \xE2\x82\xAC", "T0 text/plain | "}},
      {"Subject: caf\xC3\xA9\n\n", {"S0 caf\xC3\xA9", "T0 text/plain | "}},
      // Applications without a name and multipart preambles are nobody's business.
      {"Content-Type: multipart/mixed; boundary=b\n\npreamble http://pre.example/\n--b\n"
       "Content-Type: application/octet-stream\n\nxx\n--b--\nepilogue\n",
       {}},
  };
  for (const Case& c : cases) {
    RecordingSink sink;
    const WalkReport report = WalkMessage(c.message, sink);
    EXPECT_TRUE(report.readable) << c.message;
    EXPECT_EQ(sink.events, c.events) << c.message;
  }
}

TEST(MessageWalk, CharsetConversions) {
  struct Case {
    const char* charset;
    std::string body;
    std::string text;  // what the sink gets
  };
  const Case cases[] = {
      {"windows-1252", "\x80 \x93q\x94", "\xE2\x82\xAC \xE2\x80\x9Cq\xE2\x80\x9D"},
      {"koi8-r", "\xF0\xD2\xC9\xD7\xC5\xD4", "\xD0\x9F\xD1\x80\xD0\xB8\xD0\xB2\xD0\xB5\xD1\x82"},
      {"utf-16le", std::string("h\0i\0", 4), "hi"},
      {"latin1", "\xE9", "\xC3\xA9"},
      // Declared UTF-8 or ASCII are passed as they are, even when the bytes disagree.
      {"us-ascii", "caf\xE9", "caf\xE9"},
      {"UTF-8", "caf\xE9", "caf\xE9"},
  };
  for (const Case& c : cases) {
    RecordingSink sink;
    WalkMessage("Content-Type: text/plain; charset=" + std::string(c.charset) + "\n\n" + c.body,
                sink);
    ASSERT_EQ(sink.events.size(), 1u) << c.charset;
    const std::string& event = sink.events[0];
    EXPECT_EQ(event.substr(event.find(" | ") + 3), c.text) << c.charset;
  }
}

TEST(MessageWalk, LinksComeOnlyFromPlainText) {
  RecordingSink sink;
  WalkMessage(
      "Content-Type: multipart/mixed; boundary=b\n\n--b\nContent-Type: text/html\n\n"
      "<a href=\"http://html.example/\">http://html-text.example/</a>\n--b\n"
      "Content-Type: text/enriched\n\nhttp://enriched.example/\n--b\n"
      "Content-Type: text/plain\nContent-Disposition: attachment; filename=a.txt\n\n"
      "http://attached.example/\n--b\nContent-Type: text/plain\n\nhttp://plain.example/\n--b--\n",
      sink);
  std::vector<std::string> urls;
  for (const std::string& event : sink.events) {
    if (event.starts_with("U ")) urls.push_back(event);
  }
  EXPECT_EQ(urls, std::vector<std::string>{"U http://plain.example/"});
}

}  // namespace
