// The milter's message collector: the RFC 822 bytes it rebuilds from header fields and body
// chunks, whatever the chunking; the byte limit; the count of incoming verdict headers.
#include "tools/pelmix-milter/message_collector.h"

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

namespace {

using pelmix::milter::MessageCollector;

std::string Kept(const MessageCollector& c) { return std::string(c.message().bytes()); }

void AddHeaders(MessageCollector& c) {
  c.Header("From", "a@example.org");
  c.Header("Subject", "two\r\n\tlines");
  c.EndOfHeaders();
}

TEST(MilterMessageCollector, RebuildsTheMessageWithLfLineEnds) {
  MessageCollector c(1 << 20);
  AddHeaders(c);
  c.Body("line one\r\nline two\r\n\r\nlast\r\n");
  c.Finish();
  EXPECT_EQ(Kept(c), "From: a@example.org\nSubject: two\n\tlines\n\nline one\nline two\n\nlast\n");
  EXPECT_EQ(c.totalBytes(), c.message().size());
  EXPECT_FALSE(c.message().cut);
}

TEST(MilterMessageCollector, LoneCarriageReturnsStay) {
  MessageCollector c(1 << 20);
  AddHeaders(c);
  c.Body("a\rb\r\r\nc\r");
  c.Finish();
  const std::string kept = Kept(c);
  EXPECT_EQ(kept.substr(kept.find("\n\n") + 2), "a\rb\r\nc\r");
}

// The same body split into chunks at every place, and at random places, gives the same bytes:
// a CR at the end of one chunk and an LF at the start of the next are one line end.
TEST(MilterMessageCollector, ChunkingDoesNotChangeTheMessage) {
  const std::string body =
      "first\r\nsecond\r\r\n\r\nthird\rfourth\n\r\n\r\r\n<html>\r\n</html>\r\n\r";
  MessageCollector whole(1 << 20);
  AddHeaders(whole);
  whole.Body(body);
  whole.Finish();
  const std::string want = Kept(whole);

  for (std::size_t cut = 0; cut <= body.size(); ++cut) {
    MessageCollector c(1 << 20);
    AddHeaders(c);
    c.Body(body.substr(0, cut));
    c.Body(body.substr(cut));
    c.Finish();
    ASSERT_EQ(Kept(c), want) << "split at " << cut;
  }
  MessageCollector bytes(1 << 20);
  AddHeaders(bytes);
  for (const char b : body) bytes.Body(std::string(1, b));
  bytes.Finish();
  EXPECT_EQ(Kept(bytes), want);

  std::mt19937 random(19);
  for (int round = 0; round < 200; ++round) {
    MessageCollector c(1 << 20);
    AddHeaders(c);
    for (std::size_t at = 0; at < body.size();) {
      const std::size_t n = std::uniform_int_distribution<std::size_t>(0, 7)(random);
      c.Body(body.substr(at, n));
      at += n;
    }
    c.Finish();
    ASSERT_EQ(Kept(c), want) << "round " << round;
  }
}

// The limit holds whatever the chunking, the rest is counted, and the kept bytes are the
// start of what an unlimited collector keeps.
TEST(MilterMessageCollector, KeepsAtMostItsLimit) {
  std::string body;
  for (int i = 0; i < 500; ++i) body += "padding line " + std::to_string(i) + "\r\n";
  MessageCollector unlimited(1 << 20);
  AddHeaders(unlimited);
  unlimited.Body(body);
  unlimited.Finish();
  const std::string all = Kept(unlimited);

  for (const std::size_t max :
       {std::size_t{1}, std::size_t{20}, std::size_t{100}, std::size_t{4096}, all.size() - 1}) {
    for (const std::size_t chunk : {std::size_t{1}, std::size_t{7}, std::size_t{65535}}) {
      MessageCollector c(max);
      AddHeaders(c);
      for (std::size_t at = 0; at < body.size(); at += chunk) c.Body(body.substr(at, chunk));
      c.Finish();
      EXPECT_EQ(c.message().size(), max);
      EXPECT_TRUE(c.message().cut);
      EXPECT_EQ(c.totalBytes(), all.size());
      EXPECT_EQ(Kept(c), all.substr(0, max)) << max << " in chunks of " << chunk;
    }
  }
  MessageCollector exact(all.size());
  AddHeaders(exact);
  exact.Body(body);
  exact.Finish();
  EXPECT_FALSE(exact.message().cut);
  EXPECT_EQ(Kept(exact), all);
}

TEST(MilterMessageCollector, CountsIncomingVerdictHeadersInAnyCase) {
  MessageCollector c(1 << 20);
  c.Header("X-Pelmix-Verdict", "clean");
  c.Header("Subject", "X-Pelmix-Verdict: clean");
  c.Header("x-pelmix-VERDICT", "clean");
  c.Header("X-Pelmix-Verdicts", "clean");
  c.Header("X-Pelmix-Verdic", "clean");
  EXPECT_EQ(c.verdictHeaders(), 2u);
  // They stay in what is judged: they are part of the message as it came.
  EXPECT_NE(Kept(c).find("x-pelmix-VERDICT: clean\n"), std::string::npos);
}

TEST(MilterMessageCollector, TheBodyStartsTheBodyEvenWithoutEndOfHeaders) {
  MessageCollector c(1 << 20);
  c.Header("From", "a@example.org");
  c.Body("text\r\n");
  c.Header("Late", "field");  // after the body began: not part of the header
  c.EndOfHeaders();
  c.Finish();
  EXPECT_EQ(Kept(c), "From: a@example.org\n\ntext\n");
}

}  // namespace
