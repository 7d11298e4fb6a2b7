// The anti-phishing service through the module's real exports, on containers made by the
// knowledge-base writers.
#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

#include "framework/uvo/anti_phishing.h"
#include "framework/uvo/result.h"
#include "host/host.h"
#include "host/module_loader.h"
#include "host/stream.h"
#include "tests/support/example_kb.h"
#include "tests/support/kb_test_support.h"

namespace {

using namespace cf::services::anti_phishing;
using service_test::ExampleEntries;
using service_test::Pack;
using service_test::Replacing;
using service_test::Without;

constexpr char kPrefix[] = "anti_phishing_service\t";
constexpr char kCreateService[] =
    "cf::services::anti_phishing::heuristic::AntiPhishingFactory::CreateAntiPhishingService";
constexpr char kInitialize[] = "cf::services::anti_phishing::heuristic::AntiPhishing::Initialize";

class ServiceAbi : public ::testing::Test {
 protected:
  // Creates a service on `container`; the result code is returned, the service kept.
  uvo::result_t CreateService(const std::string& container) {
    uvo::Ptr<uvo::IObjectFactory> objects;
    EXPECT_EQ(
        module_.GetObjectFactory(host_.locator.Get(), kAntiPhishingClassId, objects.Receive()), 0);
    EXPECT_EQ(objects->CreateInstance(host_.locator.Get(), IAntiPhishingServiceFactory::kIid,
                                      factory_.ReceiveVoid()),
              0);
    auto file = pelmix::host::MemoryStream::Create(container);
    return factory_->CreateAntiPhishingService(file.Get(), service_.Receive());
  }

  bool IsWhite(const char* domain) {
    bool white = false;
    EXPECT_EQ(service_->IsDomainWhite(domain, &white), 0) << domain;
    return white;
  }

  // The failure line of a creation that failed with `text`.
  void ExpectLoadFailure(const std::string& container, uvo::result_t code,
                         const std::string& text) {
    EXPECT_EQ(CreateService(container), code) << text;
    EXPECT_FALSE(service_);
    const auto lines = host_.tracer->Lines();
    ASSERT_FALSE(lines.empty());
    EXPECT_EQ(lines.back().level, 300);
    EXPECT_EQ(lines.back().text, std::string(kPrefix) + kCreateService + ": " + text);
  }

  pelmix::host::Host host_;
  pelmix::host::Module module_{PELMIX_MODULE_PATH};
  uvo::Ptr<IAntiPhishingServiceFactory> factory_;
  uvo::Ptr<IAntiPhishingService> service_;
};

TEST_F(ServiceAbi, AnswersWhiteDomainsFromTheWritersContainer) {
  ASSERT_EQ(CreateService(Pack(ExampleEntries())), 0);
  ASSERT_TRUE(service_);
  EXPECT_TRUE(IsWhite("paypal.com"));
  EXPECT_TRUE(IsWhite("www.paypal.co.uk"));  // a subdomain of a listed domain
  EXPECT_FALSE(IsWhite("paypal.fr"));        // the brand under another suffix
  EXPECT_TRUE(IsWhite("examplebank.com"));
  EXPECT_FALSE(IsWhite("login.examplebank.com"));  // listed as exact
  EXPECT_FALSE(IsWhite("phish.example"));
  EXPECT_FALSE(IsWhite(""));
  bool white = true;
  EXPECT_EQ(service_->IsDomainWhite("paypal.com", nullptr), uvo::kErrInvalidArgument);
  EXPECT_EQ(service_->IsDomainWhite(nullptr, &white), uvo::kErrInvalidArgument);
}

TEST_F(ServiceAbi, CreationTracesInOrder) {
  ASSERT_EQ(CreateService(Pack(ExampleEntries())), 0);
  std::vector<pelmix::host::TraceLine> shell;
  for (const auto& line : host_.tracer->Lines()) {
    EXPECT_EQ(line.text.rfind(kPrefix, 0), 0u) << line.text;
    if (line.text.find("cf::services::") != std::string::npos) shell.push_back(line);
  }
  ASSERT_EQ(shell.size(), 4u);
  EXPECT_EQ(shell[0].level, 700);
  EXPECT_EQ(shell[0].text,
            std::string(kPrefix) + kCreateService + " creating anti-phishing service instance..");
  EXPECT_EQ(shell[1].text,
            std::string(kPrefix) + kInitialize + " creating heuristic checker factory..");
  EXPECT_EQ(shell[2].text, std::string(kPrefix) + kInitialize +
                               " heuristic checker factory was created successfully");
  EXPECT_EQ(shell[3].level, 600);
  EXPECT_EQ(shell[3].text,
            std::string(kPrefix) + kCreateService + " anti-phishing service instance created");
}

TEST_F(ServiceAbi, ReleasingEverythingLetsTheModuleGo) {
  ASSERT_EQ(CreateService(Pack(ExampleEntries())), 0);
  IHttpSessionFactory* http = nullptr;
  ASSERT_EQ(service_->GetHttpSessionFactory(&http), 0);
  factory_.Reset();
  EXPECT_EQ(module_.CanUnload(), 1);
  EXPECT_TRUE(IsWhite("paypal.de"));  // the service outlives its factory
  http->Release();
  service_.Reset();
  EXPECT_EQ(module_.CanUnload(), 0);
  EXPECT_EQ(host_.allocator->LiveBlocks(), 0u);
}

TEST_F(ServiceAbi, WebAndMailSessionsAreMade) {
  ASSERT_EQ(CreateService(Pack(ExampleEntries())), 0);
  IHttpSessionFactory* http = nullptr;
  ASSERT_EQ(service_->GetHttpSessionFactory(&http), 0);
  SessionSettings settings{1};
  IHttpSession* session = nullptr;
  EXPECT_EQ(http->CreateSession(&settings, "http://phish.example/", nullptr, &session), 0);
  ASSERT_NE(session, nullptr);
  session->Release();
  http->Release();
  IMailSessionFactory* mail = nullptr;
  ASSERT_EQ(service_->GetMailSessionFactory(&mail), 0);
  IMailSession* mailSession = nullptr;
  EXPECT_EQ(mail->CreateSession(&settings, &mailSession), 0);
  ASSERT_NE(mailSession, nullptr);
  mailSession->Release();
  mail->Release();
}

TEST_F(ServiceAbi, DamagedContainerAndEntries) {
  std::string container = Pack(ExampleEntries());
  container[container.size() - 1] ^= 0x20;  // inside the last entry's data
  pelmix::testing::Reseal(container);       // the body sum agrees; the entry's does not
  ExpectLoadFailure(container, uvo::kErrUnspecified, "Failed to create ReadableFile crc error");
  host_.tracer->Clear();
  // The header sums the whole body: a byte flipped anywhere after it is caught at once.
  container = Pack(ExampleEntries());
  container[20] ^= 0x01;
  ExpectLoadFailure(container, uvo::kErrUnspecified, "Control summ is invalid");
  host_.tracer->Clear();
  ExpectLoadFailure("", uvo::kErrUnexpected, "uvo::Exception ");  // the adapter's own check
}

// The example model's flow file with its encoding reading features [0, to).
std::string FlowReading(const std::string& rules, int to) {
  return R"({"convs":{"boost":{"type":"sqrtboost"},"enc":{"type":"rules","src":")" + rules +
         R"("},"net":{"type":"neur","src":"example.net"}},"flow":[{"name":"signals","input":[[0,)" +
         std::to_string(to) +
         R"(]],"conv":"enc"},{"name":"scores","input":["signals"],"conv":"net"},)"
         R"({"name":"out","input":["scores"],"conv":"boost"}]})";
}

struct MissingOrDamaged {
  std::string container;
  std::string text;
};

TEST_F(ServiceAbi, EveryEntryFailsTheLoadAsDocumented) {
  // The example model reads exactly the vectors the checkers make.
  ASSERT_EQ(ExampleEntries().at("web.flow"), FlowReading("web.rules", 214));
  ASSERT_EQ(ExampleEntries().at("mail.flow"), FlowReading("mail.rules", 260));
  const std::vector<MissingOrDamaged> rows = {
      {Without("wdb"), "null pointer to readable in WhiteDomains"},
      {Without("orgs"), "Failed to load orgs db - null file"},
      {Without("lexdb.txt"), "null readable for tell"},
      {Replacing("lexdb.txt", "#1 1 1 1 1\nnoblank"), "invalid lexdb string 'noblank'"},
      {Without("web.flow"), "Absent flow file web.flow"},
      {Without("mail.flow"), "Absent flow file mail.flow"},
      {Replacing("mail.flow", "{\"convs\":{}}"),
       "Deep solver config error: Exact 2 elements expected in hash"},
      // A model that reads past its channel's vector is a broken knowledge base.
      {Replacing("web.flow", FlowReading("web.rules", 215)),
       "Deep solver flow signals reads features [0, 215) of an input of 214"},
      {Replacing("mail.flow", FlowReading("mail.rules", 261)),
       "Deep solver flow signals reads features [0, 261) of an input of 260"},
      {Without("share_links.txt"), "null readable for tell"},
      {Replacing("sb.db", std::string("\x01", 1)), "HPDB: Invalid db format"},
      {Without("v3.cfg"), "Configuration entry v3.cfg not found"},
      {Replacing("v3.cfg", "web_threshold=0.5\n"), "';' not found in cfg string"},
      {Replacing("v3.cfg", "web_threshold=x;\n"), "FloatParser: wrong first symbol"},
  };
  for (const auto& row : rows) {
    host_.tracer->Clear();
    ExpectLoadFailure(row.container, uvo::kErrUnspecified, row.text);
  }
  EXPECT_EQ(host_.allocator->LiveBlocks(), 1u);  // only the service factory is alive
}

TEST_F(ServiceAbi, ContainerWithoutCategorisedHostsLoads) {
  ASSERT_EQ(CreateService(Without("sb.db")), 0);
  EXPECT_TRUE(IsWhite("paypal.com"));
}

TEST_F(ServiceAbi, FourThreadsAskAtOnce) {
  ASSERT_EQ(CreateService(Pack(ExampleEntries())), 0);
  const std::vector<std::string> domains = {"paypal.com",        "a.paypal.de",
                                            "paypal.fr",         "examplebank.com",
                                            "x.examplebank.com", "mailhost.example.org",
                                            "shop-example.net",  "evil.example",
                                            "h1.example",        "h2.example"};
  std::vector<bool> expected;
  for (const auto& domain : domains) expected.push_back(IsWhite(domain.c_str()));
  std::atomic<int> mismatches{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&, t] {
      for (int round = 0; round < 500; ++round) {
        const std::size_t i = static_cast<std::size_t>(round * 7 + t) % domains.size();
        bool white = !expected[i];
        if (service_->IsDomainWhite(domains[i].c_str(), &white) != 0 || white != expected[i]) {
          ++mismatches;
        }
      }
    });
  }
  for (auto& thread : threads) thread.join();
  EXPECT_EQ(mismatches.load(), 0);
}

TEST_F(ServiceAbi, TwoServicesLoadOnTwoThreads) {
  uvo::Ptr<uvo::IObjectFactory> objects;
  ASSERT_EQ(module_.GetObjectFactory(host_.locator.Get(), kAntiPhishingClassId, objects.Receive()),
            0);
  ASSERT_EQ(objects->CreateInstance(host_.locator.Get(), IAntiPhishingServiceFactory::kIid,
                                    factory_.ReceiveVoid()),
            0);
  const std::string container = Pack(ExampleEntries());
  uvo::Ptr<IAntiPhishingService> services[2];
  uvo::result_t results[2] = {-1, -1};
  std::vector<std::thread> threads;
  for (int t = 0; t < 2; ++t) {
    threads.emplace_back([&, t] {
      auto file = pelmix::host::MemoryStream::Create(container);
      results[t] = factory_->CreateAntiPhishingService(file.Get(), services[t].Receive());
    });
  }
  for (auto& thread : threads) thread.join();
  for (int t = 0; t < 2; ++t) {
    ASSERT_EQ(results[t], 0);
    bool white = false;
    EXPECT_EQ(services[t]->IsDomainWhite("paypal.co.uk", &white), 0);
    EXPECT_TRUE(white);
  }
}

}  // namespace
