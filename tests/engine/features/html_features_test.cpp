#include "engine/features/html_features.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "engine/features/event_recorder.h"
#include "engine/features/feature_layout.h"
#include "engine/features/text_sinks.h"
#include "engine/html/decrunch.h"
#include "tests/support/features_test_support.h"

namespace ap {
namespace {

using namespace html_features;
using features_test::World;

struct Result {
  std::string target;
  std::vector<float> vector;
};

struct Links final : HTMLFeatures::TagAFeaturesI {
  std::vector<std::vector<float>> got;
  bool open = true;
  bool operator()(const std::vector<float>& f) override {
    got.push_back(f);
    return open;
  }
};

class Page {
 public:
  explicit Page(std::string url, HTMLFeatures::TagAFeaturesI* links = nullptr)
      : lexemes_(features_test::Lexemes(features_test::kDefaultLexemes)),
        world_(features_test::DefaultWorld()),
        features_(std::make_unique<HTMLFeatures>(url, world_, lexemes_, links)) {}

  Result Run(const std::string& html, std::size_t chunk = 0, std::mt19937* rng = nullptr) {
    {
      html::Decrunch pipeline(*features_, false);
      std::size_t i = 0;
      while (i < html.size()) {
        std::size_t n = chunk == 0 ? html.size() : chunk;
        if (rng != nullptr) n = 1 + (*rng)() % 64;
        n = std::min(n, html.size() - i);
        pipeline.feed(html.data() + i, n);
        i += n;
      }
      bytes_ = pipeline.byteCount();
    }
    return Vector();
  }
  Result Vector() const {
    Result r;
    features_->GetVector(r.target, r.vector, bytes_);
    return r;
  }
  HTMLFeatures& features() { return *features_; }
  World& world() { return world_; }

 private:
  features_test::LexemeDB lexemes_;
  World world_;
  std::unique_ptr<HTMLFeatures> features_;
  std::uint32_t bytes_ = 0;
};

float Bin(const Result& r, int code, std::size_t segment = 2) {
  return r.vector.at(SegmentBin(segment, code));
}
float Total(const Result& r, int code) {
  float t = 0;
  for (std::size_t s = 0; s < 3; ++s) t += Bin(r, code, s);
  return t;
}

TEST(HTMLFeatures, EmptyPageIsAllZerosButTitle) {
  Page page("http://unknown.example/");
  const Result r = page.Run("");
  ASSERT_EQ(r.vector.size(), kWebVectorSize);
  for (std::size_t i = 0; i < kStyleSheetOrg; ++i)
    EXPECT_EQ(r.vector[i], 0.0f) << FeatureName(i, false);
  EXPECT_EQ(r.vector[kTitleMissing], 1.0f);
  EXPECT_EQ(r.vector[kByteCount], 0.0f);
  EXPECT_EQ(r.target, "");
}

TEST(HTMLFeatures, VectorSizesAndNamedEdges) {
  Page web("https://login.paypal.xyz/signin");
  const Result w = web.Run("<title>PayPal</title><p>Sign in to PayPal</p><input type=password>");
  EXPECT_EQ(w.vector.size(), kWebVectorSize);
  Links links;
  Page mail("", &links);
  const Result m = mail.Run("<p>Verify your account</p>");
  EXPECT_EQ(m.vector.size(), kMailPageVectorSize);
  // Both edges of the web-only ranges: the URL record and the host channels.
  EXPECT_EQ(w.vector[kUrlRecordBegin], 1.0f);      // "paypal" is a lexeme of the host
  EXPECT_EQ(w.vector[kUrlRecordBegin + 4], 2.0f);  // dots in login.paypal.xyz
  EXPECT_EQ(w.vector[kUrlRecordBegin + 3], 16.0f);
  EXPECT_EQ(w.vector[kUrlRecordBegin + 2], 7.0f);  // "/signin"
  // Host channels: "login" (plain lexeme), "paypal" (organisation lexeme), "xyz".
  const float* h = &w.vector[kHostFloatsBegin];
  EXPECT_GT(h[0], 0.0f);                     // plain channel starts on "login"
  EXPECT_EQ(h[kHostChannelSize - 1], 0.0f);  // and ends on "xyz"
  EXPECT_EQ(h[kHostChannelSize], 0.0f);      // organisation channel: not on "login"
  EXPECT_GT(h[kHostChannelSize + 5], 0.0f);  // but on "paypal"
  EXPECT_EQ(w.vector[kWebVectorSize - 1], 0.0f);
  EXPECT_EQ(MailPosition(kByteCount), kUrlRecordBegin);
  EXPECT_EQ(m.vector[MailPosition(kByteCount)], 26.0f);
  EXPECT_EQ(w.target, "PayPal");
}

TEST(HTMLFeatures, InputAfterSensitiveWord) {
  Page near("http://unknown.example/");
  // Text reaches the extractor when a tag flushes it (br here), before the input.
  const Result a = near.Run("<div>Password<br><input type=password>");
  EXPECT_EQ(Total(a, kEvInput), 1.0f);
  EXPECT_EQ(Total(a, kEvInputAfterSensitive), 1.0f);
  Page far("http://unknown.example/");
  const Result b = far.Run("<div>Password one two<br><input type=password>");
  EXPECT_EQ(Total(b, kEvInput), 1.0f);
  EXPECT_EQ(Total(b, kEvInputAfterSensitive), 0.0f);
  Page twice("http://unknown.example/");
  const Result c = twice.Run("<div>password<br><input><input>");  // the word is used once
  EXPECT_EQ(Total(c, kEvInput), 2.0f);
  EXPECT_EQ(Total(c, kEvInputAfterSensitive), 1.0f);
}

TEST(HTMLFeatures, EighthOrganisationCountsAsOther) {
  Page page("http://unknown.example/");
  for (std::uint32_t k = 1; k <= 9; ++k) {
    page.world().orgs[k] = {0, "Bank" + std::to_string(k)};
    page.world().domains["bank" + std::to_string(k) + ".com"] = k;
  }
  std::string html;
  for (int k = 1; k <= 9; ++k)
    for (int hit = 0; hit < 10 - k; ++hit)  // bank1 most hit, bank9 least
      html += "<a href=\"https://bank" + std::to_string(k) + ".com/\">x</a>";
  const Result r = page.Run(html);
  // Slots 5..7 hold the three most-hit domains, slot 12 "other" (the 8th and 9th).
  EXPECT_EQ(Total(r, kEvLinkDomain + 0), 9.0f);
  EXPECT_EQ(Total(r, kEvLinkDomain + 1), 8.0f);
  EXPECT_EQ(Total(r, kEvLinkDomain + 2), 7.0f);
  EXPECT_EQ(Total(r, kEvLinkDomain + 7), 2.0f + 1.0f);
  EXPECT_EQ(r.target, "Bank1 Bank2 Bank3 Bank4 Bank5 Bank6 Bank7");
  // Financial link class for the three, as (1, 0) pairs. No words: every event is at
  // position 0, in the last third.
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(r.vector[kDomainClassesBegin + 2 * i], 1.0f);
    EXPECT_EQ(r.vector[kDomainClassesBegin + 2 * i + 1], 0.0f);
  }
  // Codes 0..3 are normalised to their sum per segment.
  float classes = 0;
  for (int c = 0; c < 4; ++c) classes += Bin(r, c);
  EXPECT_FLOAT_EQ(classes, 1.0f);
}

TEST(HTMLFeatures, LinksResourcesFormsAndScripts) {
  Page page("https://paypal-secure.example/login");
  const Result r = page.Run(
      "<title>Log in</title>"
      "<link rel=stylesheet href=\"https://www.paypalobjects.com/a.css\">"
      "<img src=\"https://www.paypalobjects.com/logo.png\"><img src=\"/local.png\">"
      "<a href=\"https://www.paypal.com/help\">www.paypal.com</a>"
      "<a href=\"http://evil.example/x\">click</a>"
      "<form action=\"https://collect.example/post.php\"><input name=u></form>"
      "<script src=\"https://examplebank.com/lib.js\">var a = 'x';</script>"
      "<iframe src=\"https://frames.example/paypal/\"></iframe>");
  // Codes 34..36 are shares of their sum: 2 resources, 1 foreign organisation's, 1 own.
  EXPECT_EQ(Total(r, kEvResource), 0.5f);
  EXPECT_EQ(Total(r, kEvResourceForeignOrg), 0.25f);
  EXPECT_EQ(Total(r, kEvResourceOwn), 0.25f);
  EXPECT_EQ(Total(r, kEvFormForeign), 1.0f);
  EXPECT_EQ(Total(r, kEvAnchorUnknownHost), 1.0f);
  EXPECT_EQ(Total(r, kEvAnchorTextUrl), 1.0f);
  EXPECT_EQ(Total(r, kEvAnchorTextHost), 1.0f);
  EXPECT_EQ(Total(r, kEvScriptSrcFinancial), 1.0f);
  EXPECT_EQ(Total(r, kEvFrame), 1.0f);
  EXPECT_EQ(r.vector[kStyleSheetOrg], 1.0f);
  EXPECT_EQ(r.vector[kTitleMissing], 0.0f);
  EXPECT_NE(r.target.find("PayPal"), std::string::npos);
  EXPECT_NE(r.target.find("Example_Bank"), std::string::npos);
}

TEST(HTMLFeatures, OwnSiteByRegistrableDomainOrOrganisation) {
  Page page("https://shop.paypal.xyz/");  // listed for PayPal, but not white
  const Result r = page.Run(
      "<img src=\"https://cdn.paypal.xyz/a.png\"><img src=\"https://paypal.com/b.png\">"
      "<form action=\"https://www.paypal.xyz/p\"></form>");
  EXPECT_FALSE(page.features().trusted());
  // Both own (same registrable domain; same organisation): 34 and 36 share the sum.
  EXPECT_EQ(Total(r, kEvResourceOwn), 0.5f);
  EXPECT_EQ(Total(r, kEvResourceForeignOrg), 0.0f);
  EXPECT_EQ(Total(r, kEvFormForeign), 0.0f);
}

TEST(HTMLFeatures, TrustedPages) {
  EXPECT_TRUE(Page("https://www.paypal.com/signin").features().trusted());
  EXPECT_TRUE(Page("http://192.168.1.10/").features().trusted());
  EXPECT_FALSE(Page("http://8.8.8.8/").features().trusted());
  EXPECT_FALSE(Page("https://www.paypal.xyz/").features().trusted());
  Page shared("https://www.paypal.com/");
  shared.world().shareLinks.insert({"forms.popular.com", "/f"});
  shared.world().domains["popular.com"] = 105;
  features_test::LexemeDB none;
  World& w = shared.world();
  HTMLFeatures form("https://forms.popular.com/f/abc?x=1", w, none);
  EXPECT_FALSE(form.trusted());  // content anyone can publish is never trusted
  // A host listed with "/" publishes under every path; its siblings stay trusted.
  w.shareLinks.insert({"gist.popular.com", "/"});
  for (const char* url : {"https://gist.popular.com/", "https://gist.popular.com/user/1a2b",
                          "https://gist.popular.com/user/?q=1"}) {
    EXPECT_FALSE(HTMLFeatures(url, w, none).trusted()) << url;
  }
  EXPECT_TRUE(HTMLFeatures("https://www.popular.com/user/1a2b", w, none).trusted());
  EXPECT_TRUE(HTMLFeatures("https://forms.popular.com/g/abc", w, none).trusted());
  w.categorised.insert({"phish.example", "/login"});
  HTMLFeatures phish("http://phish.example/login", w, none);
  EXPECT_TRUE(phish.pageCategorised());
}

TEST(HTMLFeatures, MailLinks) {
  Links links;
  Page mail("", &links);
  EXPECT_TRUE(mail.features().analyseLink("https://www.paypal.com/x"));
  EXPECT_TRUE(links.got.empty());
  EXPECT_FALSE(mail.features().analyseLink("http://login-paypal.example/x"));
  ASSERT_EQ(links.got.size(), 1u);
  EXPECT_EQ(links.got[0].size(), 10u);
  EXPECT_EQ(links.got[0][0], 1.0f);  // host has lexemes
  links.open = false;
  mail.Run("<a href=\"http://a.example/\">PayPal</a><a href=\"http://b.example/\">x</a>");
  ASSERT_EQ(links.got.size(), 2u);  // the second anchor is not sent: the consumer said stop
  EXPECT_EQ(links.got[1].size(), 10u);
  EXPECT_EQ(links.got[1][7], 1.0f);  // anchor text names an organisation
}

TEST(HTMLFeatures, LongPagesFoldAndKeepTotals) {
  Page page("http://unknown.example/");
  std::string html = "<p>";
  for (int i = 0; i < 12000; ++i) html += "login password ";
  html += "</p>";
  const Result r = page.Run(html);
  // login (25) and password (30) both weigh up to 30: 12000 x 55 in code 39.
  EXPECT_NEAR(Total(r, kEvLexeme), 660000.0f, 10.0f);
  // Evenly spread words: each third holds a third of them.
  EXPECT_NEAR(Bin(r, kEvLexeme, 0), 220000.0f, 60.0f);
  EXPECT_NEAR(Bin(r, kEvLexeme, 2), 220000.0f, 60.0f);
}

TEST(HTMLFeatures, GetVectorDoesNotChangeTheExtractor) {
  const std::string first = "<title>PayPal</title><p>verify your account ";
  const std::string rest = "sign in</p><a href=\"https://paypal.com/\">paypal</a>";
  Page once("https://x.example/");
  const Result whole = once.Run(first + rest);
  Page twice("https://x.example/");
  html::Decrunch pipeline(twice.features(), false);
  pipeline.feed(first.data(), first.size());
  std::string target;
  std::vector<float> v;
  twice.features().GetVector(target, v, 0);
  twice.features().GetVector(target, v, 0);
  pipeline.feed(rest.data(), rest.size());
  twice.features().GetVector(target, v, pipeline.byteCount());
  EXPECT_EQ(v, whole.vector);
  EXPECT_EQ(target, whole.target);
}

TEST(HTMLFeatures, ChunkInvariance) {
  std::string html =
      "<html><head><title>Sign in &ndash; PayPal</title>"
      "<meta name=description content=\"PayPal account\">"
      "<link rel=stylesheet href=\"//www.paypalobjects.com/s.css\"></head><body>"
      "<h1>Verify your account</h1><p>Unusual activity. Please sign in.</p>"
      "<form action=\"https://collect.example/p.php\">Password <input type=password>"
      "<select><option>x</select></form>"
      "<a href=\"https://www.paypal.com/help\">Help</a><a href=\"/x\">www.paypal.com</a>"
      "<script>var u='https://examplebank.com/api'; document.write('<p>urgent login</p>');"
      "</script><iframe src=\"https://f.example/paypal\"></iframe>"
      "<img src=\"data:image/png;base64,AAAA\"><p>\xd0\x9f\xd0\xb0\xd1\x80\xd0\xbe\xd0\xbb\xd1\x8c "
      "caf&eacute; \xe5\xaf\x86\xe7\xa0\x81</p></body></html>";
  for (int i = 0; i < 40; ++i) html += "<p>secure login " + std::to_string(i) + "</p>";
  Page reference("https://paypal-login.example/verify");
  const Result whole = reference.Run(html);
  Page bytes("https://paypal-login.example/verify");
  const Result byByte = bytes.Run(html, 1);
  EXPECT_EQ(byByte.vector, whole.vector);
  EXPECT_EQ(byByte.target, whole.target);
  std::mt19937 rng(12);
  for (int round = 0; round < 20; ++round) {
    Page chunks("https://paypal-login.example/verify");
    const Result r = chunks.Run(html, 0, &rng);
    EXPECT_EQ(r.vector, whole.vector) << "round " << round;
    EXPECT_EQ(r.target, whole.target);
  }
}

// Records every match the observer hears: the term of a lexeme's statistics, or the index of
// a phrase (as "p" and its index).
struct MatchLog final : LexemeObserverI {
  explicit MatchLog(const features_test::LexemeDB& db) : db(db) {}
  void lexeme(const lex::LexemeStats& stats) override {
    got.push_back(std::to_string(db.TermOfStats(&stats)));
  }
  void phrase(const html_features::LexemeDB::Phrase& p) override {
    got.push_back("p" + std::to_string(&p - db.phrases().data()));
  }
  const features_test::LexemeDB& db;
  std::vector<std::string> got;
};

TEST(HTMLFeatures, LexemeObserverHearsEveryMatchWhateverTheChunking) {
  const features_test::LexemeDB db = features_test::Lexemes(features_test::kDefaultLexemes);
  const auto term = [&](const char* word) { return std::to_string(db.FindTerm(word)); };
  std::string html =
      "<html><head><title>PayPal</title></head><body><div>Verify your account now</div>"
      "<div>urgent: sign in</div><script>var a='secure login';</script><br>"
      "<a href=\"/x\">password</a><br></body></html>";
  for (int i = 0; i < 30; ++i) html += "<div>login " + std::to_string(i) + "</div>";
  html += "<br>";  // page text reaches the extractor when a block tag flushes it
  features_test::World world = features_test::DefaultWorld();
  auto run = [&](std::size_t chunk, std::mt19937* rng) {
    MatchLog log(db);
    HTMLFeatures features("https://paypal-login.example/verify", world, db);
    features.setLexemeObserver(&log);
    {
      html::Decrunch pipeline(features, false);
      for (std::size_t i = 0; i < html.size();) {
        std::size_t n = rng != nullptr ? 1 + (*rng)() % 64 : chunk;
        n = std::min(n, html.size() - i);
        pipeline.feed(html.data() + i, n);
        i += n;
      }
    }
    features.setLexemeObserver(nullptr);
    return log.got;
  };
  const std::vector<std::string> whole = run(html.size(), nullptr);
  const auto count = [&](const std::string& id) {
    return std::count(whole.begin(), whole.end(), id);
  };
  EXPECT_EQ(count(term("paypal")), 1);  // the title
  EXPECT_EQ(count(term("verify")), 1);  // a phrase head only: heard as its head term
  EXPECT_EQ(count(term("account")), 1);
  EXPECT_EQ(count(term("urgent")), 1);
  EXPECT_EQ(count(term("in")), 1);        // weight 0: not weighed, still heard
  EXPECT_EQ(count(term("secure")), 1);    // script text
  EXPECT_EQ(count(term("login")), 31);    // script text and 30 blocks
  EXPECT_EQ(count(term("password")), 2);  // anchor text: as page text and as the anchor's own
  EXPECT_EQ(count("p0"), 1);              // sign(1)in
  EXPECT_EQ(count("p1"), 1);              // verify(2)account
  EXPECT_EQ(run(1, nullptr), whole);
  std::mt19937 rng(5);
  for (int round = 0; round < 10; ++round) EXPECT_EQ(run(0, &rng), whole) << "round " << round;
}

TEST(HTMLFeatures, HostileBudgets) {
  Page page("http://unknown.example/");
  std::string html;
  for (int i = 0; i < 20000; ++i)
    html += "<a href=\"https://h" + std::to_string(i) + ".example/\">verify</a>";
  const Result r = page.Run(html);
  EXPECT_EQ(Total(r, kEvAnchorUnknownHost), 20000.0f);
  EXPECT_EQ(r.vector.size(), kWebVectorSize);
}

TEST(HTMLFeatures, UsableAfterAFailedLookup) {
  const std::string html =
      "<a href=\"https://www.paypal.com/\">PayPal</a><p>verify your account</p><br>"
      "<a href=\"https://examplebank.com/\">bank</a>";
  Page failing("http://unknown.example/");
  failing.world().failAt = 1;  // the first anchor's look-up
  html::Decrunch pipeline(failing.features(), false);
  EXPECT_THROW(pipeline.feed(html.data(), html.size()), std::runtime_error);
  std::string target;
  std::vector<float> v;
  failing.features().GetVector(target, v, 0);
  EXPECT_EQ(v.size(), kWebVectorSize);
  // A fresh document through the same extractor still counts its links.
  html::Decrunch again(failing.features(), false);
  again.feed(html.data(), html.size());
  failing.features().GetVector(target, v, again.byteCount());
  EXPECT_NE(target.find("Example_Bank"), std::string::npos);
}

TEST(FeatureLayout, NamesAreUniqueAndComplete) {
  std::set<std::string> web, mail;
  for (std::size_t i = 0; i < kWebVectorSize; ++i)
    EXPECT_TRUE(web.insert(FeatureName(i, false)).second) << i;
  for (std::size_t i = 0; i < kMailVectorSize; ++i)
    EXPECT_TRUE(mail.insert(FeatureName(i, true)).second) << i;
  EXPECT_EQ(FeatureName(kWebVectorSize, false), "");
  EXPECT_EQ(FeatureName(0, false), "seg1.anchor_to_org_financial");
  EXPECT_EQ(FeatureName(146, false), "seg3.input");
  EXPECT_EQ(FeatureName(kMailPageVectorSize, true), "mail.dangerous_attachment");
  EXPECT_EQ(FeatureName(kMailVectorSize - 1, true), "mail.link8.9");
  EXPECT_EQ(SegmentBin(1, kEvInput), 2 * kBinsPerSegment - 1);
  EXPECT_EQ(SegmentBin(0, 8), std::size_t(-1));
}

TEST(EventRecorder, FoldSharesStraddlingSegmentsByPosition) {
  EventRecorder rec;
  for (std::size_t i = 0; i < 3 * EventRecorder::kCapacity + 17; ++i) {
    rec.advance();
    rec.add(kEvInput);
  }
  const auto s = rec.finish();
  const float total = s.bins[0][kEvInput] + s.bins[1][kEvInput] + s.bins[2][kEvInput];
  EXPECT_NEAR(total, 3 * EventRecorder::kCapacity + 17, 0.5);
  EXPECT_NEAR(s.bins[0][kEvInput], s.bins[1][kEvInput], 2.0);
  EXPECT_EQ(s.positions[0] + s.positions[1] + s.positions[2], rec.position());
  rec.addWeighted(kEvLexeme, 31.0f);
  rec.addWeighted(kEvLexeme, 66.5f);
  rec.addWeighted(kEvLexeme, 0.0f);
  rec.addWeighted(kEvLexeme, std::nanf(""));
  const auto t = rec.finish();
  EXPECT_EQ(t.bins[2][kEvLexeme + 1], 31.0f);
  EXPECT_EQ(t.bins[2][kEvLexeme + 2], 66.5f);
  EXPECT_EQ(t.bins[2][kEvLexeme], 0.0f);
}

}  // namespace
}  // namespace ap
