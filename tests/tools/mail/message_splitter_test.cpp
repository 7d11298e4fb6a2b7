#include "tools/mail/message_splitter.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <random>
#include <string>
#include <vector>

#include "tests/tools/mail/mail_test_support.h"
#include "tests/tools/pelmix/cli_runner.h"
#include "tools/mail/message_reader.h"

namespace {

using pelmix::mail::MessageBuffer;
using pelmix::mail::MessageSplitter;

struct Split {
  std::string bytes;
  std::size_t index;
  std::uint64_t inputBytes;
  bool cut;
  bool operator==(const Split&) const = default;
};

std::ostream& operator<<(std::ostream& out, const Split& s) {
  return out << "#" << s.index << " " << s.inputBytes << (s.cut ? " cut " : " ") << s.bytes;
}

MessageSplitter::MessageFn Collect(std::vector<Split>& out) {
  return [&out](MessageBuffer& m) {
    out.push_back({std::string(m.bytes()), m.index, m.inputBytes, m.cut});
  };
}

// Feeds `input` in pieces of the given sizes (cycled), the rest in one piece.
std::vector<Split> SplitInPieces(MessageSplitter::Mode mode, std::string_view input,
                                 const std::vector<std::size_t>& sizes, std::size_t max) {
  std::vector<Split> out;
  MessageSplitter splitter(mode, Collect(out), max);
  std::size_t at = 0;
  for (std::size_t i = 0; at < input.size(); ++i) {
    const std::size_t n = sizes.empty() ? input.size() : sizes[i % sizes.size()];
    splitter.Feed(input.substr(at, n));
    at += n;
  }
  splitter.Finish();
  return out;
}

struct MboxCase {
  std::string input;
  std::vector<Split> messages;
  std::size_t max = 1 << 20;
};

const std::vector<MboxCase>& MboxCases() {
  static const std::vector<MboxCase> cases = {
      {"From a Sun\nA: 1\n\nx\n\nFrom b Mon\nB: 2\n\ny\n",
       {{"A: 1\n\nx\n", 1, 8, false}, {"B: 2\n\ny\n", 2, 8, false}}},
      // Quoted envelopes and "From" not at a line start stay in the message.
      {"From a\nA: 1\n\n>From x\nsaid From y\nFromage\nFrom\n",
       {{"A: 1\n\n>From x\nsaid From y\nFromage\nFrom\n", 1, 39, false}}},
      // CRLF lines; the blank line before the next envelope is the mbox's, not the message's.
      {"From a\r\nA: 1\r\n\r\nx\r\n\r\nFrom b\r\nB: 2\r\n",
       {{"A: 1\r\n\r\nx\r\n", 1, 11, false}, {"B: 2\r\n", 2, 6, false}}},
      // An envelope with nothing after it is an empty message; so is one at the very end.
      {"From a\nFrom b\nB: 1\nFrom c",
       {{"", 1, 0, false}, {"B: 1\n", 2, 5, false}, {"", 3, 0, false}}},
      // Text before the first envelope is a message of its own.
      {"X: 0\nFrom a\nA: 1\n", {{"X: 0\n", 1, 5, false}, {"A: 1\n", 2, 5, false}}},
      // A message over the budget keeps its head, counts all of it and ends at the next
      // envelope as usual.
      {"From a\n" + std::string(30, 'x') + "\nFrom b\nB: 1\n",
       {{std::string(16, 'x'), 1, 31, true}, {"B: 1\n", 2, 5, false}},
       16},
  };
  return cases;
}

TEST(MessageSplitter, MboxMessagesWholeByteByByteAndInRandomPieces) {
  std::mt19937 random(14);
  for (const MboxCase& c : MboxCases()) {
    EXPECT_EQ(SplitInPieces(MessageSplitter::Mode::kMbox, c.input, {}, c.max), c.messages)
        << c.input;
    EXPECT_EQ(SplitInPieces(MessageSplitter::Mode::kMbox, c.input, {1}, c.max), c.messages)
        << c.input;
    for (int round = 0; round < 20; ++round) {
      std::vector<std::size_t> sizes(8);
      for (std::size_t& size : sizes) size = 1 + random() % 7;
      EXPECT_EQ(SplitInPieces(MessageSplitter::Mode::kMbox, c.input, sizes, c.max), c.messages)
          << c.input;
    }
  }
}

TEST(MessageSplitter, CorpusMboxHasThreeMessages) {
  const std::string mbox = pelmix::mail_test::Corpus("three.mbox");
  const auto whole = SplitInPieces(MessageSplitter::Mode::kMbox, mbox, {}, 1 << 20);
  ASSERT_EQ(whole.size(), 3u);
  EXPECT_TRUE(whole[0].bytes.starts_with("From: first@example.org\n"));
  EXPECT_TRUE(whole[0].bytes.ends_with(">From the quoted line: http://first.example/\n"));
  EXPECT_TRUE(whole[1].bytes.ends_with("http://second.example/\r\n"));
  EXPECT_TRUE(whole[2].bytes.ends_with("Third body.\n"));
  EXPECT_EQ(SplitInPieces(MessageSplitter::Mode::kMbox, mbox, {1}, 1 << 20), whole);
  EXPECT_EQ(SplitInPieces(MessageSplitter::Mode::kMbox, mbox, {3, 17, 5, 64}, 1 << 20), whole);
}

TEST(MessageSplitter, SingleModeIsOneMessageEvenWhenEmpty) {
  const std::string input = "From: a\n\nFrom here on\nFrom b\n";
  const std::vector<Split> one = {{input, 1, input.size(), false}};
  EXPECT_EQ(SplitInPieces(MessageSplitter::Mode::kSingle, input, {}, 100), one);
  EXPECT_EQ(SplitInPieces(MessageSplitter::Mode::kSingle, input, {1}, 100), one);
  EXPECT_EQ(SplitInPieces(MessageSplitter::Mode::kSingle, "", {}, 100),
            (std::vector<Split>{{"", 1, 0, false}}));
  EXPECT_EQ(SplitInPieces(MessageSplitter::Mode::kSingle, input, {2}, 8),
            (std::vector<Split>{{input.substr(0, 8), 1, input.size(), true}}));
}

TEST(MessageSplitter, MessageBudgetHoldsForTheRealLimit) {
  // One byte over the real budget: the head is kept, the size is known, memory stays bounded.
  const std::size_t max = pelmix::mail::kMaxMessageBytes;
  std::size_t calls = 0;
  MessageSplitter splitter(MessageSplitter::Mode::kMbox, [&](MessageBuffer& m) {
    ++calls;
    EXPECT_EQ(m.size(), max);
    EXPECT_EQ(m.inputBytes, max + 1);
    EXPECT_TRUE(m.cut);
  });
  splitter.Feed("From a\n");
  const std::string block(1 << 20, 'x');
  for (std::size_t i = 0; i < max / block.size(); ++i) splitter.Feed(block);
  splitter.Feed("y");
  splitter.Finish();
  EXPECT_EQ(calls, 1u);
}

class MessageReader : public pelmix::testing::CliTest {};

TEST_F(MessageReader, ChoosesMboxByTheFirstLine) {
  struct Case {
    std::string input;
    bool mbox;
    std::size_t messages;
  };
  const Case cases[] = {
      {"From a\nA: 1\n\nFrom b\nB: 2\n", true, 2},
      {"From: a\nA: 1\n\nFrom b\nB: 2\n", false, 1},
      {"From", false, 1},
      {"", false, 1},
  };
  for (const Case& c : cases) {
    const std::string path = Write("input", c.input);
    const int fd = ::open(path.c_str(), O_RDONLY);
    ASSERT_GE(fd, 0);
    std::size_t seen = 0;
    const auto result = pelmix::mail::ReadMessages(fd, [&](MessageBuffer&) { ++seen; });
    ::close(fd);
    EXPECT_TRUE(result.ok);
    EXPECT_EQ(result.mbox, c.mbox) << c.input;
    EXPECT_EQ(result.messages, c.messages) << c.input;
    EXPECT_EQ(seen, c.messages) << c.input;
  }
}

TEST_F(MessageReader, ReportsAReadError) {
  const int fd = ::open(dir_.c_str(), O_RDONLY | O_DIRECTORY);  // read() gives EISDIR
  ASSERT_GE(fd, 0);
  std::size_t seen = 0;
  const auto result = pelmix::mail::ReadMessages(fd, [&](MessageBuffer&) { ++seen; });
  ::close(fd);
  EXPECT_EQ(seen, 0u);
  EXPECT_FALSE(result.ok);
  EXPECT_FALSE(result.error.empty());
}

}  // namespace
