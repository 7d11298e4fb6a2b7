// One corpus, one process, every scanner: a memchr pass, a full HTML5 parser (gumbo), the
// tokenizer with an analyser-like handler, the decrunch pipeline and the whole web check,
// each over the same in-memory pages ($PELMIX_BENCH_CORPUS, else the synthetic page), fed in
// the chunks the web session hands over. Each reports its MB/s (per CPU second of the
// benchmark thread) and its ratio to the parser and to memchr; the table of all of them is
// printed when the benchmarks are done.
//
//   PELMIX_BENCH_CORPUS=DIR build/bin/pelmix_bench --benchmark_filter=Compare
#include <benchmark/benchmark.h>
#include <time.h>

#include <cstdio>
#include <cstring>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "bench/html_pages.h"
#include "bench/scan_handlers.h"
#include "engine/checkers/check_factory_v3.h"
#include "engine/checkers/web_checker_i.h"
#include "engine/html/decrunch.h"
#include "engine/html/state_machine.h"
#include "engine/html/tokenizer.h"
#include "host/stream.h"
#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"

#ifdef PELMIX_HAVE_GUMBO
#include <gumbo.h>
#endif

namespace {

using bench_scan::kChunk;

const std::vector<std::string>& Corpus() {
  static const std::vector<std::string> documents = [] {
    std::vector<std::string> docs = bench_pages::CorpusDocuments();
    if (docs.empty()) docs.push_back(bench_pages::SyntheticPage());
    return docs;
  }();
  return documents;
}

std::size_t CorpusBytes() {
  std::size_t bytes = 0;
  for (const std::string& doc : Corpus()) bytes += doc.size();
  return bytes;
}

double ThreadSeconds() {
  timespec now{};
  clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
  return static_cast<double>(now.tv_sec) + static_cast<double>(now.tv_nsec) * 1e-9;
}

// MB/s of each scanner as last measured, in the order they ran; printed as a table at exit.
class Results {
 public:
  static Results& get() {
    static Results results;
    return results;
  }
  void record(const std::string& name, double mbPerSecond) {
    if (rates_.count(name) == 0) order_.push_back(name);
    rates_[name] = mbPerSecond;
  }
  double rate(const std::string& name) const {
    const auto it = rates_.find(name);
    return it == rates_.end() ? 0 : it->second;
  }
  ~Results() {
    if (order_.empty()) return;
    std::printf("\nScanner comparison over %zu documents, %.1f MB, %zu-byte chunks\n",
                Corpus().size(), static_cast<double>(CorpusBytes()) / 1e6, kChunk);
    std::printf("%-22s %10s %10s %10s\n", "scanner", "MB/s", "x parser", "x memchr");
    for (const std::string& name : order_) {
      const double r = rates_.at(name);
      const double parser = rate("html5 parser");
      const double memchrRate = rate("memchr");
      std::printf("%-22s %10.1f %10s %10s\n", name.c_str(), r,
                  parser > 0 ? std::to_string(r / parser).substr(0, 6).c_str() : "-",
                  memchrRate > 0 ? std::to_string(r / memchrRate).substr(0, 6).c_str() : "-");
    }
  }

 private:
  std::vector<std::string> order_;
  std::map<std::string, double> rates_;
};

// Runs `pass` (one pass over the corpus) for every iteration and reports the rate.
template <typename Pass>
void Measure(benchmark::State& state, const std::string& name, Pass pass) {
  const std::size_t corpusBytes = CorpusBytes();
  std::size_t bytes = 0;
  const double start = ThreadSeconds();
  for (auto _ : state) {
    pass();
    bytes += corpusBytes;
  }
  const double seconds = ThreadSeconds() - start;
  state.SetBytesProcessed(static_cast<std::int64_t>(bytes));
  const double rate = seconds > 0 ? static_cast<double>(bytes) / 1e6 / seconds : 0;
  Results::get().record(name, rate);
  state.counters["MB/s"] = rate;
  if (const double parser = Results::get().rate("html5 parser"); parser > 0) {
    state.counters["x_parser"] = rate / parser;
  }
  if (const double m = Results::get().rate("memchr"); m > 0) state.counters["x_memchr"] = rate / m;
}

void BM_CompareMemchr(benchmark::State& state) {
  Measure(state, "memchr", [] {
    std::size_t hits = 0;
    for (const std::string& doc : Corpus()) {
      for (std::size_t at = 0; at < doc.size(); at += kChunk) {
        const char* p = doc.data() + at;
        const char* end = p + std::min(kChunk, doc.size() - at);
        while (const void* hit = std::memchr(p, '\0', static_cast<std::size_t>(end - p))) {
          ++hits;
          p = static_cast<const char*>(hit) + 1;
        }
      }
    }
    benchmark::DoNotOptimize(hits);
  });
}
BENCHMARK(BM_CompareMemchr);

#ifdef PELMIX_HAVE_GUMBO
// The parser takes a whole document; it builds the tree a browser would.
void BM_CompareHtml5Parser(benchmark::State& state) {
  Measure(state, "html5 parser", [] {
    for (const std::string& doc : Corpus()) {
      GumboOutput* output = gumbo_parse_with_options(&kGumboDefaultOptions, doc.data(), doc.size());
      benchmark::DoNotOptimize(output->root);
      gumbo_destroy_output(&kGumboDefaultOptions, output);
    }
  });
}
BENCHMARK(BM_CompareHtml5Parser);
#endif

void TokenizeCorpus() {
  for (const std::string& doc : Corpus()) {
    bench_scan::AnalyserLikeHandler handler;
    html::FastParserMachine<char, bench_scan::AnalyserLikeHandler> tokenizer(handler);
    for (std::size_t at = 0; at < doc.size(); at += kChunk) {
      tokenizer.feed(doc.data() + at, std::min(kChunk, doc.size() - at));
    }
    benchmark::DoNotOptimize(handler.elements);
  }
}

void DecrunchCorpus() {
  for (const std::string& doc : Corpus()) {
    bench_scan::CountingReceiver receiver;
    {
      html::Decrunch pipeline(receiver, false);
      for (std::size_t at = 0; at < doc.size(); at += kChunk) {
        pipeline.feed(doc.data() + at, std::min(kChunk, doc.size() - at));
      }
      benchmark::DoNotOptimize(pipeline.jsonAccepted());
    }
    benchmark::DoNotOptimize(receiver.textBytes + receiver.sink.bytes);
  }
}

// The same scanners with every byte through process(): what the bulk paths save.
class Bytewise {
 public:
  Bytewise() { util::setBulkScanning(false); }
  ~Bytewise() { util::setBulkScanning(true); }
};

void BM_CompareTokenizerBytewise(benchmark::State& state) {
  Bytewise bytewise;
  Measure(state, "tokenizer, bytewise", TokenizeCorpus);
}
BENCHMARK(BM_CompareTokenizerBytewise);

void BM_CompareDecrunchBytewise(benchmark::State& state) {
  Bytewise bytewise;
  Measure(state, "decrunch, bytewise", DecrunchCorpus);
}
BENCHMARK(BM_CompareDecrunchBytewise);

void BM_CompareTokenizer(benchmark::State& state) { Measure(state, "tokenizer", TokenizeCorpus); }
BENCHMARK(BM_CompareTokenizer);

void BM_CompareDecrunch(benchmark::State& state) {
  Measure(state, "decrunch pipeline", DecrunchCorpus);
}
BENCHMARK(BM_CompareDecrunch);

// The whole web check: a web checker of the check factory on the default knowledge base (the
// pipeline, the feature extractor, the model and the decision), fed each page in kChunk pieces
// and asked for its verdict.
easy3_impl::CheckFactoryV3* Factory() {
  static const std::unique_ptr<easy3_impl::CheckFactoryV3> factory = []() {
    auto file = pelmix::host::FileStream::Open(PELMIX_DEFAULT_KB);
    if (!file) return std::unique_ptr<easy3_impl::CheckFactoryV3>();
    return std::make_unique<easy3_impl::CheckFactoryV3>(
        std::make_shared<cf::adapters::AntiphishingIOAdapter>(file.Get()));
  }();
  return factory.get();
}

void BM_CompareWebCheck(benchmark::State& state) {
  easy3_impl::CheckFactoryV3* factory = Factory();
  if (factory == nullptr) {
    state.SkipWithError("the default knowledge base did not load");
    return;
  }
  Measure(state, "whole web check", [factory] {
    for (const std::string& doc : Corpus()) {
      auto checker = factory->CreateWebChecker("https://login.example.net/signin", 0);
      for (std::size_t at = 0; at < doc.size(); at += kChunk)
        checker->AppendData(doc.data() + at, std::min(kChunk, doc.size() - at));
      ap::easy2::EngineVerdict verdict;
      checker->GetVerdict(verdict);
      benchmark::DoNotOptimize(verdict.weight);
    }
  });
}
BENCHMARK(BM_CompareWebCheck);

}  // namespace
