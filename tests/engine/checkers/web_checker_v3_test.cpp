// The web checker on loaded knowledge: streams read in 10000-byte pieces, the verdict the same
// whatever the chunking, the loud draw through a fixed clock, trusted and categorised pages.
#include "engine/checkers/web_checker_v3.h"

#include <gtest/gtest.h>

#include <cstring>
#include <random>

#include "engine/checkers/check_factory_v3.h"
#include "engine/kb/kb_loader.h"
#include "host/stream.h"
#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"
#include "tests/support/fixed_model_kb.h"

namespace easy3_impl {
namespace {

using ap::easy2::EngineVerdict;

std::shared_ptr<const WebCheckerV3Data> Knowledge(const std::string& container) {
  auto stream = pelmix::host::MemoryStream::Create(container);
  CheckFactoryV3 factory(std::make_shared<cf::adapters::AntiphishingIOAdapter>(stream.Get()));
  return factory.knowledge();  // outlives the factory
}

const std::string& Page() {
  static const std::string page = [] {
    std::string html =
        "<html><head><title>Sign in to your account</title><script>document.write('<a "
        "href=\"http://evil.example/x\">go</a>');</script></head><body>";
    for (int i = 0; html.size() < 25000; ++i) {
      html += "<p>Row " + std::to_string(i) +
              " &amp; <a href=\"https://www.paypal.com/a\">PayPal</a> password</p>"
              "<form action=\"http://collect.example/\"><input type=password></form>";
    }
    return html + "</body></html>";
  }();
  return page;
}

// Reads what it holds, recording how much was asked each time.
class RecordingStream final : public ap::ReadableFileI {
 public:
  explicit RecordingStream(std::string bytes) : bytes_(std::move(bytes)) {}
  std::int64_t file_seek(std::int64_t position) override { return at_ = position; }
  std::int64_t file_size() override { return static_cast<std::int64_t>(bytes_.size()); }
  std::int64_t file_read(void* buffer, std::uint64_t count) override {
    asked.push_back(count);
    const std::size_t n = std::min<std::size_t>(count, bytes_.size() - at_);
    std::memcpy(buffer, bytes_.data() + at_, n);
    at_ += n;
    return static_cast<std::int64_t>(n);
  }
  std::vector<std::uint64_t> asked;

 private:
  std::string bytes_;
  std::size_t at_ = 0;
};

std::string Describe(const EngineVerdict& v) {
  return std::to_string(v.quiet) + std::to_string(v.phishing) + " " + std::to_string(v.weight) +
         " " + v.target;
}

TEST(WebCheckerV3, SameVerdictWholeByteByByteAndInRandomChunks) {
  const auto knowledge = Knowledge(service_test::Pack(service_test::ExampleEntries()));
  const std::string url = "http://login.evil.example/signin";
  WebCheckerV3 whole(knowledge, url);
  whole.AppendData(Page().data(), Page().size());
  EngineVerdict expected;
  whole.GetVerdict(expected);
  std::vector<float> expectedVector;
  ASSERT_TRUE(whole.LastFeatures(expectedVector));
  EXPECT_EQ(expectedVector.size(), loaders_misc::kWebVectorSize);

  WebCheckerV3 bytes(knowledge, url);
  for (const char& c : Page()) bytes.AppendData(&c, 1);
  std::mt19937 random(7);
  WebCheckerV3 chunks(knowledge, url);
  for (std::size_t at = 0; at < Page().size();) {
    const std::size_t n = std::min<std::size_t>(1 + random() % 700, Page().size() - at);
    chunks.AppendData(Page().data() + at, n);
    at += n;
  }
  auto stream = std::make_shared<RecordingStream>(Page());
  WebCheckerV3 streamed(knowledge, url);
  streamed.AppendStream(stream);
  // Pieces of 10000 bytes until a read comes back empty.
  EXPECT_EQ(stream->asked, (std::vector<std::uint64_t>{10000, 10000, 10000, 10000}));
  EXPECT_EQ(stream.use_count(), 1);  // the checker let go of it

  for (WebCheckerV3* checker : {&bytes, &chunks, &streamed}) {
    EngineVerdict verdict;
    checker->GetVerdict(verdict);
    EXPECT_EQ(Describe(verdict), Describe(expected));
    std::vector<float> vector;
    ASSERT_TRUE(checker->LastFeatures(vector));
    EXPECT_EQ(vector, expectedVector);
  }
}

std::uint64_t clockTime = 0;
std::uint64_t TestClock() { return clockTime; }

TEST(WebCheckerV3, LoudDrawReadsTheCheckersClock) {
  const auto knowledge =
      Knowledge(service_test::AlwaysPhishing("web_loud=1;\nweb_loud_probability=0.5;\n"));
  const std::string page = "<p>hello</p>";
  // Seeds whose draws fall on either side of 0.5, with the byte count as the XOR.
  std::uint32_t below = 0, above = 0;
  for (std::uint32_t seed = 1; below == 0 || above == 0; ++seed) {
    (LoudDrawValue(seed ^ static_cast<std::uint32_t>(page.size())) > 0.5f ? above : below) = seed;
  }
  for (const auto& [seed, quiet] : {std::pair{below, false}, std::pair{above, true}}) {
    clockTime = seed;  // low half the seed, high half 0
    WebCheckerV3 checker(knowledge, "http://login.evil.example/", TestClock);
    checker.AppendData(page.data(), page.size());
    EngineVerdict verdict;
    checker.GetVerdict(verdict);
    EXPECT_TRUE(verdict.phishing);
    EXPECT_EQ(verdict.quiet, quiet) << seed;
  }
}

TEST(WebCheckerV3, TrustedPagesDropTheirDataCategorisedPagesAreBlocked) {
  const auto knowledge =
      Knowledge(service_test::AlwaysPhishing("web_loud=1;\nweb_loud_probability=1;\n"));
  WebCheckerV3 white(knowledge, "https://www.paypal.com/signin");
  white.AppendData(Page().data(), Page().size());
  EngineVerdict verdict;
  white.GetVerdict(verdict);
  EXPECT_EQ(Describe(verdict), "10 0.000000 ");
  std::vector<float> vector;
  EXPECT_FALSE(white.LastFeatures(vector));

  WebCheckerV3 blocked(knowledge, "http://phish.example/login/");
  blocked.AppendData(Page().data(), Page().size());
  blocked.GetVerdict(verdict);
  EXPECT_FALSE(verdict.quiet);
  EXPECT_TRUE(verdict.phishing);
  EXPECT_EQ(verdict.weight, 1.0f);
  EXPECT_EQ(verdict.target.substr(verdict.target.size() - 2), "|c");
  EXPECT_EQ(verdict.target.find("|1 1"), std::string::npos);  // the model is not asked
  EXPECT_EQ(verdict.stampWords[1], 0u);
}

}  // namespace
}  // namespace easy3_impl
