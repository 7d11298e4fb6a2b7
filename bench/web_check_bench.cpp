// The whole web check as a host sees it: a session from the service's session factory, the
// page appended in 4096-byte chunks through the pipeline into the feature extractor, then
// both verdict records (features, model, decision). Single-threaded, in bytes per second,
// over the synthetic page and, when PELMIX_BENCH_CORPUS names a directory, over every file
// below it (one session per file). The knowledge base is build/example.kb, or
// $PELMIX_BENCH_KB. BM_WebCheckSessionHeap reports the heap a session holds after a page of
// 1 and 8 MB: it must not grow with the page.
#include <benchmark/benchmark.h>
#include <malloc.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "bench/html_pages.h"
#include "framework/uvo/anti_phishing.h"
#include "host/host.h"
#include "host/stream.h"
#include "services/anti_phishing/heuristic/source/anti_phishing.h"

namespace {

using namespace cf::services::anti_phishing;

constexpr std::size_t kChunk = 4096;

class Service {
 public:
  Service() {
    const char* kb = std::getenv("PELMIX_BENCH_KB");
    file_ = pelmix::host::FileStream::Open(kb != nullptr && *kb ? kb : PELMIX_EXAMPLE_KB);
    if (!file_) return;
    auto holder = heuristic::TracerHolder::Acquire(host_.tracer.Get());
    host_.tracer->SetTraceLevel(0);
    service_ = uvo::Ptr<heuristic::AntiPhishing>::Adopt(
        heuristic::AntiPhishing::Create(host_.locator.Get(), file_.Get(), holder));
    service_->GetHttpSessionFactory(sessions_.Receive());
  }
  IHttpSessionFactory* sessions() const { return sessions_.Get(); }

 private:
  pelmix::host::Host host_;
  uvo::Ptr<pelmix::host::FileStream> file_;
  uvo::Ptr<heuristic::AntiPhishing> service_;
  uvo::Ptr<IHttpSessionFactory> sessions_;
};

Service& TheService() {
  static Service service;
  return service;
}

uvo::Ptr<IHttpSession> Feed(IHttpSessionFactory* sessions, const std::string& page) {
  SessionSettings settings{2};
  uvo::Ptr<IHttpSession> session;
  if (sessions->CreateSession(&settings, "http://login.bank-example.net/signin", nullptr,
                              session.Receive()) != 0) {
    return session;
  }
  for (std::size_t at = 0; at < page.size(); at += kChunk) {
    const std::size_t n = std::min(kChunk, page.size() - at);
    session->AppendHtml({page.data() + at, page.data() + at + n});
  }
  return session;
}

bool Check(IHttpSessionFactory* sessions, const std::string& page) {
  auto session = Feed(sessions, page);
  if (!session) return false;
  Verdict verdict{};
  HeuristicVerdictInfo info{};
  session->GetVerdict(&verdict);
  session->GetHeuristicVerdictInfo(&info);
  benchmark::DoNotOptimize(verdict);
  benchmark::DoNotOptimize(info.weight);
  return true;
}

void BM_WebCheckSynthetic(benchmark::State& state) {
  IHttpSessionFactory* sessions = TheService().sessions();
  if (sessions == nullptr) return state.SkipWithError("the knowledge base did not load");
  const std::string page = bench_pages::SyntheticPage();
  for (auto _ : state) {
    if (!Check(sessions, page)) return state.SkipWithError("no session");
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * page.size()));
}
BENCHMARK(BM_WebCheckSynthetic)->Unit(benchmark::kMillisecond);

// Hostile pages against plain text of about the same size, through the whole check: a page
// of meta refreshes should cost no more per byte than text.
void WebCheckPage(benchmark::State& state, const std::string& page) {
  IHttpSessionFactory* sessions = TheService().sessions();
  if (sessions == nullptr) return state.SkipWithError("the knowledge base did not load");
  for (auto _ : state) {
    if (!Check(sessions, page)) return state.SkipWithError("no session");
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * page.size()));
}
void BM_WebCheckPlainText(benchmark::State& state) {
  static const std::string page = bench_pages::PlainText();
  WebCheckPage(state, page);
}
BENCHMARK(BM_WebCheckPlainText)->Unit(benchmark::kMillisecond);
void BM_WebCheckRefreshFlood(benchmark::State& state) {
  static const std::string page = bench_pages::RefreshFlood();
  WebCheckPage(state, page);
}
BENCHMARK(BM_WebCheckRefreshFlood)->Unit(benchmark::kMillisecond);
void BM_WebCheckShortRefreshFlood(benchmark::State& state) {
  static const std::string page = bench_pages::ShortRefreshFlood();
  WebCheckPage(state, page);
}
BENCHMARK(BM_WebCheckShortRefreshFlood)->Unit(benchmark::kMillisecond);

void BM_WebCheckCorpus(benchmark::State& state) {
  IHttpSessionFactory* sessions = TheService().sessions();
  if (sessions == nullptr) return state.SkipWithError("the knowledge base did not load");
  const std::vector<std::string> documents = bench_pages::CorpusDocuments();
  if (documents.empty()) return state.SkipWithError("PELMIX_BENCH_CORPUS is not set");
  std::size_t bytes = 0;
  for (const auto& document : documents) bytes += document.size();
  for (auto _ : state) {
    for (const auto& document : documents) Check(sessions, document);
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * bytes));
  state.counters["pages_per_s"] = benchmark::Counter(
      static_cast<double>(state.iterations() * documents.size()), benchmark::Counter::kIsRate);
}
BENCHMARK(BM_WebCheckCorpus)->Unit(benchmark::kMillisecond);

void BM_WebCheckSessionHeap(benchmark::State& state) {
  IHttpSessionFactory* sessions = TheService().sessions();
  if (sessions == nullptr) return state.SkipWithError("the knowledge base did not load");
  std::string page;
  const std::string one = bench_pages::SyntheticPage();
  while (page.size() < static_cast<std::size_t>(state.range(0)) * 1'000'000) page += one;
  double held = 0;
  for (auto _ : state) {
    const std::size_t before = mallinfo2().uordblks;
    auto session = Feed(sessions, page);
    held = static_cast<double>(mallinfo2().uordblks) - static_cast<double>(before);
    benchmark::DoNotOptimize(session.Get());
  }
  state.counters["session_heap_bytes"] = held;
}
BENCHMARK(BM_WebCheckSessionHeap)->Arg(1)->Arg(8)->Iterations(3)->Unit(benchmark::kMillisecond);

}  // namespace
