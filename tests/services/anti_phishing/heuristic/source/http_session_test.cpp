// The web session over a stand-in checker: creation checks, parameters, appending, verdict
// records and their trace lines.
#include "services/anti_phishing/heuristic/source/http_session.h"

#include <gtest/gtest.h>

#include "framework/uvo/exception.h"
#include "framework/uvo/result.h"
#include "host/external_data_source.h"
#include "host/host.h"
#include "tests/support/fake_web_checker.h"

namespace cf::services::anti_phishing::heuristic {
namespace {

using pelmix::testing::FakeWebChecker;

constexpr char kPrefix[] = "http session 41\t";
constexpr char kGetVerdict[] = "cf::services::anti_phishing::heuristic::HttpSession::GetVerdict";
constexpr char kGetInfo[] =
    "cf::services::anti_phishing::heuristic::HttpSession::GetHeuristicVerdictInfo";

class HttpSessionTest : public ::testing::Test {
 protected:
  uvo::Ptr<HttpSession> Make(int level = 2, const SessionParamList* params = nullptr,
                             IHttpExternalDataSource* source = nullptr) {
    SessionSettings settings{level};
    return uvo::Ptr<HttpSession>::Adopt(HttpSession::Create(host_.locator.Get(), kPrefix, checker_,
                                                            settings, params, holder_, source));
  }

  pelmix::host::Host host_;
  std::shared_ptr<TracerHolder> holder_ = TracerHolder::Acquire(host_.tracer.Get());
  std::shared_ptr<FakeWebChecker> checker_ = std::make_shared<FakeWebChecker>();
};

TEST_F(HttpSessionTest, CreationChecksAndParameters) {
  SessionSettings settings{2};
  EXPECT_THROW(HttpSession::Create(nullptr, kPrefix, checker_, settings, nullptr, holder_),
               uvo::CheckFailedException);
  EXPECT_THROW(HttpSession::Create(host_.locator.Get(), "", checker_, settings, nullptr, holder_),
               uvo::CheckFailedException);
  EXPECT_THROW(
      HttpSession::Create(host_.locator.Get(), kPrefix, nullptr, settings, nullptr, holder_),
      uvo::CheckFailedException);
  EXPECT_THROW(
      HttpSession::Create(host_.locator.Get(), kPrefix, checker_, settings, nullptr, nullptr),
      uvo::CheckFailedException);
  for (const int level : {0, 4, -1}) EXPECT_THROW(Make(level), uvo::CheckFailedException);
  EXPECT_TRUE(checker_->calls.empty());

  // Parameters reach the checker in list order, then the external data handler.
  const SessionParam params[] = {{"b", "2"}, {"a", "1"}, {"a", ""}};
  const SessionParamList list{params, params + 3};
  auto source = pelmix::host::ExternalDataSource::Create();
  auto session = Make(3, &list, source.Get());
  EXPECT_EQ(checker_->calls,
            (std::vector<std::string>{"param b=2", "param a=1", "param a=", "handler"}));
  EXPECT_NE(checker_->extHandler, nullptr);
  EXPECT_EQ(source->Requests().size(), 0u);  // nothing is asked of the source by itself

  // A reversed list is refused before any parameter is handed over; null texts read as "".
  checker_->calls.clear();
  const SessionParamList reversed{params + 2, params};
  EXPECT_THROW(Make(2, &reversed), uvo::CheckFailedException);
  const SessionParam nulls[] = {{nullptr, "v"}, {"n", nullptr}};
  const SessionParamList withNulls{nulls, nulls + 2};
  Make(2, &withNulls);
  EXPECT_EQ(checker_->calls, (std::vector<std::string>{"param =v", "param n="}));
}

TEST_F(HttpSessionTest, AppendHtml) {
  auto session = Make();
  const std::string page = "<p>hello";
  EXPECT_EQ(session->AppendHtml({page.data(), page.data()}), uvo::kFalse);
  EXPECT_EQ(session->AppendHtml({nullptr, nullptr}), uvo::kFalse);
  EXPECT_TRUE(checker_->calls.empty());
  EXPECT_EQ(session->AppendHtml({page.data(), page.data() + 3}), uvo::kOk);
  EXPECT_EQ(session->AppendHtml({page.data() + 3, page.data() + page.size()}), uvo::kOk);
  EXPECT_EQ(checker_->calls, (std::vector<std::string>{"data <p>", "data hello"}));
  // A reversed range is refused, not read.
  EXPECT_EQ(session->AppendHtml({page.data() + 2, page.data()}), uvo::kErrUnexpected);
  EXPECT_EQ(checker_->calls.size(), 2u);
}

TEST_F(HttpSessionTest, VerdictsAndTheirTraceLines) {
  auto session = Make(1);
  checker_->verdict.quiet = false;
  checker_->verdict.phishing = true;
  checker_->verdict.weight = 0.5f;
  checker_->verdict.target = "PayPal|1 .5";
  checker_->verdict.stampWords = {0, 4294967295u, 0, 0};
  host_.tracer->Clear();

  Verdict verdict{false, true};
  ASSERT_EQ(session->GetVerdict(&verdict), 0);
  EXPECT_TRUE(verdict.phishingDetected);
  EXPECT_FALSE(verdict.confirmedVerdict);
  HeuristicVerdictInfo info{};
  ASSERT_EQ(session->GetHeuristicVerdictInfo(&info), 0);
  EXPECT_FALSE(info.quiet);
  EXPECT_EQ(info.confidence, 2);
  EXPECT_EQ(info.weight, 0.5);
  EXPECT_EQ(info.target.view(), "PayPal|1 .5");
  EXPECT_EQ(info.dbstamp, 4294967295ll);

  const auto lines = host_.tracer->Lines();
  ASSERT_EQ(lines.size(), 2u);
  EXPECT_EQ(lines[0].level, 700);
  EXPECT_EQ(lines[0].text, std::string(kPrefix) + kGetVerdict +
                               ": protection level: 1 Verdict { phishingDetected = 1, "
                               "confirmedVerdict = 0 }");
  EXPECT_EQ(lines[1].level, 700);
  EXPECT_EQ(lines[1].text, std::string(kPrefix) + kGetInfo +
                               ": protection level: 1 Heuristic {, confidence = 2, weight = "
                               "0.500000, target = PayPal|1 .5, dbstamp = 4294967295 }");

  // Quiet: GetVerdict traces nothing, the details line ends with the level and a blank.
  checker_->verdict.quiet = true;
  host_.tracer->Clear();
  ASSERT_EQ(session->GetVerdict(&verdict), 0);
  ASSERT_EQ(session->GetHeuristicVerdictInfo(&info), 0);
  EXPECT_TRUE(info.quiet);
  EXPECT_EQ(host_.tracer->Texts(),
            (std::vector<std::string>{std::string(kPrefix) + kGetInfo + ": protection level: 1 "}));
  EXPECT_EQ(checker_->verdictsAsked, 4);  // each query asks afresh
}

TEST_F(HttpSessionTest, TracesTheJudgedFeaturesWhenAsked) {
  const SessionParam on[] = {{kTraceFeaturesParameter, "1"}};
  const SessionParamList list{on, on + 1};
  auto session = Make(2, &list);
  checker_->features = {0.5f, 1.0f, 0.1f};
  host_.tracer->Clear();
  HeuristicVerdictInfo info{};
  ASSERT_EQ(session->GetHeuristicVerdictInfo(&info), 0);
  EXPECT_EQ(host_.tracer->Texts(),
            (std::vector<std::string>{
                std::string(kPrefix) + kGetInfo + ": protection level: 2 ",
                std::string(kPrefix) + kGetInfo + ": features: 0.5 1 0.100000001"}));
  // Nothing judged (a trusted page): no features line.
  checker_->features.clear();
  host_.tracer->Clear();
  ASSERT_EQ(session->GetHeuristicVerdictInfo(&info), 0);
  EXPECT_EQ(host_.tracer->Texts().size(), 1u);
  // Without the parameter, never.
  checker_->features = {0.5f};
  auto plain = Make(2);
  host_.tracer->Clear();
  ASSERT_EQ(plain->GetHeuristicVerdictInfo(&info), 0);
  EXPECT_EQ(host_.tracer->Texts().size(), 1u);
}

TEST_F(HttpSessionTest, FailuresAreResultCodes) {
  auto session = Make();
  EXPECT_EQ(session->GetVerdict(nullptr), uvo::kErrInvalidArgument);
  EXPECT_EQ(session->GetHeuristicVerdictInfo(nullptr), uvo::kErrInvalidArgument);
  EXPECT_EQ(checker_->verdictsAsked, 0);
  checker_->failVerdict = true;
  host_.tracer->Clear();
  Verdict verdict{true, true};
  EXPECT_EQ(session->GetVerdict(&verdict), uvo::kErrUnspecified);
  EXPECT_TRUE(verdict.phishingDetected);  // left as it was
  HeuristicVerdictInfo info{};
  EXPECT_EQ(session->GetHeuristicVerdictInfo(&info), uvo::kErrUnspecified);
  const auto lines = host_.tracer->Lines();
  ASSERT_EQ(lines.size(), 2u);
  EXPECT_EQ(lines[0].level, 300);
  EXPECT_EQ(lines[0].text, std::string(kGetVerdict) + ": verdict failed");
  EXPECT_EQ(lines[1].text, std::string(kGetInfo) + ": verdict failed");
}

TEST_F(HttpSessionTest, SessionKeepsTheModuleLockedUntilReleased) {
  const std::int32_t before = uvo::detail::ModuleLockCount();
  auto session = Make();
  EXPECT_EQ(uvo::detail::ModuleLockCount(), before + 1);
  std::weak_ptr<FakeWebChecker> checker = checker_;
  checker_.reset();
  EXPECT_FALSE(checker.expired());  // the session keeps its checker
  session.Reset();
  EXPECT_TRUE(checker.expired());
  EXPECT_EQ(uvo::detail::ModuleLockCount(), before);
}

}  // namespace
}  // namespace cf::services::anti_phishing::heuristic
