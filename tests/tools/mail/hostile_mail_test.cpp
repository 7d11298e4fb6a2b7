// Every budget of the mail walk, reached with hostile messages: the walk must end with the
// budget named in its report, hand over what came before it, and never fail the message.
#include <gtest/gtest.h>

#include <string>

#include "tests/tools/mail/mail_test_support.h"
#include "tools/mail/message_walk.h"
#include "tools/mail/structure_budget.h"

namespace {

using pelmix::mail::Limit;
using pelmix::mail::MailLimits;
using pelmix::mail::MeasureStructure;
using pelmix::mail::WalkMessage;
using pelmix::mail::WalkReport;
using pelmix::mail_test::RecordingSink;

std::string Repeat(std::string_view piece, std::size_t n) {
  std::string out;
  out.reserve(piece.size() * n);
  for (std::size_t i = 0; i < n; ++i) out.append(piece);
  return out;
}

std::size_t Count(const RecordingSink& sink, char kind) {
  std::size_t n = 0;
  for (const std::string& event : sink.events) n += event[0] == kind;
  return n;
}

struct StructureCase {
  const char* what;
  std::string message;
  std::size_t MailLimits::*budget;  // shrunk to 3 (the other budgets stay as they are)
  Limit limit;
  std::size_t cutAt;  // expected length parsed
};

TEST(StructureBudget, CutsAtTheLineWhereABudgetRunsOut) {
  const StructureCase cases[] = {
      {"header lines", "A: 1\nB: 2\nC: 3\nD: 4\n\nbody\n", &MailLimits::maxHeaderLines,
       Limit::kHeaderLines, 15},
      {"continuations count", "A: 1\n 2\n\t3\n 4\n", &MailLimits::maxHeaderLines,
       Limit::kHeaderLines, 11},
      {"header bytes", "A:\nB: 2\n", &MailLimits::maxHeaderBytes, Limit::kHeaderBytes, 3},
      {"parameters", "C-T: a/b; a=1; b=2\nC-D: x; c=3; d=4\n", &MailLimits::maxHeaderParams,
       Limit::kHeaderParams, 19},
      {"delimiters",
       "Content-Type: multipart/mixed; boundary=b\n\n--b\nX: 1\n\n--b\n\n--b\n\n--b--\n",
       &MailLimits::maxDelimiterLines, Limit::kDelimiterLines, 63},
      // A boundary declared on a continuation line, quoted, with a blank in it.
      {"folded boundary",
       "Content-Type: multipart/mixed;\n boundary=\"b b\"\n\n--b b\n\n--b b\n\n--b b\n\n--b b--\n",
       &MailLimits::maxDelimiterLines, Limit::kDelimiterLines, 69},
      // Headers of an embedded message start after the blank line of its part.
      {"embedded headers", "Content-Type: message/rfc822\n\nB: 2\nC: 3\nD: 4\n",
       &MailLimits::maxHeaderLines, Limit::kHeaderLines, 40},
      // Part headers follow a delimiter.
      {"part headers", "Content-Type: multipart/mixed; boundary=q\n\n--q\nA: 1\nB: 2\nC: 3\n",
       &MailLimits::maxHeaderLines, Limit::kHeaderLines, 57},
  };
  for (const StructureCase& c : cases) {
    MailLimits limits;
    limits.*c.budget = 3;
    const auto cut = MeasureStructure(c.message, limits);
    EXPECT_EQ(cut.limit, pelmix::mail::Bit(c.limit)) << c.what;
    EXPECT_EQ(cut.length, c.cutAt) << c.what;
  }
  // Body text is not structure: "key: value" lines and "--" lines in a body, and after a
  // closing delimiter, do not count.
  MailLimits small;
  small.maxHeaderLines = 3;
  small.maxHeaderParams = 3;
  small.maxDelimiterLines = 2;
  const std::string bodies[] = {
      "A: 1\n\nx: 1\ny: 2\nz: 3\nw: 4\n--a\n--b\n" + Repeat("QUJD;REVG:\n", 10),
      "A: 1\n\nDear customer: hello\n\nx: 1\ny: 2\nz: 3\nw: 4\n",
      "Content-Type: multipart/mixed; boundary=q\n\n--q\n\nx: 1\ny: 2\nz: 3\nw: 4\n--q--\n"
      "a: 1\nb: 2\n--q-x\n",
  };
  for (const std::string& body : bodies) {
    const auto cut = MeasureStructure(body, small);
    EXPECT_EQ(cut.limit, 0u) << body;
    EXPECT_EQ(cut.length, body.size()) << body;
  }
  // A boundary too long to remember makes every "--" line count.
  const std::string longBoundary =
      "Content-Type: multipart/mixed; boundary=" + std::string(300, 'L') +
      "\n\n--x\n\n--y\n\n--z\n";
  EXPECT_EQ(MeasureStructure(longBoundary, small).limit, pelmix::mail::Bit(Limit::kDelimiterLines));
}

// Text that only looks like structure cannot make the budget cut off what follows it.
TEST(HostileMail, LookalikeStructureInABodyHidesNothing) {
  const std::string tail = "\nthe end: http://tail.example/\n";
  const std::string messages[] = {
      "Subject: x\n\nhttp:" + std::string(3 << 20, 'q') + tail,
      "Subject: x\n\n" + Repeat("a: b;c;d\n", 30000) + tail,
      "Subject: x\n\n" + Repeat("--x\na: b\n", 30000) + tail,
      "Content-Type: multipart/mixed; boundary=q\n\n--q\n\n" + Repeat("--z\nk: v\n", 30000) + tail +
          "--q--\n",
  };
  for (const std::string& message : messages) {
    RecordingSink sink;
    const WalkReport report = WalkMessage(message, sink);
    EXPECT_EQ(report.limits, 0u) << message.substr(0, 80);
    ASSERT_FALSE(sink.events.empty());
    EXPECT_EQ(sink.events.back(), "U http://tail.example/") << message.substr(0, 80);
  }
}

// Messages that would make GMime build millions of objects are cut before it parses them;
// the real budgets apply.
TEST(HostileMail, StructureFloodsAreCutBeforeParsing) {
  struct Case {
    const char* what;
    std::string message;
    Limit limit;
  };
  const Case cases[] = {
      {"header lines", Repeat("a:\n", 1000000) + "\nbody\n", Limit::kHeaderLines},
      // The flood sits in the second header line, so the first one is still walked.
      {"parameters", "Subject: x\nContent-Type: text/plain" + Repeat(";a=b", 30000) + "\n\nbody\n",
       Limit::kHeaderParams},
      {"header bytes", "Subject: x\nX-Big: " + std::string(3 << 20, 's') + "\n\nbody\n",
       Limit::kHeaderBytes},
      {"parts", "Content-Type: multipart/mixed; boundary=b\n\n" + Repeat("--b\n\n", 1000000),
       Limit::kDelimiterLines},
  };
  for (const Case& c : cases) {
    RecordingSink sink;
    const WalkReport report = WalkMessage(c.message, sink);
    EXPECT_TRUE(report.hit(c.limit)) << c.what;
    EXPECT_LT(report.bytes, c.message.size()) << c.what;
    EXPECT_TRUE(report.readable) << c.what;
  }
  // A first header line over the budget leaves nothing to read, and says why.
  RecordingSink sink;
  const WalkReport report = WalkMessage("Subject: " + std::string(3 << 20, 's') + "\n", sink);
  EXPECT_FALSE(report.readable);
  EXPECT_EQ(report.error, "the first header line is over the structure budget");
  EXPECT_TRUE(report.hit(Limit::kHeaderBytes));
}

TEST(HostileMail, PartsBeyondTheBudgetAreNotWalked) {
  const std::size_t n = pelmix::mail::kMaxParts + 50;
  std::string message = "Content-Type: multipart/mixed; boundary=b\n\n";
  for (std::size_t i = 0; i < n; ++i)
    message += "--b\nContent-Type: text/plain\n\np" + std::to_string(i) + "\n";
  message += "--b--\n";
  RecordingSink sink;
  const WalkReport report = WalkMessage(message, sink);
  EXPECT_TRUE(report.hit(Limit::kParts));
  EXPECT_EQ(report.parts, pelmix::mail::kMaxParts);
  // The multipart itself is one of the objects.
  EXPECT_EQ(Count(sink, 'T'), pelmix::mail::kMaxParts - 1);
  EXPECT_EQ(sink.events.back(), "T1 text/plain | p" + std::to_string(pelmix::mail::kMaxParts - 2));
}

TEST(HostileMail, NestingBeyondTheBudgetIsSkipped) {
  // Multiparts nested one level deeper than allowed, each with a text part of its own.
  const int levels = pelmix::mail::kMaxDepth + 3;
  std::string message;
  for (int i = 0; i < levels; ++i) {
    message += "Content-Type: multipart/mixed; boundary=b" + std::to_string(i) + "\n\n--b" +
               std::to_string(i) + "\nContent-Type: text/plain\n\nlevel " + std::to_string(i) +
               "\n--b" + std::to_string(i) + "\n";
  }
  message += "Content-Type: text/plain\n\ninnermost\n";
  RecordingSink sink;
  const WalkReport report = WalkMessage(message, sink);
  EXPECT_TRUE(report.hit(Limit::kDepth));
  // Text parts sit one level below their multipart: levels 0 .. kMaxDepth - 1 are reached.
  EXPECT_EQ(Count(sink, 'T'), static_cast<std::size_t>(pelmix::mail::kMaxDepth));
  EXPECT_EQ(sink.events.back(), "T" + std::to_string(pelmix::mail::kMaxDepth) +
                                    " text/plain | level " +
                                    std::to_string(pelmix::mail::kMaxDepth - 1));
}

TEST(HostileMail, EmbeddedMessagesNestWithinTheDepthBudget) {
  std::string message;
  for (int i = 0; i < 40; ++i)
    message += "Subject: s" + std::to_string(i) + "\nContent-Type: message/rfc822\n\n";
  message += "Subject: last\n\nbody\n";
  RecordingSink sink;
  const WalkReport report = WalkMessage(message, sink);
  EXPECT_TRUE(report.hit(Limit::kDepth));
  EXPECT_EQ(Count(sink, 'S'), static_cast<std::size_t>(pelmix::mail::kMaxDepth + 1));
  EXPECT_EQ(Count(sink, 'T'), 0u);
}

TEST(HostileMail, PartDataIsCutAtTheBudget) {
  MailLimits limits;
  limits.maxPartBytes = 1000;
  struct Case {
    std::string message;
    std::string event;
  };
  const Case cases[] = {
      {"Content-Type: text/plain\n\n" + std::string(1001, 'x'),
       "T0 text/plain cut | " + std::string(1000, 'x')},
      {"Content-Type: text/plain\n\n" + std::string(1000, 'x'),
       "T0 text/plain | " + std::string(1000, 'x')},
      // Conversion doubles Latin-1 letters: the budget applies to what is handed over.
      {"Content-Type: text/plain; charset=latin1\n\n" + std::string(600, '\xE9'),
       "T0 text/plain latin1>utf8 cut | " + Repeat("\xC3\xA9", 500)},
      {"Content-Type: application/pdf; name=a.pdf\nContent-Transfer-Encoding: base64\n\n" +
           Repeat("QUJD", 400),
       "A0 a.pdf|application/pdf|1000 cut"},
  };
  for (const Case& c : cases) {
    RecordingSink sink;
    const WalkReport report = WalkMessage(c.message, sink, limits);
    ASSERT_EQ(sink.events.size(), 1u);
    EXPECT_EQ(sink.events[0], c.event);
    EXPECT_EQ(report.hit(Limit::kPartSize), c.event.find(" cut") != std::string::npos);
  }
}

TEST(HostileMail, SubjectIsCutOnACharacterBoundary) {
  const std::size_t max = pelmix::mail::kMaxSubjectBytes;
  // An odd number of ASCII bytes, then two-byte letters: the cut may not split one.
  const std::string subject = "x" + Repeat("\xC3\xA9", max);
  RecordingSink sink;
  const WalkReport report = WalkMessage("Subject: " + subject + "\n\n", sink);
  EXPECT_TRUE(report.hit(Limit::kSubjectSize));
  ASSERT_FALSE(sink.events.empty());
  EXPECT_EQ(sink.events[0], "S0 " + subject.substr(0, max - 1));
}

TEST(HostileMail, LinksPerMessageAndLinkLength) {
  const std::size_t max = pelmix::mail::kMaxLinksPerMessage;
  std::string body;
  for (std::size_t i = 0; i < max + 10; ++i) body += "http://h" + std::to_string(i) + ".example/\n";
  // Two long links alike in their first kMaxLinkBytes bytes are one link.
  const std::string longLink =
      "http://long.example/" + std::string(pelmix::mail::kMaxLinkBytes, 'p');
  RecordingSink sink;
  const WalkReport report =
      WalkMessage("Content-Type: text/plain\n\n" + longLink + "a " + longLink + "b\n" + body, sink);
  EXPECT_TRUE(report.hit(Limit::kLinks));
  EXPECT_TRUE(report.hit(Limit::kLinkSize));
  EXPECT_EQ(report.links, max);
  ASSERT_EQ(Count(sink, 'U'), max);
  EXPECT_EQ(sink.events[1], "U " + longLink.substr(0, pelmix::mail::kMaxLinkBytes));
  EXPECT_EQ(sink.events.back(), "U http://h" + std::to_string(max - 2) + ".example/");
}

TEST(HostileMail, MessageOverTheBudgetIsWalkedFromItsHead) {
  MailLimits limits;
  limits.maxMessageBytes = 64;
  RecordingSink sink;
  const WalkReport report =
      WalkMessage("Subject: big\n\nhttp://head.example/ " + std::string(1000, 'z'), sink, limits);
  EXPECT_TRUE(report.hit(Limit::kMessageSize));
  EXPECT_EQ(report.bytes, 64u);
  EXPECT_EQ(sink.events.back(), "U http://head.example/");
}

}  // namespace
