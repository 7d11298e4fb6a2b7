// The decrunch pipeline with the page feature extractor as its receiver (words through the
// lexeme trie, URLs through the splitter and the organisation look-ups, the vector at the
// end), next to the pipeline's own figures in html_decrunch_bench.cpp, over the synthetic page
// and, when PELMIX_BENCH_CORPUS names a directory, over every file below it.
#include <benchmark/benchmark.h>

#include <sstream>
#include <string>
#include <unordered_map>
#include <vector>

#include "bench/html_pages.h"
#include "engine/features/html_features.h"
#include "engine/html/decrunch.h"

namespace {

using LexemeDB = lex::WordsDB<char, lex::LexemeStats>;

// A few organisations and their domains: enough for the look-ups to hit now and then.
class SmallWorld final : public ap::WhiteDomainI {
 public:
  ap::WhiteDomainRecord Lookup(const char* begin, const char* end) override {
    std::string host(begin, end);
    for (;;) {
      const auto it = domains_.find(host);
      if (it != domains_.end()) return {it->second, 0, 0};
      const std::size_t dot = host.find('.');
      if (dot == std::string::npos) return {};
      host.erase(0, dot + 1);
    }
  }
  bool find_org(std::uint64_t id, ap::OrgResult& r) override {
    r.org_id = static_cast<std::uint32_t>(id);
    r.category = static_cast<std::int32_t>(id % 10);
    r.name = "Org";
    return true;
  }
  bool IsCategorised(const char*, const char*, const char*, const char*) override { return false; }
  bool IsShareLink(const char*, const char*, const char*, const char*) override { return false; }

 private:
  std::unordered_map<std::string, std::uint32_t> domains_ = {
      {"paypal.com", 101},   {"google.com", 102}, {"microsoft.com", 103}, {"apple.com", 104},
      {"facebook.com", 105}, {"amazon.com", 106}, {"example.com", 107}};
};

const LexemeDB& Lexemes() {
  static const LexemeDB db = [] {
    LexemeDB d;
    std::istringstream in(
        "verify(2)account 40 0 1\nsign(1)in 20 0 1\nlog(1)in 20 0 1\n"
        "paypal 50 101 0\ngoogle 20 102 0\nmicrosoft 30 103 0\napple 10 104 0\n"
        "password 30 0 1\naccount 10 0 0\nsecure 35 0 0\nurgent 70 0 0\nlogin 25 0 1\n"
        "bank 20 0 0\ncard 15 0 8\nsuspended 60 0 0\nconfirm 25 0 0\nidentity 20 0 0\n"
        "in 0 0 0\nverify 30 0 0\nlog 0 0 0\nsign 0 0 0\n");
    d.Load(in);
    return d;
  }();
  return db;
}

constexpr std::size_t kChunk = 4096;

void FeatureDocuments(benchmark::State& state, const std::vector<std::string>& documents) {
  SmallWorld lookup;
  std::size_t bytes = 0;
  std::string target;
  std::vector<float> vector;
  for (auto _ : state) {
    for (const std::string& doc : documents) {
      ap::HTMLFeatures features("https://login.example.net/signin", lookup, Lexemes());
      std::uint32_t count = 0;
      {
        html::Decrunch pipeline(features, false);
        for (std::size_t at = 0; at < doc.size(); at += kChunk)
          pipeline.feed(doc.data() + at, std::min(kChunk, doc.size() - at));
        count = pipeline.byteCount();
      }
      features.GetVector(target, vector, count);
      benchmark::DoNotOptimize(vector.data());
      bytes += doc.size();
    }
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(bytes));
}

void BM_FeaturesSyntheticPage(benchmark::State& state) {
  static const std::vector<std::string> page = {bench_pages::SyntheticPage()};
  FeatureDocuments(state, page);
}
BENCHMARK(BM_FeaturesSyntheticPage);

bool RegisterCorpus() {
  const std::vector<std::string> documents = bench_pages::CorpusDocuments();
  if (documents.empty()) return false;
  benchmark::RegisterBenchmark("BM_FeaturesCorpus", [documents](benchmark::State& state) {
    state.counters["files"] = static_cast<double>(documents.size());
    FeatureDocuments(state, documents);
  });
  return true;
}
[[maybe_unused]] const bool corpusRegistered = RegisterCorpus();

}  // namespace
