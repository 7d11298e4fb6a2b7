#include "tools/pelmixd/metrics.h"

#include <cstdio>

namespace pelmix::pelmixd {
namespace {

std::string Number(double value) {
  char text[32];
  std::snprintf(text, sizeof text, "%.9g", value);
  return text;
}

std::string Fixed(double value) {
  char text[48];
  std::snprintf(text, sizeof text, "%.3f", value);
  return text;
}

}  // namespace

Endpoint EndpointOf(std::string_view path) {
  if (path == "/v1/web") return Endpoint::kWeb;
  if (path == "/v1/mail") return Endpoint::kMail;
  if (path == "/v1/white") return Endpoint::kWhite;
  if (path == "/healthz") return Endpoint::kHealth;
  if (path == "/metrics") return Endpoint::kMetrics;
  return Endpoint::kOther;
}

const char* EndpointName(Endpoint endpoint) {
  static constexpr const char* kNames[kEndpointCount] = {"web",     "mail",    "white",
                                                         "healthz", "metrics", "other"};
  return kNames[static_cast<std::size_t>(endpoint)];
}

void Metrics::CountRequest(Endpoint endpoint, int status, double seconds) {
  if (status < 100 || status > 999) status = 0;  // one label for anything odd
  std::lock_guard<std::mutex> lock(mutex_);
  ++requests_[{endpoint, status}];
  Histogram& histogram = latency_[static_cast<std::size_t>(endpoint)];
  std::size_t bucket = 0;
  while (bucket < kLatencyBuckets.size() && seconds > kLatencyBuckets[bucket]) ++bucket;
  ++histogram.counts[bucket];
  histogram.sum += seconds;
  ++histogram.count;
}

void Metrics::CountVerdict(Endpoint endpoint, bool phishing) {
  std::lock_guard<std::mutex> lock(mutex_);
  ++verdicts_[static_cast<std::size_t>(endpoint)][phishing ? 1 : 0];
}

void Metrics::CountReload(bool loaded) {
  std::lock_guard<std::mutex> lock(mutex_);
  ++reloads_[loaded ? 1 : 0];
}

void Metrics::SetKnowledgeBase(std::int64_t dbstamp, double loadedAtSeconds) {
  std::lock_guard<std::mutex> lock(mutex_);
  dbstamp_ = dbstamp;
  loadedAt_ = loadedAtSeconds;
}

std::string Metrics::Render() const {
  std::lock_guard<std::mutex> lock(mutex_);
  std::string out;
  out +=
      "# HELP pelmixd_requests_total HTTP requests answered, by endpoint and status.\n"
      "# TYPE pelmixd_requests_total counter\n";
  for (const auto& [key, count] : requests_) {
    out += "pelmixd_requests_total{endpoint=\"" + std::string(EndpointName(key.first)) +
           "\",code=\"" + std::to_string(key.second) + "\"} " + std::to_string(count) + "\n";
  }
  out +=
      "# HELP pelmixd_errors_total Requests answered with a 4xx or 5xx status.\n"
      "# TYPE pelmixd_errors_total counter\n";
  for (std::size_t e = 0; e < kEndpointCount; ++e) {
    std::uint64_t client = 0, server = 0;
    for (const auto& [key, count] : requests_) {
      if (static_cast<std::size_t>(key.first) != e) continue;
      if (key.second >= 400 && key.second < 500) client += count;
      if (key.second >= 500 || key.second == 0) server += count;
    }
    const std::string name = EndpointName(static_cast<Endpoint>(e));
    out += "pelmixd_errors_total{endpoint=\"" + name + "\",class=\"client\"} " +
           std::to_string(client) + "\n";
    out += "pelmixd_errors_total{endpoint=\"" + name + "\",class=\"server\"} " +
           std::to_string(server) + "\n";
  }
  out +=
      "# HELP pelmixd_verdicts_total Verdicts given, by endpoint.\n"
      "# TYPE pelmixd_verdicts_total counter\n";
  for (const Endpoint e : {Endpoint::kWeb, Endpoint::kMail}) {
    const auto& counts = verdicts_[static_cast<std::size_t>(e)];
    const std::string name = EndpointName(e);
    out += "pelmixd_verdicts_total{endpoint=\"" + name + "\",verdict=\"clean\"} " +
           std::to_string(counts[0]) + "\n";
    out += "pelmixd_verdicts_total{endpoint=\"" + name + "\",verdict=\"phishing\"} " +
           std::to_string(counts[1]) + "\n";
  }
  out +=
      "# HELP pelmixd_request_duration_seconds Time from the request's headers to its answer.\n"
      "# TYPE pelmixd_request_duration_seconds histogram\n";
  for (std::size_t e = 0; e < kEndpointCount; ++e) {
    const Histogram& histogram = latency_[e];
    const std::string name = EndpointName(static_cast<Endpoint>(e));
    std::uint64_t cumulative = 0;
    for (std::size_t b = 0; b <= kLatencyBuckets.size(); ++b) {
      cumulative += histogram.counts[b];
      const std::string le = b < kLatencyBuckets.size() ? Number(kLatencyBuckets[b]) : "+Inf";
      out += "pelmixd_request_duration_seconds_bucket{endpoint=\"" + name + "\",le=\"" + le +
             "\"} " + std::to_string(cumulative) + "\n";
    }
    out += "pelmixd_request_duration_seconds_sum{endpoint=\"" + name + "\"} " +
           Number(histogram.sum) + "\n";
    out += "pelmixd_request_duration_seconds_count{endpoint=\"" + name + "\"} " +
           std::to_string(histogram.count) + "\n";
  }
  out +=
      "# HELP pelmixd_in_flight_requests Requests being answered now.\n"
      "# TYPE pelmixd_in_flight_requests gauge\n"
      "pelmixd_in_flight_requests " +
      std::to_string(inFlight_.load(std::memory_order_relaxed)) + "\n";
  out +=
      "# HELP pelmixd_reloads_total Knowledge-base reloads, by outcome.\n"
      "# TYPE pelmixd_reloads_total counter\n"
      "pelmixd_reloads_total{result=\"loaded\"} " +
      std::to_string(reloads_[1]) +
      "\n"
      "pelmixd_reloads_total{result=\"failed\"} " +
      std::to_string(reloads_[0]) + "\n";
  out +=
      "# HELP pelmixd_kb_stamp The release stamp of the knowledge base in use.\n"
      "# TYPE pelmixd_kb_stamp gauge\n"
      "pelmixd_kb_stamp " +
      std::to_string(dbstamp_) +
      "\n"
      "# HELP pelmixd_kb_loaded_timestamp_seconds When the knowledge base in use was loaded.\n"
      "# TYPE pelmixd_kb_loaded_timestamp_seconds gauge\n"
      "pelmixd_kb_loaded_timestamp_seconds " +
      Fixed(loadedAt_) + "\n";
  return out;
}

}  // namespace pelmix::pelmixd
