// What the milter does with each kind of judgement under each action and error policy, and
// how the verdict header is written.
#include "tools/pelmix-milter/decision.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using namespace pelmix::milter;
using pelmix::cli::Judgement;

Judgement Phishing(std::string target = "Netflix|1 .98") {
  Judgement j;
  j.phishing = true;
  j.weight = 0.999048;
  j.target = std::move(target);
  return j;
}

Options With(Action action, OnError onError = OnError::kAccept) {
  Options o;
  o.action = action;
  o.onError = onError;
  o.maxMessage = 4096;
  return o;
}

TEST(MilterDecision, CleanIsTaggedAndAcceptedWhateverTheAction) {
  for (const Action action : {Action::kTag, Action::kReject, Action::kQuarantine}) {
    const Decision d = Decide(Judgement{}, false, With(action));
    EXPECT_EQ(d.reply, Reply::kAccept);
    EXPECT_EQ(d.header, "clean");
    EXPECT_FALSE(d.quarantine);
    EXPECT_TRUE(d.judged);
    EXPECT_TRUE(d.reason.empty());
  }
}

TEST(MilterDecision, PhishingUnderEachAction) {
  const std::string header = "phishing; weight=0.999048; target=Netflix|1 .98";
  const Decision tag = Decide(Phishing(), false, With(Action::kTag));
  EXPECT_EQ(tag.reply, Reply::kAccept);
  EXPECT_EQ(tag.header, header);
  EXPECT_FALSE(tag.quarantine);
  EXPECT_EQ(tag.reason, "phishing, weight=0.999048; target=Netflix|1 .98");

  const Decision reject = Decide(Phishing(), false, With(Action::kReject));
  EXPECT_EQ(reject.reply, Reply::kReject);
  EXPECT_TRUE(reject.header.empty());

  const Decision quarantine = Decide(Phishing(), false, With(Action::kQuarantine));
  EXPECT_EQ(quarantine.reply, Reply::kAccept);
  EXPECT_TRUE(quarantine.quarantine);
  EXPECT_EQ(quarantine.header, header);
  EXPECT_FALSE(quarantine.reason.empty());
}

TEST(MilterDecision, AMessageCutShortIsNeverCalledClean) {
  const Decision clean = Decide(Judgement{}, true, With(Action::kReject));
  EXPECT_EQ(clean.reply, Reply::kAccept);
  EXPECT_EQ(clean.header, "unchecked; reason=too-large");
  EXPECT_FALSE(clean.judged);
  EXPECT_NE(clean.reason.find("4096"), std::string::npos);

  // Phishing in the part that was judged stands, and is acted upon.
  const Decision phishing = Decide(Phishing(), true, With(Action::kReject));
  EXPECT_EQ(phishing.reply, Reply::kReject);
  EXPECT_NE(phishing.reason.find("first 4096 bytes"), std::string::npos);
}

TEST(MilterDecision, AMessageNotJudgedFollowsTheErrorPolicy) {
  Judgement unreadable;
  unreadable.error = "unreadable message: no message header found";
  Judgement failed;
  failed.error = "GetVerdict: 0x80000040 (Unexpected)\r\nsecond line";

  const Decision a = Decide(unreadable, false, With(Action::kReject));
  EXPECT_EQ(a.reply, Reply::kAccept);
  EXPECT_EQ(a.header, "unchecked; reason=unreadable");
  EXPECT_FALSE(a.judged);
  const Decision b = Decide(failed, true, With(Action::kTag));
  EXPECT_EQ(b.header, "unchecked; reason=engine-error");
  // The reason goes to the log and the quarantine: one line.
  EXPECT_EQ(b.reason.find_first_of("\r\n"), std::string::npos);

  const Decision t = Decide(failed, false, With(Action::kTag, OnError::kTempfail));
  EXPECT_EQ(t.reply, Reply::kTempfail);
  EXPECT_TRUE(t.header.empty());
}

// The target comes from the knowledge base and the message: whatever its bytes, the header
// stays one line of printable ASCII that cannot add fields of its own.
TEST(MilterDecision, TheTargetCannotBreakTheHeader) {
  const std::string value =
      VerdictValue(Phishing("Bank\r\nX-Evil: 1; weight=0 \"100%\" \xD0\x91\t"));
  EXPECT_EQ(value,
            "phishing; weight=0.999048; target=Bank%0D%0AX-Evil: 1%3B weight=0 %22100%25%22 "
            "%D0%91%09");
  const std::string longest = VerdictValue(Phishing(std::string(10000, 'a')));
  EXPECT_EQ(longest.size(),
            std::string("phishing; weight=0.999048; target=").size() + kMaxTargetBytes);
  EXPECT_EQ(HeaderSafe("", 10), "");
}

}  // namespace
