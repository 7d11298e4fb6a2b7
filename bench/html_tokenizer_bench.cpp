// Throughput of the HTML tokenizer, in bytes per second, over a synthetic page of realistic
// markup and, when PELMIX_BENCH_CORPUS names a directory, over every file below it.
#include <benchmark/benchmark.h>

#include <string>
#include <string_view>
#include <vector>

#include "bench/html_pages.h"
#include "bench/scan_handlers.h"
#include "engine/html/tokenizer.h"

namespace {

using bench_scan::AnalyserLikeHandler;
using bench_scan::kChunk;

void TokenizeDocuments(benchmark::State& state, const std::vector<std::string>& documents) {
  std::size_t bytes = 0;
  for (auto _ : state) {
    for (const std::string& doc : documents) {
      AnalyserLikeHandler handler;
      html::FastParserMachine<char, AnalyserLikeHandler> tokenizer(handler);
      for (std::size_t at = 0; at < doc.size(); at += kChunk) {
        tokenizer.feed(doc.data() + at, std::min(kChunk, doc.size() - at));
      }
      benchmark::DoNotOptimize(handler.elements);
      bytes += doc.size();
    }
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(bytes));
}

void BM_TokenizeSyntheticPage(benchmark::State& state) {
  static const std::vector<std::string> page = {bench_pages::SyntheticPage()};
  state.counters["page_bytes"] = static_cast<double>(page[0].size());
  TokenizeDocuments(state, page);
}
BENCHMARK(BM_TokenizeSyntheticPage);

// Every regular file below $PELMIX_BENCH_CORPUS, each through a fresh tokenizer.
bool RegisterCorpus() {
  const std::vector<std::string> documents = bench_pages::CorpusDocuments();
  if (documents.empty()) return false;
  benchmark::RegisterBenchmark("BM_TokenizeCorpus", [documents](benchmark::State& state) {
    state.counters["files"] = static_cast<double>(documents.size());
    TokenizeDocuments(state, documents);
  });
  return true;
}
[[maybe_unused]] const bool corpusRegistered = RegisterCorpus();

}  // namespace
