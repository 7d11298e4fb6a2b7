// Web checking end to end through the module's real exports and the reference host: session
// creation and numbering, appending, both verdict records with their trace lines, the JSON
// and loud rules, the categorised-page block, and sessions on several threads.
#include <gtest/gtest.h>

#include <atomic>
#include <string>
#include <thread>
#include <vector>

#include "framework/uvo/anti_phishing.h"
#include "framework/uvo/result.h"
#include "host/external_data_source.h"
#include "host/host.h"
#include "host/module_loader.h"
#include "host/stream.h"
#include "tests/support/example_kb.h"
#include "tests/support/fixed_model_kb.h"

namespace {

using namespace cf::services::anti_phishing;
using service_test::AlwaysPhishing;
using service_test::ExampleEntries;
using service_test::FailingModel;
using service_test::Pack;

constexpr char kGetVerdict[] = "cf::services::anti_phishing::heuristic::HttpSession::GetVerdict";
constexpr char kGetInfo[] =
    "cf::services::anti_phishing::heuristic::HttpSession::GetHeuristicVerdictInfo";
constexpr char kPage[] =
    "<html><head><title>Sign in</title></head><body><form action=\"http://evil.example/p\">"
    "<input type=password name=pw></form><a href=\"https://www.paypal.com/\">PayPal</a>"
    "</body></html>";

class WebSessionAbi : public ::testing::Test {
 protected:
  void Load(const std::string& container) {
    uvo::Ptr<uvo::IObjectFactory> objects;
    ASSERT_EQ(
        module_.GetObjectFactory(host_.locator.Get(), kAntiPhishingClassId, objects.Receive()), 0);
    ASSERT_EQ(objects->CreateInstance(host_.locator.Get(), IAntiPhishingServiceFactory::kIid,
                                      factory_.ReceiveVoid()),
              0);
    auto file = pelmix::host::MemoryStream::Create(container);
    ASSERT_EQ(factory_->CreateAntiPhishingService(file.Get(), service_.Receive()), 0);
    ASSERT_EQ(service_->GetHttpSessionFactory(sessions_.Receive()), 0);
  }

  uvo::Ptr<IHttpSession> Open(const std::string& url, int level = 2) {
    SessionSettings settings{level};
    uvo::Ptr<IHttpSession> session;
    EXPECT_EQ(sessions_->CreateSession(&settings, url.c_str(), nullptr, session.Receive()), 0);
    return session;
  }

  static void Append(IHttpSession* session, const std::string& html, std::size_t chunk = 7) {
    for (std::size_t at = 0; at < html.size(); at += chunk) {
      const std::size_t n = std::min(chunk, html.size() - at);
      ASSERT_EQ(session->AppendHtml({html.data() + at, html.data() + at + n}), 0);
    }
  }

  struct Both {
    Verdict verdict{};
    HeuristicVerdictInfo info{};
  };
  static Both Ask(IHttpSession* session) {
    Both both;
    EXPECT_EQ(session->GetVerdict(&both.verdict), 0);
    EXPECT_EQ(session->GetHeuristicVerdictInfo(&both.info), 0);
    return both;
  }

  // The session number from a details line "anti_phishing_service\thttp session N\t...".
  unsigned Number(IHttpSession* session) {
    host_.tracer->Clear();
    HeuristicVerdictInfo info{};
    EXPECT_EQ(session->GetHeuristicVerdictInfo(&info), 0);
    const std::string line = host_.tracer->Texts().at(0);
    const std::string head = "anti_phishing_service\thttp session ";
    EXPECT_EQ(line.rfind(head, 0), 0u) << line;
    return static_cast<unsigned>(std::stoul(line.substr(head.size())));
  }

  pelmix::host::Host host_;
  pelmix::host::Module module_{PELMIX_MODULE_PATH};
  uvo::Ptr<IAntiPhishingServiceFactory> factory_;
  uvo::Ptr<IAntiPhishingService> service_;
  uvo::Ptr<IHttpSessionFactory> sessions_;
};

TEST_F(WebSessionAbi, SessionsAreNumberedAndBadLevelsUseNoNumber) {
  Load(Pack(ExampleEntries()));
  auto first = Open("http://a.example/");
  SessionSettings bad[] = {{0}, {4}};
  for (const SessionSettings& settings : bad) {
    IHttpSession* none = nullptr;
    EXPECT_EQ(sessions_->CreateSession(&settings, "http://a.example/", nullptr, &none),
              uvo::kErrUnspecified);
    EXPECT_EQ(none, nullptr);
  }
  auto second = Open("http://b.example/");
  auto source = pelmix::host::ExternalDataSource::Create();
  SessionSettings settings{2};
  uvo::Ptr<IHttpSession> third;
  ASSERT_EQ(sessions_->CreateSessionWithExternalDataSource(&settings, "http://c.example/", nullptr,
                                                           source.Get(), third.Receive()),
            0);
  const unsigned n = Number(first.Get());
  EXPECT_EQ(Number(second.Get()), n + 1);
  EXPECT_EQ(Number(third.Get()), n + 2);
  // The web checker never asks the host for external data.
  Append(third.Get(), kPage);
  Ask(third.Get());
  EXPECT_TRUE(source->Requests().empty());
}

TEST_F(WebSessionAbi, EmptyAppendAndNothingAppended) {
  Load(Pack(ExampleEntries()));
  auto session = Open("http://a.example/");
  const char* page = kPage;
  EXPECT_EQ(session->AppendHtml({page, page}), uvo::kFalse);
  const unsigned n = Number(session.Get());
  host_.tracer->Clear();
  const Both both = Ask(session.Get());
  EXPECT_FALSE(both.verdict.phishingDetected);
  EXPECT_TRUE(both.info.quiet);
  const std::string target(both.info.target.view());
  ASSERT_GE(target.size(), 2u);
  EXPECT_EQ(target.substr(target.size() - 2), "|j");
  // Quiet: only the details line, ending with the level and a blank.
  EXPECT_EQ(host_.tracer->Texts(),
            (std::vector<std::string>{"anti_phishing_service\thttp session " + std::to_string(n) +
                                      "\t" + kGetInfo + ": protection level: 2 "}));
}

TEST_F(WebSessionAbi, JsonDocumentsStayQuiet) {
  Load(AlwaysPhishing("web_loud=1;\nweb_loud_probability=1;\n"));
  auto session = Open("http://api.example/v1");
  Append(session.Get(), R"({"user": "x", "items": [1, 2, {"a": null}]})");
  const Both both = Ask(session.Get());
  EXPECT_TRUE(both.verdict.phishingDetected);  // the model's word stands
  EXPECT_TRUE(both.info.quiet);
  const std::string target(both.info.target.view());
  EXPECT_EQ(target.substr(target.size() - 6), "|1 1|j");
}

TEST_F(WebSessionAbi, WhitePagesAreQuietWhateverIsAppended) {
  Load(AlwaysPhishing("web_loud=1;\nweb_loud_probability=1;\n"));
  for (const std::string& page : {std::string(kPage), std::string("{}"), std::string()}) {
    auto session = Open("https://www.paypal.com/signin");
    if (!page.empty()) Append(session.Get(), page);
    const Both both = Ask(session.Get());
    EXPECT_FALSE(both.verdict.phishingDetected);
    EXPECT_TRUE(both.info.quiet);
    EXPECT_EQ(both.info.target.view(), "");
    EXPECT_EQ(both.info.weight, 0.0);
  }
}

TEST_F(WebSessionAbi, LoudVerdictTraceLines) {
  Load(AlwaysPhishing("dbstamp=4294967295;\nweb_loud=1;\nweb_loud_probability=1;\n"));
  auto session = Open("http://login.evil.example/", 1);
  Append(session.Get(), kPage);
  const unsigned n = Number(session.Get());
  host_.tracer->Clear();
  const Both both = Ask(session.Get());
  EXPECT_TRUE(both.verdict.phishingDetected);
  EXPECT_FALSE(both.verdict.confirmedVerdict);
  EXPECT_FALSE(both.info.quiet);
  EXPECT_EQ(both.info.confidence, 2);
  EXPECT_EQ(both.info.weight, 1.0);
  EXPECT_EQ(both.info.dbstamp, 4294967295ll);
  const std::string target(both.info.target.view());
  ASSERT_GE(target.size(), 4u);
  EXPECT_EQ(target.substr(target.size() - 4), "|1 1");
  const std::string prefix = "anti_phishing_service\thttp session " + std::to_string(n) + "\t";
  EXPECT_EQ(host_.tracer->Texts(),
            (std::vector<std::string>{
                prefix + kGetVerdict +
                    ": protection level: 1 Verdict { phishingDetected = 1, confirmedVerdict = 0 }",
                prefix + kGetInfo +
                    ": protection level: 1 Heuristic {, confidence = 2, weight = 1.000000, "
                    "target = " +
                    target + ", dbstamp = 4294967295 }"}));
}

TEST_F(WebSessionAbi, LoudOffOrNeverMakesVerdictsQuiet) {
  for (const char* config : {"web_loud=0;\nweb_loud_probability=1;\n",
                             "web_loud=1;\nweb_loud_probability=0;\n", "dbstamp=1;\n"}) {
    Load(AlwaysPhishing(config));
    auto session = Open("http://login.evil.example/");
    Append(session.Get(), kPage);
    const Both both = Ask(session.Get());
    EXPECT_TRUE(both.verdict.phishingDetected) << config;
    EXPECT_TRUE(both.info.quiet) << config;
  }
}

TEST_F(WebSessionAbi, FailingModelGivesAQuietCleanVerdict) {
  Load(FailingModel());
  auto session = Open("http://login.evil.example/");
  Append(session.Get(), kPage);
  host_.tracer->Clear();
  const Both both = Ask(session.Get());
  EXPECT_FALSE(both.verdict.phishingDetected);
  EXPECT_TRUE(both.info.quiet);
  EXPECT_EQ(both.info.weight, 0.0);
  EXPECT_EQ(host_.tracer->Texts().size(), 1u);  // no failure line: the session did not fail
}

TEST_F(WebSessionAbi, CategorisedPagesAreBlocked) {
  Load(Pack(ExampleEntries()));  // loud off: only the block can make a verdict loud
  auto session = Open("http://phish.example/login/");
  Append(session.Get(), "<p>hello</p>");
  const Both both = Ask(session.Get());
  EXPECT_TRUE(both.verdict.phishingDetected);
  EXPECT_FALSE(both.info.quiet);
  EXPECT_EQ(both.info.weight, 1.0);
  const std::string target(both.info.target.view());
  EXPECT_EQ(target.substr(target.size() - 2), "|c");
  // A page on an uncategorised host of the same knowledge base is judged by the model.
  auto other = Open("http://other.example/login/");
  Append(other.Get(), "<p>hello</p>");
  EXPECT_EQ(std::string(Ask(other.Get()).info.target.view()).find("|c"), std::string::npos);
}

TEST_F(WebSessionAbi, VerdictsAgreeWhateverTheOrder) {
  Load(AlwaysPhishing("web_loud=1;\nweb_loud_probability=1;\n"));
  auto a = Open("http://login.evil.example/");
  auto b = Open("http://login.evil.example/");
  Append(a.Get(), kPage);
  Append(b.Get(), kPage, 1);
  HeuristicVerdictInfo infoA{}, infoB{}, again{};
  Verdict verdictA{}, verdictB{};
  ASSERT_EQ(a->GetVerdict(&verdictA), 0);
  ASSERT_EQ(a->GetHeuristicVerdictInfo(&infoA), 0);
  ASSERT_EQ(b->GetHeuristicVerdictInfo(&infoB), 0);
  ASSERT_EQ(b->GetVerdict(&verdictB), 0);
  ASSERT_EQ(b->GetHeuristicVerdictInfo(&again), 0);
  EXPECT_EQ(verdictA.phishingDetected, verdictB.phishingDetected);
  for (const HeuristicVerdictInfo* info : {&infoB, &again}) {
    EXPECT_EQ(info->quiet, infoA.quiet);
    EXPECT_EQ(info->weight, infoA.weight);
    EXPECT_EQ(info->target.view(), infoA.target.view());
  }
}

TEST_F(WebSessionAbi, SessionOutlivesItsService) {
  Load(Pack(ExampleEntries()));
  auto session = Open("http://phish.example/x");
  sessions_.Reset();
  service_.Reset();
  factory_.Reset();
  EXPECT_EQ(module_.CanUnload(), 1);
  Append(session.Get(), kPage);
  EXPECT_TRUE(Ask(session.Get()).verdict.phishingDetected);
  session.Reset();
  EXPECT_EQ(module_.CanUnload(), 0);
  EXPECT_EQ(host_.allocator->LiveBlocks(), 0u);
}

TEST_F(WebSessionAbi, SessionsOnSeveralThreadsOverOneService) {
  Load(AlwaysPhishing("web_loud=1;\nweb_loud_probability=1;\n"));
  const std::vector<std::string> urls = {"http://login.evil.example/", "https://www.paypal.com/",
                                         "http://phish.example/login/", "http://x.example/api"};
  const std::vector<std::string> pages = {kPage, "<p>plain</p>", "[1, 2]", ""};
  // Expected answers, one session at a time.
  std::vector<std::string> expected;
  for (std::size_t i = 0; i < urls.size(); ++i) {
    auto session = Open(urls[i]);
    if (!pages[i].empty()) Append(session.Get(), pages[i]);
    const Both both = Ask(session.Get());
    expected.push_back(std::to_string(both.verdict.phishingDetected) +
                       std::to_string(both.info.quiet) + std::string(both.info.target.view()));
  }
  std::atomic<int> mismatches{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&, t] {
      for (int round = 0; round < 25; ++round) {
        const std::size_t i = static_cast<std::size_t>(round + t) % urls.size();
        SessionSettings settings{2};
        uvo::Ptr<IHttpSession> session;
        if (sessions_->CreateSession(&settings, urls[i].c_str(), nullptr, session.Receive()) != 0) {
          ++mismatches;
          continue;
        }
        const std::string& page = pages[i];
        if (!page.empty()) session->AppendHtml({page.data(), page.data() + page.size()});
        Verdict verdict{};
        HeuristicVerdictInfo info{};
        session->GetVerdict(&verdict);
        session->GetHeuristicVerdictInfo(&info);
        const std::string got = std::to_string(verdict.phishingDetected) +
                                std::to_string(info.quiet) + std::string(info.target.view());
        if (got != expected[i]) ++mismatches;
      }
    });
  }
  for (auto& thread : threads) thread.join();
  EXPECT_EQ(mismatches.load(), 0);
}

}  // namespace
