// The default knowledge base (kb/, packed into build/default.kb): loaded through the module's
// exports as a host loads it, and asked what users ask: white domains of real organisations
// against their lookalikes, brand words in several scripts, share links, known phishing hosts.
#include <gtest/gtest.h>
#include <malloc.h>

#include <cstdio>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "framework/uvo/anti_phishing.h"
#include "host/host.h"
#include "host/module_loader.h"
#include "host/stream.h"
#include "tests/tools/pelmix/cli_runner.h"

namespace {

using namespace cf::services::anti_phishing;
using pelmix::testing::RunCli;

// The service of Decision 2's budget: loading the default knowledge base keeps it under this.
constexpr std::size_t kServiceHeapBudget = std::size_t{64} << 20;

std::size_t HeapInUse() {
  const struct mallinfo2 info = mallinfo2();
  return info.uordblks + info.hblkhd;
}

class DefaultKb : public ::testing::Test {
 protected:
  static void SetUpTestSuite() {
    host_ = new pelmix::host::Host();
    module_ = new pelmix::host::Module(PELMIX_MODULE_PATH);
    uvo::Ptr<uvo::IObjectFactory> objects;
    ASSERT_EQ(
        module_->GetObjectFactory(host_->locator.Get(), kAntiPhishingClassId, objects.Receive()),
        0);
    uvo::Ptr<IAntiPhishingServiceFactory> factory;
    ASSERT_EQ(objects->CreateInstance(host_->locator.Get(), IAntiPhishingServiceFactory::kIid,
                                      factory.ReceiveVoid()),
              0);
    std::string error;
    auto file = pelmix::host::FileStream::Open(PELMIX_DEFAULT_KB, &error);
    ASSERT_TRUE(file) << error;
    const std::size_t before = HeapInUse();
    service_ = new uvo::Ptr<IAntiPhishingService>();
    ASSERT_EQ(factory->CreateAntiPhishingService(file.Get(), service_->Receive()), 0);
    heap_used_ = HeapInUse() - before;
  }
  static void TearDownTestSuite() {
    delete service_;
    delete module_;
    delete host_;
  }

  static bool IsWhite(const std::string& domain) {
    bool white = false;
    EXPECT_EQ((*service_)->IsDomainWhite(domain.c_str(), &white), 0) << domain;
    return white;
  }

  static pelmix::host::Host* host_;
  static pelmix::host::Module* module_;
  static uvo::Ptr<IAntiPhishingService>* service_;
  static std::size_t heap_used_;
};

pelmix::host::Host* DefaultKb::host_ = nullptr;
pelmix::host::Module* DefaultKb::module_ = nullptr;
uvo::Ptr<IAntiPhishingService>* DefaultKb::service_ = nullptr;
std::size_t DefaultKb::heap_used_ = 0;

TEST_F(DefaultKb, LoadsThroughTheModuleWithinItsMemoryBudget) {
  ASSERT_TRUE(*service_);
  RecordProperty("service_heap_bytes", std::to_string(heap_used_));
  EXPECT_LT(heap_used_, kServiceHeapBudget);
  const auto verify = RunCli(std::string("kb verify ") + PELMIX_DEFAULT_KB);
  EXPECT_EQ(verify.status, 0);
  EXPECT_EQ(verify.out.rfind("ok ", 0), 0u) << verify.out;
}

TEST_F(DefaultKb, OrganisationsTheirCountryDomainsAndSubdomainsAreWhite) {
  for (const char* domain : {
           "paypal.com",
           "www.paypal.com",
           "paypal.de",
           "www.paypal.co.uk",
           "paypal.fr",
           "accounts.google.com",
           "mail.google.com",
           "www.google.de",
           "google.com.br",
           "login.microsoftonline.com",
           "outlook.live.com",
           "www.office.com",
           "appleid.apple.com",
           "www.icloud.com",
           "www.amazon.co.jp",
           "amazon.de",
           "www.ebay.co.uk",
           "www.ebay.de",  // shared-credential group
           "www.airbnb.fr",
           "www.airbnb.com.br",  // shared-credential group
           "secure.bankofamerica.com",
           "secure.chase.com",
           "www.hsbc.co.uk",
           "www.sparkasse.de",
           "www.ing.nl",
           "www.santander.com.br",
           "www.sberbank.ru",
           "www.poste.it",
           "www.dhl.de",
           "www.royalmail.com",
           "www.correos.es",
           "www.impots.gouv.fr",
           "www.ameli.fr",
           "www.gov.uk",
           "www.gosuslugi.ru",
           "www.binance.com",
           "www.coinbase.com",
           "metamask.io",
           "www.netflix.com",
           "m.facebook.com",
           "www.instagram.com",
           "web.whatsapp.com",
           "www.vodafone.de",
           "en.wikipedia.org",
           "www.bbc.co.uk",
           "www.nytimes.com",
           "wordpress.com",
           "blogger.com",  // listed exact: the domain itself only
       }) {
    EXPECT_TRUE(IsWhite(domain)) << domain;
  }
}

TEST_F(DefaultKb, LookalikesAndSharedContentAreNotWhite) {
  for (const char* domain : {
           // lookalikes of a brand
           "paypal.com.secure-login.example",
           "paypa1.com",
           "login-paypal.com",
           "paypal-login.com",
           "www.paypal.com.evil.net",
           "paypal.com-account.info",
           "xn--pypal-4ve.com",
           "goog1e.com",
           "microsoft-online.com",
           "appleid-verify.com",
           "amazon-security.net",
           "bankofamerica.secure-update.info",
           "dhl-parcel.top",
           // user subdomains of platforms where anyone publishes
           "someone.wordpress.com",
           "someone.blogger.com",
           "login.github.io",
           "evil.blogspot.com",
           "phish.wixsite.com",
           "x.web.app",
           "x.firebaseapp.com",
           "bucket.s3.amazonaws.com",
           "storage.googleapis.com",
           "x.pages.dev",
           "tenant.sharepoint.com",
           "x.netlify.app",
           "x.weebly.com",
           "x.000webhostapp.com",
           "x.herokuapp.com",
           "shop.myshopify.com",
           "x.ipfs.dweb.link",
           "x.vercel.app",
           "x.workers.dev",
           "x.r2.dev",
           // shorteners
           "bit.ly",
           "forms.gle",
           "t.co",
           "t.me",
           "tinyurl.com",
       }) {
    EXPECT_FALSE(IsWhite(domain)) << domain;
  }
}

// "NAME term=... first=W second=ORG third=FLAGS" for a word, through kb query.
std::string Lexeme(const std::string& word) {
  return RunCli(std::string("kb query ") + PELMIX_DEFAULT_KB + " lexeme '" + word + "'").out;
}

std::string Field(const std::string& answer, const std::string& name) {
  const std::size_t at = answer.find(" " + name + "=");
  if (at == std::string::npos) return "absent";
  const std::size_t start = at + name.size() + 2;
  return answer.substr(start, answer.find_first_of(" \n", start) - start);
}

TEST_F(DefaultKb, BrandWordsInSeveralScriptsFindTheirOrganisation) {
  const struct {
    const char* word;
    const char* org;
  } brands[] = {
      {"PayPal", "8001"},    {"BANKOFAMERICA", "1001"}, {"Сбербанк", "1124"},
      {"ЯНДЕКС", "2009"},    {"госуслуги", "9048"},     {"πειραιώς", "1112"},
      {"ゆうちょ", "1150"},  {"ペイペイ", "8016"},      {"クロネコヤマト", "4030"},
      {"ドコモ", "6033"},    {"네이버", "2028"},        {"카카오톡", "5016"},
      {"กสิกรไทย", "1202"},   {"işbank", "1117"},        {"Santander", "1029"},
      {"Sparkasse", "1041"}, {"Binance", "10001"},      {"DHL", "4001"},
  };
  for (const auto& brand : brands) {
    const std::string answer = Lexeme(brand.word);
    EXPECT_EQ(Field(answer, "second"), brand.org) << brand.word << ": " << answer;
  }
  // Ideographs are words of their own, so Chinese and Japanese names are phrases: their
  // heads open phrases (phrase-head ids have bit 23 set).
  for (const char* head : {"支", "楽", "淘"}) {
    const std::string term = Field(Lexeme(head), "term");
    ASSERT_NE(term, "absent") << head;
    EXPECT_GE(std::stoul(term), 0x800000u) << head;
  }
}

TEST_F(DefaultKb, CredentialWordsInTwelveLanguagesAnnounceASecretInput) {
  for (const char* word :
       {"password", "Passwort", "contraseña", "senha", "wachtwoord", "hasło", "пароль", "şifre",
        "パスワード", "kennwort", "비밀번호", "lösenord", "CVV", "PIN"}) {
    const std::string answer = Lexeme(word);
    EXPECT_EQ(Field(answer, "second"), "0") << word << ": " << answer;
    EXPECT_EQ(std::stoul(Field(answer, "third")) & 1u, 1u) << word << ": " << answer;
  }
  // French, Italian and Chinese write it in several words: phrase heads.
  for (const char* head : {"mot", "parola", "密"}) {
    EXPECT_GE(std::stoul(Field(Lexeme(head), "term")), 0x800000u) << head;
  }
}

TEST_F(DefaultKb, SharedContentAddressesAreShareLinks) {
  for (const char* link : {"docs.google.com /forms", "drive.google.com /file",
                           "sites.google.com /view", "forms.office.com /Pages", "ipfs.io /ipfs",
                           "storage.googleapis.com /", "www.dropbox.com /scl"}) {
    EXPECT_EQ(RunCli(std::string("kb query ") + PELMIX_DEFAULT_KB + " sharelink " + link).out,
              "found=1\n")
        << link;
  }
  EXPECT_EQ(
      RunCli(std::string("kb query ") + PELMIX_DEFAULT_KB + " sharelink docs.google.com /").out,
      "found=0\n");
}

TEST_F(DefaultKb, ListedPhishingHostsAreCategorisedAndWhiteHostsAreNot) {
  std::ifstream source(std::string(PELMIX_SOURCE_DIR) + "/kb/categorised_hosts.txt");
  std::vector<std::string> hosts;
  for (std::string line; std::getline(source, line);) {
    if (!line.empty() && line[0] != '#') hosts.push_back(line.substr(0, line.find(' ')));
  }
  ASSERT_GT(hosts.size(), 1000u);
  for (const std::size_t i : {std::size_t{0}, hosts.size() / 3, hosts.size() - 1}) {
    const std::string answer =
        RunCli(std::string("kb query ") + PELMIX_DEFAULT_KB + " categorised " + hosts[i] + " /")
            .out;
    EXPECT_EQ(answer.rfind("found=1 category=1 mask=", 0), 0u) << hosts[i] << ": " << answer;
    EXPECT_FALSE(IsWhite(hosts[i])) << hosts[i];
  }
  EXPECT_EQ(RunCli(std::string("kb query ") + PELMIX_DEFAULT_KB + " categorised paypal.com /").out,
            "found=0 category=0 mask=0 no_paths=0\n");
}

TEST_F(DefaultKb, UntrainedModelsReadTheRealVectors) {
  const struct {
    const char* flow;
    int size;
  } flows[] = {{"web.flow", 214}, {"mail.flow", 260}};
  for (const auto& flow : flows) {
    const std::string path = ::testing::TempDir() + "default_kb_" + flow.flow + ".txt";
    {
      // The real vector, then one float short of it.
      std::ofstream vectors(path);
      for (const int size : {flow.size, flow.size - 1}) {
        for (int i = 0; i < size; ++i) vectors << (i ? " 0" : "0");
        vectors << "\n";
      }
    }
    const auto run =
        RunCli("model run --kb " + std::string(PELMIX_DEFAULT_KB) + " " + flow.flow + " < " + path);
    std::remove(path.c_str());
    std::istringstream lines(run.out);
    std::string whole, shorter;
    std::getline(lines, whole);
    std::getline(lines, shorter);
    EXPECT_NE(whole.find("\t0\t0\t"), std::string::npos) << flow.flow << ": " << whole;
    EXPECT_EQ(shorter.rfind("error\t", 0), 0u) << flow.flow << ": " << shorter;
    EXPECT_NE(shorter.find(std::to_string(flow.size)), std::string::npos) << shorter;
  }
}

}  // namespace
