// The engine's trace gate: a severity nobody wants costs a look at a bit mask. The logger is
// not asked, no line is composed and nothing after the `<<` is evaluated.
#include "engine/common/trace.h"

#include <gtest/gtest.h>

#include <memory>
#include <ostream>
#include <set>
#include <string>
#include <vector>

#include "engine/html/decrunch.h"
#include "tests/engine/html/decrunch_test_support.h"

namespace {

// A logger that wants the severities it is told to (any severity beyond the engine's three
// counts as kSeverityOther). Counts how often it is asked.
class LevelLogger : public ap::TraceLoggerI {
 public:
  void Log(const std::string& text, int) override { lines.push_back(text); }
  bool IsEnabled(int severity) override {
    ++asked;
    const bool engine = severity >= ap::kSeverityMessage && severity <= ap::kSeverityError;
    return wanted.count(engine ? severity : ap::kSeverityOther) != 0;
  }
  std::set<int> wanted;
  std::vector<std::string> lines;
  std::size_t asked = 0;
};

// Something whose printing can be seen.
struct Probe {
  int* printed;
};
std::ostream& operator<<(std::ostream& out, const Probe& probe) {
  ++*probe.printed;
  return out << "probe";
}

class TraceGate : public ::testing::Test {
 protected:
  void SetUp() override { previous_ = ap::EngineLogger(); }
  void TearDown() override { ap::SetEngineLogger(previous_); }
  std::shared_ptr<ap::TraceLoggerI> previous_;
};

TEST_F(TraceGate, AnUnwantedSeverityBuildsNoLine) {
  auto logger = std::make_shared<LevelLogger>();
  logger->wanted = {ap::kSeverityError};
  ap::SetEngineLogger(logger);
  const std::size_t askedAtInstall = logger->asked;
  int printed = 0;
  int evaluated = 0;
  for (int i = 0; i < 1000; ++i) {
    AP_TRACE(ap::kSeverityMessage) << Probe{&printed} << ++evaluated;
    AP_TRACE(7) << Probe{&printed};
  }
  EXPECT_EQ(printed, 0);
  EXPECT_EQ(evaluated, 0);
  EXPECT_EQ(logger->asked, askedAtInstall);  // not even the logger was asked
  EXPECT_TRUE(logger->lines.empty());
  // A wanted severity is confirmed with the logger and written.
  AP_TRACE(ap::kSeverityError) << Probe{&printed} << " " << 2;
  EXPECT_EQ(printed, 1);
  EXPECT_EQ(logger->lines, std::vector<std::string>{"probe 2"});
}

TEST_F(TraceGate, NoLoggerAndTheNullLoggerWantNothing) {
  int printed = 0;
  ap::SetEngineLogger(nullptr);
  AP_TRACE(ap::kSeverityError) << Probe{&printed};
  ap::TraceRecord record(ap::kSeverityError);
  EXPECT_FALSE(record.Enabled());
  EXPECT_EQ(printed, 0);
}

// Raising the level is heard at the next document; lowering it is obeyed at once, because a
// wanted severity is asked of the logger again before its line is built.
TEST_F(TraceGate, LevelChangesAreHeard) {
  auto logger = std::make_shared<LevelLogger>();
  ap::SetEngineLogger(logger);
  AP_TRACE(ap::kSeverityMessage) << "before";
  logger->wanted = {ap::kSeverityMessage};
  AP_TRACE(ap::kSeverityMessage) << "not yet";
  {
    decrunch_test::Recorder receiver;
    html::Decrunch page(receiver, false);  // a new document asks again
  }
  AP_TRACE(ap::kSeverityMessage) << "heard";
  logger->wanted.clear();
  AP_TRACE(ap::kSeverityMessage) << "lowered";
  EXPECT_EQ(logger->lines, std::vector<std::string>{"heard"});
  logger->wanted = {ap::kSeverityOther};
  ap::RefreshEngineTraceLevels();
  AP_TRACE(-1) << "other";
  AP_TRACE(ap::kSeverityWarning) << "warning";
  EXPECT_EQ(logger->lines, (std::vector<std::string>{"heard", "other"}));
}

}  // namespace
