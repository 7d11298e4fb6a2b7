// pelmixd's counters in the Prometheus text format: requests by endpoint and status, verdicts,
// errors, a latency histogram per endpoint, reloads and the knowledge base's stamp. The label
// sets are fixed (endpoints are ours, statuses are three-digit codes), so the counters cannot
// grow with what clients send.
#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <map>
#include <mutex>
#include <string>
#include <string_view>

namespace pelmix::pelmixd {

enum class Endpoint { kWeb, kMail, kWhite, kHealth, kMetrics, kOther };
inline constexpr std::size_t kEndpointCount = 6;

Endpoint EndpointOf(std::string_view path);
const char* EndpointName(Endpoint endpoint);

// Upper bounds of the latency buckets, in seconds (+Inf follows).
inline constexpr std::array<double, 12> kLatencyBuckets = {
    0.0005, 0.001, 0.0025, 0.005, 0.01, 0.025, 0.05, 0.1, 0.25, 0.5, 1, 5};

class Metrics {
 public:
  void CountRequest(Endpoint endpoint, int status, double seconds);
  void CountVerdict(Endpoint endpoint, bool phishing);
  void CountReload(bool loaded);
  void SetKnowledgeBase(std::int64_t dbstamp, double loadedAtSeconds);
  void EnterRequest() { inFlight_.fetch_add(1, std::memory_order_relaxed); }
  void LeaveRequest() { inFlight_.fetch_sub(1, std::memory_order_relaxed); }

  std::string Render() const;

 private:
  struct Histogram {
    std::array<std::uint64_t, kLatencyBuckets.size() + 1> counts{};  // the last one is +Inf
    double sum = 0;
    std::uint64_t count = 0;
  };
  mutable std::mutex mutex_;
  std::map<std::pair<Endpoint, int>, std::uint64_t> requests_;
  std::array<Histogram, kEndpointCount> latency_{};
  std::array<std::array<std::uint64_t, 2>, kEndpointCount> verdicts_{};  // clean, phishing
  std::uint64_t reloads_[2] = {0, 0};                                    // failed, loaded
  std::int64_t dbstamp_ = 0;
  double loadedAt_ = 0;
  std::atomic<std::int64_t> inFlight_{0};
};

}  // namespace pelmix::pelmixd
