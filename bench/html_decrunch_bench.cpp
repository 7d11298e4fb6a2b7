// Throughput of the whole decrunch pipeline (byte counter, JSON validator, tokenizer, HTML
// handler with its script scanner and nested pipelines), in bytes per second, over the
// synthetic page and, when PELMIX_BENCH_CORPUS names a directory, over every file below it.
#include <benchmark/benchmark.h>

#include <string>
#include <string_view>
#include <vector>

#include "bench/html_pages.h"
#include "engine/html/decrunch.h"

namespace {

// Takes what the page analysis takes: page text, title, description, anchors and scripts
// (no comment or select sinks), and only counts.
class CountingReceiver final : public html::Decrunch::Handler {
 public:
  class Sink final : public html::Decrunch::TextHandler {
   public:
    void text(const char*, std::size_t n) override { bytes += n; }
    void breakText() override {}
    void end() override {}
    std::size_t bytes = 0;
  };

  void text(const char*, std::size_t n) override { textBytes += n; }
  void breakText() override {}
  void end() override {}
  void url(std::string_view, html::UrlKind) override { ++urls; }
  void scriptUrl(std::string_view) override { ++urls; }
  TextHandler* commentSink() override { return nullptr; }
  TextHandler* titleSink() override { return &sink; }
  TextHandler* descriptionSink() override { return &sink; }
  TextHandler* selectSink() override { return nullptr; }
  TextHandler* anchorSink(const html_decrunch::HtmlHandler&) override { return &sink; }
  TextHandler* scriptSink(const html_decrunch::HtmlHandler&) override { return &sink; }
  void input(const html_decrunch::HtmlHandler&) override { ++inputs; }
  void beginNested() override {}
  void endNested() override {}

  Sink sink;
  std::size_t textBytes = 0;
  std::size_t urls = 0;
  std::size_t inputs = 0;
};

constexpr std::size_t kChunk = 4096;  // the size the web session hands over

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
