// The host records filled from an engine verdict, and their text forms.
#include "services/anti_phishing/heuristic/source/verdict_records.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <new>

#include "host/allocator.h"

namespace cf::services::anti_phishing::heuristic {
namespace {

ap::easy2::EngineVerdict Engine(bool quiet, bool phishing, float weight, std::string target,
                                std::uint32_t stamp) {
  ap::easy2::EngineVerdict engine;
  engine.quiet = quiet;
  engine.phishing = phishing;
  engine.weight = weight;
  engine.target = std::move(target);
  engine.stampWords = {0, stamp, 0, 0};
  return engine;
}

TEST(VerdictRecords, VerdictNeverConfirms) {
  Verdict verdict{false, true};
  FillVerdict(Engine(false, true, 1.0f, "", 0), verdict);
  EXPECT_TRUE(verdict.phishingDetected);
  EXPECT_FALSE(verdict.confirmedVerdict);
  EXPECT_EQ(TextOf(verdict), "Verdict { phishingDetected = 1, confirmedVerdict = 0 }");
  FillVerdict(Engine(true, false, 0.0f, "", 0), verdict);
  EXPECT_EQ(TextOf(verdict), "Verdict { phishingDetected = 0, confirmedVerdict = 0 }");
}

TEST(VerdictRecords, HeuristicTextForms) {
  auto allocator = pelmix::host::Allocator::Create();
  const struct {
    ap::easy2::EngineVerdict engine;
    int level;
    const char* text;
  } rows[] = {
      {Engine(false, false, 0.0f, "", 0), 2,
       "Heuristic {, confidence = 1, weight = 0.000000, target = , dbstamp = 0 }"},
      {Engine(false, true, 0.5f, "PayPal|1 .5", 4294967295u), 1,
       "Heuristic {, confidence = 2, weight = 0.500000, target = PayPal|1 .5, "
       "dbstamp = 4294967295 }"},
      {Engine(false, true, 1.0f, "x|c", 20240611u), 3,
       "Heuristic {, confidence = 0, weight = 1.000000, target = x|c, dbstamp = 20240611 }"},
      // A quiet record writes nothing at all, whatever it holds.
      {Engine(true, true, 0.75f, "PayPal", 7), 2, ""},
  };
  for (const auto& row : rows) {
    HeuristicVerdictInfo info{};
    FillHeuristicVerdictInfo(row.engine, row.level, allocator.Get(), info);
    EXPECT_EQ(TextOf(info), row.text);
    EXPECT_EQ(info.quiet, row.engine.quiet);
    EXPECT_EQ(info.target.view(), row.engine.target);
    EXPECT_EQ(info.weight, static_cast<double>(row.engine.weight));
  }
}

TEST(VerdictRecords, WeightIsWrittenAsPrintfWouldInTheCLocale) {
  auto allocator = pelmix::host::Allocator::Create();
  for (const float weight : {0.1f, 0.5f, 0.0000005f, 1e30f, -0.0f, 3.4e38f, NAN, INFINITY}) {
    HeuristicVerdictInfo info{};
    FillHeuristicVerdictInfo(Engine(false, false, weight, "", 0), 2, allocator.Get(), info);
    char expected[400];
    std::snprintf(expected, sizeof expected, "%.6f", static_cast<double>(weight));
    EXPECT_EQ(TextOf(info), "Heuristic {, confidence = 1, weight = " + std::string(expected) +
                                ", target = , dbstamp = 0 }");
  }
}

TEST(VerdictRecords, StampTakesWordsOneAndTwo) {
  auto allocator = pelmix::host::Allocator::Create();
  ap::easy2::EngineVerdict engine = Engine(false, false, 0.0f, "", 0);
  engine.stampWords = {0xFFFFFFFFu, 0xFFFFFFFFu, 1, 0xFFFFFFFFu};
  HeuristicVerdictInfo info{};
  FillHeuristicVerdictInfo(engine, 2, allocator.Get(), info);
  EXPECT_EQ(info.dbstamp, 0x1FFFFFFFFll);
}

TEST(VerdictRecords, TargetIsByteExactAndReassignedInPlace) {
  auto allocator = pelmix::host::Allocator::Create();
  const std::string bytes("a\0b\xff|c", 6);
  {
    HeuristicVerdictInfo info{};
    FillHeuristicVerdictInfo(Engine(false, false, 0.0f, bytes, 0), 2, allocator.Get(), info);
    EXPECT_EQ(info.target.view(), bytes);
    EXPECT_EQ(allocator->LiveBlocks(), 1u);
    // Asked again into the same record: the old text goes back to the allocator.
    FillHeuristicVerdictInfo(Engine(false, false, 0.0f, "second", 0), 2, allocator.Get(), info);
    EXPECT_EQ(info.target.view(), "second");
    EXPECT_STREQ(info.target.c_str(), "second");
    EXPECT_EQ(allocator->LiveBlocks(), 1u);
  }
  EXPECT_EQ(allocator->LiveBlocks(), 0u);
}

TEST(VerdictRecords, InvalidLevelAndRefusedMemory) {
  auto allocator = pelmix::host::Allocator::Create();
  HeuristicVerdictInfo info{};
  EXPECT_THROW(FillHeuristicVerdictInfo(Engine(false, false, 0, "", 0), 4, allocator.Get(), info),
               std::runtime_error);
  allocator->SetRefuse(true);
  EXPECT_THROW(FillHeuristicVerdictInfo(Engine(false, false, 0, "t", 0), 2, allocator.Get(), info),
               std::bad_alloc);
  EXPECT_TRUE(info.target.empty());
}

}  // namespace
}  // namespace cf::services::anti_phishing::heuristic
