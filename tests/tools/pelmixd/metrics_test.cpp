// pelmixd's metrics text: counters by label, cumulative histogram buckets, error classes.
#include "tools/pelmixd/metrics.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using namespace pelmix::pelmixd;

bool Has(const std::string& text, const std::string& line) {
  return text.find(line + "\n") != std::string::npos;
}

TEST(PelmixdMetrics, CountsRequestsVerdictsErrorsAndLatency) {
  Metrics metrics;
  metrics.CountRequest(Endpoint::kWeb, 200, 0.0004);   // first bucket
  metrics.CountRequest(Endpoint::kWeb, 200, 0.003);    // le 0.005
  metrics.CountRequest(Endpoint::kWeb, 413, 0.0005);   // on a bound: that bucket
  metrics.CountRequest(Endpoint::kOther, 404, 100.0);  // past the last bound: +Inf only
  metrics.CountRequest(Endpoint::kWhite, 12345, 0.0);  // not a status: one label for it
  metrics.CountVerdict(Endpoint::kWeb, true);
  metrics.CountVerdict(Endpoint::kWeb, false);
  metrics.CountVerdict(Endpoint::kWeb, false);
  metrics.CountReload(true);
  metrics.CountReload(false);
  metrics.CountReload(false);
  metrics.SetKnowledgeBase(20240611, 1700000000.25);
  metrics.EnterRequest();
  const std::string text = metrics.Render();

  EXPECT_TRUE(Has(text, "pelmixd_requests_total{endpoint=\"web\",code=\"200\"} 2"));
  EXPECT_TRUE(Has(text, "pelmixd_requests_total{endpoint=\"web\",code=\"413\"} 1"));
  EXPECT_TRUE(Has(text, "pelmixd_requests_total{endpoint=\"white\",code=\"0\"} 1"));
  EXPECT_TRUE(Has(text, "pelmixd_errors_total{endpoint=\"web\",class=\"client\"} 1"));
  EXPECT_TRUE(Has(text, "pelmixd_errors_total{endpoint=\"web\",class=\"server\"} 0"));
  EXPECT_TRUE(Has(text, "pelmixd_errors_total{endpoint=\"white\",class=\"server\"} 1"));
  EXPECT_TRUE(Has(text, "pelmixd_verdicts_total{endpoint=\"web\",verdict=\"clean\"} 2"));
  EXPECT_TRUE(Has(text, "pelmixd_verdicts_total{endpoint=\"web\",verdict=\"phishing\"} 1"));
  EXPECT_TRUE(
      Has(text, "pelmixd_request_duration_seconds_bucket{endpoint=\"web\",le=\"0.0005\"} 2"));
  EXPECT_TRUE(
      Has(text, "pelmixd_request_duration_seconds_bucket{endpoint=\"web\",le=\"0.0025\"} 2"));
  EXPECT_TRUE(
      Has(text, "pelmixd_request_duration_seconds_bucket{endpoint=\"web\",le=\"0.005\"} 3"));
  EXPECT_TRUE(Has(text, "pelmixd_request_duration_seconds_bucket{endpoint=\"web\",le=\"+Inf\"} 3"));
  EXPECT_TRUE(Has(text, "pelmixd_request_duration_seconds_count{endpoint=\"web\"} 3"));
  EXPECT_TRUE(Has(text, "pelmixd_request_duration_seconds_bucket{endpoint=\"other\",le=\"5\"} 0"));
  EXPECT_TRUE(
      Has(text, "pelmixd_request_duration_seconds_bucket{endpoint=\"other\",le=\"+Inf\"} 1"));
  EXPECT_TRUE(Has(text, "pelmixd_request_duration_seconds_sum{endpoint=\"other\"} 100"));
  EXPECT_TRUE(Has(text, "pelmixd_reloads_total{result=\"loaded\"} 1"));
  EXPECT_TRUE(Has(text, "pelmixd_reloads_total{result=\"failed\"} 2"));
  EXPECT_TRUE(Has(text, "pelmixd_kb_stamp 20240611"));
  EXPECT_TRUE(Has(text, "pelmixd_kb_loaded_timestamp_seconds 1700000000.250"));
  EXPECT_TRUE(Has(text, "pelmixd_in_flight_requests 1"));
  // Every sample line belongs to a declared family.
  for (std::size_t begin = 0; begin < text.size();) {
    const std::size_t end = text.find('\n', begin);
    const std::string line = text.substr(begin, end - begin);
    begin = end + 1;
    if (line[0] == '#') continue;
    std::string family = line.substr(0, line.find_first_of("{ "));
    for (const char* suffix : {"_bucket", "_sum", "_count"}) {
      const std::string s = suffix;
      if (family.size() > s.size() && family.ends_with(s) &&
          family.starts_with("pelmixd_request_duration_seconds")) {
        family.resize(family.size() - s.size());
      }
    }
    EXPECT_NE(text.find("# TYPE " + family + " "), std::string::npos) << line;
  }
}

TEST(PelmixdMetrics, EndpointsByPath) {
  EXPECT_EQ(EndpointOf("/v1/web"), Endpoint::kWeb);
  EXPECT_EQ(EndpointOf("/v1/mail"), Endpoint::kMail);
  EXPECT_EQ(EndpointOf("/v1/web/"), Endpoint::kOther);
  EXPECT_EQ(EndpointOf("/metrics"), Endpoint::kMetrics);
  EXPECT_STREQ(EndpointName(Endpoint::kHealth), "healthz");
}

}  // namespace
