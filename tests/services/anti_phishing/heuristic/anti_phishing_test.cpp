// The service object over a stand-in check factory: session-factory interfaces, protection
// levels and the white-domain query's result codes.
#include "services/anti_phishing/heuristic/source/anti_phishing.h"

#include <gtest/gtest.h>

#include <new>
#include <stdexcept>

#include "framework/uvo/exception.h"
#include "host/host.h"
#include "host/stream.h"
#include "tests/support/fake_web_checker.h"

namespace {

using namespace cf::services::anti_phishing;
using heuristic::AntiPhishing;

// Answers white for "white.example", and fails as it is told.
class FakeCheckFactory : public ap::easy2::CheckFactoryI {
 public:
  enum class Failure { kNone, kMemory, kRuntime };
  std::shared_ptr<ap::easy2::WebCheckerI> CreateWebChecker(const std::string& url,
                                                           int confidence) override {
    ++checkersAsked;
    urls.push_back(url + " " + std::to_string(confidence));
    return makeCheckers ? std::make_shared<pelmix::testing::FakeWebChecker>() : nullptr;
  }
  std::shared_ptr<ap::easy2::MailCheckerI> CreateMailChecker(int) override {
    ++checkersAsked;
    return nullptr;
  }
  std::shared_ptr<ap::easy2::ExtraCheckerI> CreateExtraChecker() override { return nullptr; }
  bool IsWhiteDomain(const std::string& domain) override {
    ++whiteAsked;
    if (failure == Failure::kMemory) throw std::bad_alloc();
    if (failure == Failure::kRuntime) throw std::runtime_error("lookup failed");
    return domain == "white.example";
  }
  Failure failure = Failure::kNone;
  bool makeCheckers = false;
  std::vector<std::string> urls;
  int whiteAsked = 0;
  int checkersAsked = 0;
};

class AntiPhishingService : public ::testing::Test {
 protected:
  void SetUp() override {
    file_ = pelmix::host::MemoryStream::Create(std::string("knowledge"));
    auto holder = heuristic::TracerHolder::Acquire(host_.tracer.Get());
    service_ = AntiPhishing::Create(host_.locator.Get(), file_.Get(), holder,
                                    [this](std::shared_ptr<ap::FileIO> file) {
                                      EXPECT_EQ(file->file_size(), 9);
                                      return factory_;
                                    });
  }
  void TearDown() override {
    if (service_) service_->Release();
    EXPECT_EQ(host_.allocator->LiveBlocks(), 0u);
  }

  pelmix::host::Host host_;
  uvo::Ptr<pelmix::host::MemoryStream> file_;
  std::shared_ptr<FakeCheckFactory> factory_ = std::make_shared<FakeCheckFactory>();
  AntiPhishing* service_ = nullptr;
};

TEST_F(AntiPhishingService, InitialisationTraces) {
  const std::string place = "cf::services::anti_phishing::heuristic::AntiPhishing::Initialize";
  EXPECT_EQ(
      host_.tracer->Texts(),
      (std::vector<std::string>{place + " creating heuristic checker factory..",
                                place + " heuristic checker factory was created successfully"}));
  EXPECT_EQ(host_.allocator->LiveBlocks(), 1u);  // the service lives in host memory
}

TEST_F(AntiPhishingService, InterfacesAndSessionFactories) {
  IHttpSessionFactory* http = nullptr;
  ASSERT_EQ(service_->GetHttpSessionFactory(&http), 0);
  const std::uint32_t afterFirst = service_->RefCount();
  IHttpSessionFactory* again = nullptr;
  ASSERT_EQ(service_->GetHttpSessionFactory(&again), 0);
  EXPECT_EQ(again, http);
  EXPECT_EQ(service_->RefCount(), afterFirst + 1);
  http->Release();
  again->Release();

  IMailSessionFactory* mail = nullptr;
  ASSERT_EQ(service_->GetMailSessionFactory(&mail), 0);
  void* viaQuery = nullptr;
  ASSERT_EQ(service_->QueryInterface(IMailSessionFactory::kIid, &viaQuery), 0);
  EXPECT_EQ(viaQuery, static_cast<void*>(mail));
  mail->Release();
  static_cast<IMailSessionFactory*>(viaQuery)->Release();
  void* none = &viaQuery;
  EXPECT_EQ(service_->QueryInterface(IAntiPhishingServiceFactory::kIid, &none),
            uvo::kErrNoInterface);
  EXPECT_EQ(none, nullptr);

  EXPECT_EQ(service_->GetHttpSessionFactory(nullptr), uvo::kErrUnexpected);
  EXPECT_EQ(service_->GetMailSessionFactory(nullptr), uvo::kErrUnexpected);
}

TEST_F(AntiPhishingService, ProtectionLevelOutOfRangeFailsBeforeAnyChecker) {
  host_.tracer->Clear();
  for (const int level : {0, 4}) {
    SessionSettings settings{level};
    IHttpSession* web = nullptr;
    EXPECT_EQ(service_->CreateSession(&settings, "http://a.example/", nullptr, &web),
              uvo::kErrUnspecified);
    EXPECT_EQ(web, nullptr);
    IMailSession* mail = nullptr;
    EXPECT_EQ(service_->CreateSession(&settings, &mail), uvo::kErrUnspecified);
  }
  EXPECT_EQ(factory_->checkersAsked, 0);
  const auto lines = host_.tracer->Lines();
  ASSERT_EQ(lines.size(), 4u);
  EXPECT_EQ(lines[0].level, 300);
  EXPECT_EQ(lines[0].text,
            "cf::services::anti_phishing::heuristic::AntiPhishing::CreateSession: "
            "GetConfidence: unexpected protection level value - 0");
  EXPECT_EQ(lines[1].text,
            "cf::services::anti_phishing::heuristic::AntiPhishing::CreateSession: "
            "GetConfidence: unexpected protection level value - 0");
}

TEST_F(AntiPhishingService, EmptyCheckersAreFailuresNotSessions) {
  host_.tracer->Clear();
  SessionSettings settings{2};
  IHttpSession* web = nullptr;
  EXPECT_EQ(service_->CreateSessionWithExternalDataSource(&settings, "http://a.example/", nullptr,
                                                          nullptr, &web),
            uvo::kErrUnspecified);
  IMailSession* mail = nullptr;
  EXPECT_EQ(service_->CreateSession(&settings, &mail), uvo::kErrUnspecified);
  EXPECT_EQ(web, nullptr);
  EXPECT_EQ(mail, nullptr);
  EXPECT_EQ(host_.tracer->Texts(),
            (std::vector<std::string>{
                "cf::services::anti_phishing::heuristic::AntiPhishing::"
                "CreateSessionWithExternalDataSource: Can't create web checker",
                "cf::services::anti_phishing::heuristic::AntiPhishing::CreateSession: "
                "Can't create mail checker"}));
  EXPECT_EQ(service_->CreateSession(&settings, "u", nullptr, nullptr), uvo::kErrInvalidArgument);
}

// The number in a session's trace prefix, read from its details line.
unsigned SessionNumber(IHttpSession* session, pelmix::host::Tracer& tracer) {
  tracer.Clear();
  HeuristicVerdictInfo info{};
  EXPECT_EQ(session->GetHeuristicVerdictInfo(&info), 0);
  const std::string line = tracer.Texts().at(0);
  EXPECT_EQ(line.rfind("http session ", 0), 0u) << line;
  return static_cast<unsigned>(std::stoul(line.substr(13)));
}

TEST_F(AntiPhishingService, WebSessionsAreNumberedInCreationOrder) {
  factory_->makeCheckers = true;
  SessionSettings settings{3};
  uvo::Ptr<IHttpSession> first, second, third;
  ASSERT_EQ(service_->CreateSession(&settings, "http://a.example/", nullptr, first.Receive()), 0);
  // Refused levels neither make a checker nor use a number.
  for (const int level : {0, 4}) {
    SessionSettings bad{level};
    IHttpSession* none = nullptr;
    EXPECT_EQ(service_->CreateSession(&bad, "http://a.example/", nullptr, &none),
              uvo::kErrUnspecified);
  }
  ASSERT_EQ(service_->CreateSessionWithExternalDataSource(&settings, "http://b.example/", nullptr,
                                                          nullptr, second.Receive()),
            0);
  ASSERT_EQ(service_->CreateSession(&settings, "", nullptr, third.Receive()), 0);
  EXPECT_EQ(factory_->urls,
            (std::vector<std::string>{"http://a.example/ 0", "http://b.example/ 0", " 0"}));
  const unsigned n = SessionNumber(first.Get(), *host_.tracer.Get());
  EXPECT_EQ(SessionNumber(second.Get(), *host_.tracer.Get()), n + 1);
  EXPECT_EQ(SessionNumber(third.Get(), *host_.tracer.Get()), n + 2);
  // A session outlives the service that made it.
  service_->Release();
  service_ = nullptr;
  Verdict verdict{true, true};
  EXPECT_EQ(first->GetVerdict(&verdict), 0);
  EXPECT_FALSE(verdict.phishingDetected);
}

TEST_F(AntiPhishingService, IsDomainWhiteResultCodes) {
  bool white = false;
  EXPECT_EQ(service_->IsDomainWhite("white.example", &white), 0);
  EXPECT_TRUE(white);
  EXPECT_EQ(service_->IsDomainWhite("other.example", &white), 0);
  EXPECT_FALSE(white);
  EXPECT_EQ(factory_->whiteAsked, 2);

  EXPECT_EQ(service_->IsDomainWhite("white.example", nullptr), uvo::kErrInvalidArgument);
  EXPECT_EQ(service_->IsDomainWhite(nullptr, &white), uvo::kErrInvalidArgument);
  EXPECT_EQ(factory_->whiteAsked, 2);  // neither consulted the factory

  // Nothing may leave the call as an exception.
  factory_->failure = FakeCheckFactory::Failure::kMemory;
  EXPECT_EQ(service_->IsDomainWhite("white.example", &white), uvo::kErrOutOfMemory);
  factory_->failure = FakeCheckFactory::Failure::kRuntime;
  EXPECT_EQ(service_->IsDomainWhite("white.example", &white), uvo::kErrUnspecified);
  EXPECT_EQ(host_.tracer->Texts().back(),
            "cf::services::anti_phishing::heuristic::AntiPhishing::IsDomainWhite: lookup failed");
}

TEST(GetConfidence, MapsLevelsOneToThree) {
  EXPECT_EQ(heuristic::GetConfidence(1), 2);
  EXPECT_EQ(heuristic::GetConfidence(2), 1);
  EXPECT_EQ(heuristic::GetConfidence(3), 0);
  EXPECT_THROW(heuristic::GetConfidence(-1), std::runtime_error);
}

TEST(AntiPhishingCreate, FailedInitialisationGivesBackTheMemory) {
  pelmix::host::Host host;
  auto file = pelmix::host::MemoryStream::Create(std::string("x"));
  auto holder = heuristic::TracerHolder::Acquire(host.tracer.Get());
  EXPECT_THROW(AntiPhishing::Create(
                   host.locator.Get(), file.Get(), holder,
                   [](std::shared_ptr<ap::FileIO>) -> std::shared_ptr<ap::easy2::CheckFactoryI> {
                     throw std::runtime_error("Control summ is invalid");
                   }),
               std::runtime_error);
  EXPECT_EQ(host.allocator->LiveBlocks(), 0u);
  // Only the first of the two lines: the factory was never made.
  EXPECT_EQ(host.tracer->Texts().size(), 1u);
  EXPECT_THROW(AntiPhishing::Create(host.locator.Get(), nullptr, holder,
                                    [](std::shared_ptr<ap::FileIO>) {
                                      ADD_FAILURE() << "built without a file";
                                      return std::shared_ptr<ap::easy2::CheckFactoryI>();
                                    }),
               uvo::CheckFailedException);
}

}  // namespace
