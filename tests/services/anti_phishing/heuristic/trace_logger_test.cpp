// The engine logger slot and its connection to the host tracer.
#include "services/anti_phishing/heuristic/source/trace_logger.h"

#include <gtest/gtest.h>

#include <stdexcept>

#include "engine/checkers/null_logger.h"
#include "engine/common/trace.h"
#include "framework/uvo/exception.h"
#include "host/host.h"
#include "services/anti_phishing/heuristic/source/tracer_holder.h"

namespace {

using cf::services::ApTraceLogger;
using cf::services::anti_phishing::heuristic::TracerHolder;

TEST(ApTraceLogger, EnabledByTheTracersLevel) {
  pelmix::host::Host host(700);
  ApTraceLogger logger(host.tracer.Get());
  EXPECT_TRUE(logger.IsEnabled(0));   // 700
  EXPECT_FALSE(logger.IsEnabled(2));  // 800
  EXPECT_TRUE(logger.IsEnabled(1));   // 500
  EXPECT_TRUE(logger.IsEnabled(7));   // 300
  host.tracer->SetTraceLevel(299);
  EXPECT_FALSE(logger.IsEnabled(7));
}

TEST(ApTraceLogger, WithoutLevelSourceNothingIsEnabled) {
  pelmix::host::Host host(1000);
  host.tracer->SetOfferLevelSource(false);
  ApTraceLogger logger(host.tracer.Get());
  EXPECT_FALSE(logger.IsEnabled(0));
  EXPECT_FALSE(logger.IsEnabled(-1));
  // Log still writes: the level decides only whether the engine composes a message.
  logger.Log("direct", 2);
  ASSERT_EQ(host.tracer->Lines().size(), 1u);
  EXPECT_EQ(host.tracer->Lines()[0].level, 800);
}

TEST(ApTraceLogger, NullTracer) {
  try {
    ApTraceLogger logger(nullptr);
    FAIL();
  } catch (const std::invalid_argument& e) {
    EXPECT_STREQ(e.what(), "TraceLogger::TraceLogger: tracer is null");
  }
}

TEST(TracerHolder, ConnectsTheEngineSlotWhileAlive) {
  pelmix::host::Host host(700);
  {
    std::shared_ptr<TracerHolder> first = TracerHolder::Acquire(host.tracer.Get());
    pelmix::host::Host other(700);
    // A second acquisition shares the live holder, whatever tracer it offers.
    std::shared_ptr<TracerHolder> second = TracerHolder::Acquire(other.tracer.Get());
    EXPECT_EQ(first, second);
    AP_TRACE(ap::kSeverityMessage) << "loaded " << 3 << " entries";
    AP_TRACE(ap::kSeverityError) << "not at level 700";
    EXPECT_TRUE(other.tracer->Lines().empty());
  }
  ASSERT_EQ(host.tracer->Texts(), std::vector<std::string>{"loaded 3 entries"});
  // With the last holder gone the slot holds a NullLogger: traces go nowhere.
  ASSERT_TRUE(ap::EngineLogger());
  EXPECT_FALSE(ap::EngineLogger()->IsEnabled(7));
  AP_TRACE(ap::kSeverityMessage) << "lost";
  EXPECT_EQ(host.tracer->Lines().size(), 1u);
}

TEST(TracerHolder, NullTracerFailsTheCheck) {
  EXPECT_THROW(TracerHolder::Acquire(nullptr), uvo::CheckFailedException);
}

TEST(EngineTrace, RecordKeepsItsLoggerAcrossAReplacement) {
  pelmix::host::Host host(700);
  ap::SetEngineLogger(std::make_shared<ApTraceLogger>(host.tracer.Get()));
  {
    ap::TraceRecord record(ap::kSeverityMessage);
    ASSERT_TRUE(record.Enabled());
    record.Stream() << "kept";
    ap::SetEngineLogger(std::make_shared<trace_impl::NullLogger>());
  }
  EXPECT_EQ(host.tracer->Texts(), std::vector<std::string>{"kept"});
}

}  // namespace
