// Throughput of the HTML tokenizer, in bytes per second, over a synthetic page of realistic
// markup and, when PELMIX_BENCH_CORPUS names a directory, over every file below it.
#include <benchmark/benchmark.h>

#include <string>
#include <string_view>
#include <vector>

#include "bench/html_pages.h"
#include "engine/html/tokenizer.h"

namespace {

// Wants what a page analyser wants: a few URL attributes collected, image text streamed,
// script text delivered, everything else skipped.
class AnalyserLikeHandler {
 public:
  struct Sink {
    void text(const char*, std::size_t n) { bytes += n; }
    void end() {}
    std::size_t bytes = 0;
  };

  void text(const char*, std::size_t n) { textBytes += n; }
  bool openElement(std::string_view name) {
    ++elements;
    return name == "a" || name == "img" || name == "input" || name == "form" || name == "link" ||
           name == "meta" || name == "script" || name == "iframe";
  }
  bool startTagEnd() { return true; }
  void closeElement(std::string_view) {}
  int attributeName(std::string_view name) {
    if (name == "href" || name == "src" || name == "action" || name == "content") {
      return html::kAttrCollect;
    }
    if (name == "alt" || name == "placeholder") return html::kAttrStream;
    return html::kAttrSkip;
  }
  void attributeValue(std::string_view value) { valueBytes += value.size(); }
  void attributeChar(char) { ++valueBytes; }
  Sink* commentSink() { return &comments; }
  void scriptText(const char*, std::size_t n) { scriptBytes += n; }

  std::size_t elements = 0;
  std::size_t textBytes = 0;
  std::size_t valueBytes = 0;
  std::size_t scriptBytes = 0;
  Sink comments;
};

constexpr std::size_t kChunk = 4096;  // the size the web session hands over

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
