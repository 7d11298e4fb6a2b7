// Mail checking end to end through the module's exports and the reference host: session
// numbering shared with web sessions, what each kind of part adds to the judged vector (read
// from the features trace line), attachments by name and type, the link budget, white links,
// images, null arguments, failing host streams and known phishing links.
#include <gtest/gtest.h>
#include <zlib.h>

#include <sstream>
#include <string>
#include <vector>

#include "engine/features/feature_layout.h"
#include "framework/uvo/anti_phishing.h"
#include "framework/uvo/result.h"
#include "host/host.h"
#include "host/module_loader.h"
#include "host/stream.h"
#include "tests/support/example_kb.h"

namespace {

using namespace cf::services::anti_phishing;
using html_features::kMailLinkBlockSize;
using html_features::kMailPageVectorSize;
using html_features::kMailVectorSize;
using service_test::Entries;
using service_test::ExampleEntries;
using service_test::Pack;

constexpr std::size_t kDangerous = kMailPageVectorSize;  // first value of the link block

// The example knowledge base with a mail model that says phishing exactly when the
// dangerous-attachment feature is set: both outputs sigmoid(-20 + 40 x).
std::string DangerousAttachmentModel() {
  Entries entries = ExampleEntries();
  entries["mail.flow"] = R"({"convs":{"n":{"type":"neur","src":"att.net"}},)"
                         R"("flow":[{"name":"o","input":[[179,180]],"conv":"n"}]})";
  entries["att.net"] = "1 2 2 -20 40 -20 40";
  return Pack(entries);
}

// A host stream whose reads fail.
class FailingStream final : public uvo::ObjectImpl<FailingStream, uvo::IStream> {
 public:
  uvo::result_t Read(void*, std::uint32_t, std::uint32_t*) override { return uvo::kErrUnspecified; }
  uvo::result_t Write(const void*, std::uint32_t, std::uint32_t*) override {
    return uvo::kErrUnspecified;
  }
  uvo::result_t Seek(std::uint32_t, std::int64_t, std::uint64_t*) override {
    return uvo::kErrUnspecified;
  }
  uvo::result_t Tell(std::uint64_t*) override { return uvo::kErrUnspecified; }
  uvo::result_t GetSize(std::uint64_t*) override { return uvo::kErrUnspecified; }
};

uvo::Ptr<pelmix::host::MemoryStream> Stream(const std::string& bytes) {
  return pelmix::host::MemoryStream::Create(bytes);
}

// A one-page PDF whose content stream (compressed, as writers store it) is `content`.
std::string Pdf(const std::string& content) {
  uLongf size = compressBound(content.size());
  std::string packed(size, '\0');
  compress2(reinterpret_cast<Bytef*>(packed.data()), &size,
            reinterpret_cast<const Bytef*>(content.data()), content.size(), 9);
  packed.resize(size);
  return "%PDF-1.4\n4 0 obj\n<< /Length " + std::to_string(size) +
         " /Filter /FlateDecode >>\nstream\n" + packed +
         "\nendstream\nendobj\ntrailer\n<< >>\n"
         "%%EOF\n";
}

class MailSessionAbi : public ::testing::Test {
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
    ASSERT_EQ(service_->GetMailSessionFactory(mail_.Receive()), 0);
  }

  uvo::Ptr<IMailSession> Open(int level = 2) {
    SessionSettings settings{level};
    uvo::Ptr<IMailSession> session;
    EXPECT_EQ(mail_->CreateSession(&settings, session.Receive()), 0);
    return session;
  }

  // The vector the session's last details judged, from its features trace line.
  std::vector<float> Judged(IMailSession* session) {
    host_.tracer->Clear();
    HeuristicVerdictInfo info{};
    EXPECT_EQ(session->GetHeuristicVerdictInfo(&info), 0);
    for (const std::string& line : host_.tracer->Texts()) {
      const std::size_t at = line.find("GetHeuristicVerdictInfo: features:");
      if (at == std::string::npos) continue;
      std::istringstream in(line.substr(at + 35));
      std::vector<float> v;
      float f;
      while (in >> f) v.push_back(f);
      return v;
    }
    ADD_FAILURE() << "no features line";
    return {};
  }

  Verdict VerdictOf(IMailSession* session) {
    Verdict v{};
    EXPECT_EQ(session->GetVerdict(&v), 0);
    return v;
  }

  pelmix::host::Host host_;
  pelmix::host::Module module_{PELMIX_MODULE_PATH};
  uvo::Ptr<IAntiPhishingServiceFactory> factory_;
  uvo::Ptr<IAntiPhishingService> service_;
  uvo::Ptr<IMailSessionFactory> mail_;
};

TEST_F(MailSessionAbi, NumberedWithWebSessionsAndTraced) {
  Load(Pack(ExampleEntries()));
  uvo::Ptr<IHttpSessionFactory> web;
  ASSERT_EQ(service_->GetHttpSessionFactory(web.Receive()), 0);
  SessionSettings settings{2};
  uvo::Ptr<IHttpSession> page;
  ASSERT_EQ(web->CreateSession(&settings, "http://a.example/", nullptr, page.Receive()), 0);
  auto first = Open(3);
  auto second = Open();
  host_.tracer->Clear();
  HeuristicVerdictInfo info{};
  ASSERT_EQ(first->GetHeuristicVerdictInfo(&info), 0);
  const std::string line = host_.tracer->Texts().at(0);
  const std::string head = "anti_phishing_service\tmail session ";
  ASSERT_EQ(line.rfind(head, 0), 0u) << line;
  const unsigned n = std::stoul(line.substr(head.size()));
  EXPECT_NE(line.find("\tGetHeuristicVerdictInfo: protection level: 3 "), std::string::npos)
      << line;
  host_.tracer->Clear();
  ASSERT_EQ(second->GetHeuristicVerdictInfo(&info), 0);
  EXPECT_EQ(host_.tracer->Texts().at(0).rfind(head + std::to_string(n + 1) + "\t", 0), 0u);
  SessionSettings bad{4};
  IMailSession* none = nullptr;
  EXPECT_EQ(mail_->CreateSession(&bad, &none), uvo::kErrUnspecified);
  EXPECT_EQ(none, nullptr);
}

TEST_F(MailSessionAbi, NoLinksGiveAnEmptyLinkBlock) {
  Load(Pack(ExampleEntries()));
  auto session = Open();
  ASSERT_EQ(session->AddText(Stream("Your parcel is waiting. Pay the fee today.").Get()), 0);
  const std::vector<float> v = Judged(session.Get());
  ASSERT_EQ(v.size(), kMailVectorSize);
  for (std::size_t i = kMailPageVectorSize; i < kMailVectorSize; ++i) EXPECT_EQ(v[i], 0.0f) << i;
}

TEST_F(MailSessionAbi, DangerousAttachmentsDecideTheModel) {
  Load(DangerousAttachmentModel());
  struct Case {
    const char* name;
    const char* type;
    bool dangerous;
  };
  const Case cases[] = {{"setup.exe", "application/octet-stream", true},
                        {"INVOICE.EXE", "application/octet-stream", true},
                        {"disk.Iso", "application/x-iso9660-image", true},
                        {"notes.txt", "text/plain", false},
                        {"exe", "application/octet-stream", false},
                        {"a.exe.zip", "application/zip", false}};
  for (const Case& c : cases) {
    auto session = Open();
    ASSERT_EQ(session->AddAttachment(c.name, c.type, Stream("MZ\x90\x00 binary").Get()), 0);
    const std::vector<float> v = Judged(session.Get());
    ASSERT_EQ(v.size(), kMailVectorSize);
    EXPECT_EQ(v[kDangerous], c.dangerous ? 1.0f : 0.0f) << c.name;
    EXPECT_EQ(VerdictOf(session.Get()).phishingDetected, c.dangerous) << c.name;
    // An executable adds no text.
    if (c.dangerous) {
      EXPECT_EQ(v[html_features::MailPosition(html_features::kByteCount)], 0.0f) << c.name;
    }
  }
}

TEST_F(MailSessionAbi, PartsAreSniffedAndClassified) {
  Load(Pack(ExampleEntries()));
  const std::string html = " \r\n\t<p>PayPal</p><br><a href=\"http://x.example/\">PayPal</a>";
  auto anchorsIn = [&](IMailSession* s) {
    const std::vector<float> v = Judged(s);
    // A body link vector: its host length is not 0.
    return v.size() == kMailVectorSize && v[kDangerous + 1 + 3] != 0.0f;
  };
  auto html1 = Open();  // leading blanks, then '<': HTML
  ASSERT_EQ(html1->AddText(Stream(html).Get()), 0);
  EXPECT_TRUE(anchorsIn(html1.Get()));
  auto text1 = Open();  // a letter first: plain text, markup and all
  ASSERT_EQ(text1->AddText(Stream("Hi <a href=\"http://x.example/\">PayPal</a>").Get()), 0);
  EXPECT_FALSE(anchorsIn(text1.Get()));
  auto att = Open();  // "text/html" with a parameter is text, sniffed like a text part
  ASSERT_EQ(att->AddAttachment("a.htm", "text/html; charset=utf-8", Stream(html).Get()), 0);
  EXPECT_TRUE(anchorsIn(att.Get()));
  auto exact = Open();  // exactly "text/html": HTML without sniffing
  ASSERT_EQ(exact->AddAttachment("a.htm", "text/html",
                                 Stream("x<a href=\"http://y.example/\">"
                                        "q</a>")
                                     .Get()),
            0);
  EXPECT_TRUE(anchorsIn(exact.Get()));
  // A PDF by its name and by its type: its text reaches the extractor.
  const std::string pdf = Pdf("BT\n/F1 12 Tf\n(Your PayPal account) Tj\nET\n");
  for (const auto& [name, type] :
       {std::pair{"report.pdf", "application/octet-stream"}, std::pair{"x", "application/pdf"}}) {
    auto s = Open();
    ASSERT_EQ(s->AddAttachment(name, type, Stream(pdf).Get()), 0);
    HeuristicVerdictInfo info{};
    ASSERT_EQ(s->GetHeuristicVerdictInfo(&info), 0);
    EXPECT_EQ(std::string(info.target.view()).rfind("PayPal", 0), 0u) << name;
  }
}

TEST_F(MailSessionAbi, LinksWhiteAndBudgeted) {
  Load(Pack(ExampleEntries()));
  auto session = Open();
  bool white = false;
  ASSERT_EQ(session->AddUrl("https://www.paypal.com/help", &white), 0);
  EXPECT_TRUE(white);
  // The first anchor of a later HTML part still goes to the body link block.
  ASSERT_EQ(session->AddText(Stream("<a href=\"http://paypal-login.example/\">x</a>").Get()), 0);
  for (int i = 0; i < 8; ++i) {
    ASSERT_EQ(session->AddUrl(("http://h" + std::to_string(i) + ".example/").c_str(), &white), 0);
    EXPECT_FALSE(white) << i;
  }
  ASSERT_EQ(session->AddUrl("http://ninth.example/", &white), 0);
  EXPECT_TRUE(white);  // 80 values gathered: nothing more is taken
  const std::vector<float> v = Judged(session.Get());
  ASSERT_EQ(v.size(), kMailVectorSize);
  EXPECT_EQ(v[kDangerous + 1], 1.0f);  // the anchor's host has lexemes ("paypal", "login")
  // Body link 10 values, then 8 URLs of 10 values: 81 in all, the rest cut.
  EXPECT_EQ(v[kDangerous + 11 + 3], std::string("h0.example").size());
}

TEST_F(MailSessionAbi, ImagesAndTheReservedSlotChangeNothing) {
  Load(Pack(ExampleEntries()));
  auto plain = Open();
  auto withImages = Open();
  for (IMailSession* s : {plain.Get(), withImages.Get()}) {
    ASSERT_EQ(s->SetMessageSubject("Verify your PayPal account"), 0);
    ASSERT_EQ(s->AddText(Stream("<p>Sign in now</p>").Get()), 0);
  }
  ASSERT_EQ(withImages->AddImage(Stream("\x89PNG....").Get()), 0);
  ASSERT_EQ(withImages->Reserved(), 0);
  ASSERT_EQ(withImages->AddAttachment("logo.png", "image/png", Stream("\x89PNG").Get()), 0);
  EXPECT_EQ(Judged(plain.Get()), Judged(withImages.Get()));
}

TEST_F(MailSessionAbi, NullArgumentsAndFailingStreams) {
  Load(Pack(ExampleEntries()));
  auto s = Open();
  const uvo::result_t kCheck = static_cast<uvo::result_t>(0x80000040);
  auto data = Stream("x");
  EXPECT_EQ(s->AddText(nullptr), kCheck);
  EXPECT_EQ(s->AddImage(nullptr), kCheck);
  EXPECT_EQ(s->AddAttachment(nullptr, "text/plain", data.Get()), kCheck);
  auto untouched = Stream("never read");
  EXPECT_EQ(s->AddAttachment("a.txt", nullptr, untouched.Get()), kCheck);
  EXPECT_EQ(s->AddAttachment("a.txt", "text/plain", nullptr), kCheck);
  bool out = true;
  EXPECT_EQ(s->AddUrl("", &out), kCheck);
  EXPECT_EQ(s->AddUrl(nullptr, &out), kCheck);
  EXPECT_TRUE(out);  // left unwritten
  EXPECT_EQ(s->SetMessageSubject(nullptr), kCheck);
  EXPECT_EQ(s->GetVerdict(nullptr), uvo::kErrInvalidArgument);
  EXPECT_EQ(s->GetHeuristicVerdictInfo(nullptr), uvo::kErrInvalidArgument);
  // A failing stream ends that operation only.
  auto failing = uvo::Ptr<FailingStream>::Adopt(new FailingStream);
  EXPECT_LT(s->AddText(failing.Get()), 0);
  ASSERT_EQ(s->AddText(Stream("<p>still here</p>").Get()), 0);
  EXPECT_EQ(Judged(s.Get()).size(), kMailVectorSize);
}

TEST_F(MailSessionAbi, KnownPhishingLinksDecide) {
  Load(Pack(ExampleEntries()));
  auto s = Open();
  bool white = true;
  ASSERT_EQ(s->AddUrl("http://phish.example/login/now", &white), 0);
  HeuristicVerdictInfo info{};
  ASSERT_EQ(s->GetHeuristicVerdictInfo(&info), 0);
  EXPECT_FALSE(info.quiet);
  EXPECT_FLOAT_EQ(info.weight, 1.0f);
  EXPECT_TRUE(VerdictOf(s.Get()).phishingDetected);
  const std::string target(info.target.view());
  ASSERT_GE(target.size(), 2u);
  EXPECT_EQ(target.substr(target.size() - 2), "|c");
}

}  // namespace
