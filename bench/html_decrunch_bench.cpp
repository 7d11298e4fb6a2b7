// Throughput of the whole decrunch pipeline (byte counter, JSON validator, tokenizer, HTML
// handler with its script scanner and nested pipelines), in bytes per second, over the
// synthetic page and, when PELMIX_BENCH_CORPUS names a directory, over every file below it.
#include <benchmark/benchmark.h>

#include <string>
#include <string_view>
#include <vector>

#include "bench/html_pages.h"
#include "bench/scan_handlers.h"
#include "engine/html/decrunch.h"

namespace {

using bench_scan::CountingReceiver;
using bench_scan::kChunk;

void DecrunchDocuments(benchmark::State& state, const std::vector<std::string>& documents) {
  std::size_t bytes = 0;
  for (auto _ : state) {
    for (const std::string& doc : documents) {
      CountingReceiver receiver;
      {
        html::Decrunch pipeline(receiver, false);
        for (std::size_t at = 0; at < doc.size(); at += kChunk) {
          pipeline.feed(doc.data() + at, std::min(kChunk, doc.size() - at));
        }
        benchmark::DoNotOptimize(pipeline.jsonAccepted());
      }
      benchmark::DoNotOptimize(receiver.textBytes + receiver.sink.bytes);
      bytes += doc.size();
    }
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(bytes));
}

void BM_DecrunchSyntheticPage(benchmark::State& state) {
  static const std::vector<std::string> page = {bench_pages::SyntheticPage()};
  state.counters["page_bytes"] = static_cast<double>(page[0].size());
  DecrunchDocuments(state, page);
}
BENCHMARK(BM_DecrunchSyntheticPage);

// A page of ordinary meta refreshes (whose targets are no data URL) against plain text of the
// same size: the refreshes should cost what their bytes cost.
void BM_DecrunchRefreshFlood(benchmark::State& state) {
  static const std::vector<std::string> page = {bench_pages::RefreshFlood()};
  DecrunchDocuments(state, page);
}
BENCHMARK(BM_DecrunchRefreshFlood);

void BM_DecrunchShortRefreshFlood(benchmark::State& state) {
  static const std::vector<std::string> page = {bench_pages::ShortRefreshFlood()};
  DecrunchDocuments(state, page);
}
BENCHMARK(BM_DecrunchShortRefreshFlood);

// The short refreshes' bytes as tags nobody reads: what dense markup of that shape costs.
void BM_DecrunchShortTags(benchmark::State& state) {
  static const std::vector<std::string> page = [] {
    std::string tags;
    for (int i = 0; i < 50000; ++i) tags += "<span http-equiv=refresh content='5;url=/a'>";
    return std::vector<std::string>{tags};
  }();
  DecrunchDocuments(state, page);
}
BENCHMARK(BM_DecrunchShortTags);

void BM_DecrunchPlainText(benchmark::State& state) {
  static const std::vector<std::string> page = {bench_pages::PlainText()};
  DecrunchDocuments(state, page);
}
BENCHMARK(BM_DecrunchPlainText);

bool RegisterCorpus() {
  const std::vector<std::string> documents = bench_pages::CorpusDocuments();
  if (documents.empty()) return false;
  benchmark::RegisterBenchmark("BM_DecrunchCorpus", [documents](benchmark::State& state) {
    state.counters["files"] = static_cast<double>(documents.size());
    DecrunchDocuments(state, documents);
  });
  return true;
}
[[maybe_unused]] const bool corpusRegistered = RegisterCorpus();

}  // namespace
