// The knowledge bases a page asks about: white-domain and categorised-host look-ups, and
// loading the lexeme database.
#include <benchmark/benchmark.h>

#include <random>
#include <sstream>
#include <string>
#include <vector>

#include "engine/kb/categorized_hosts.h"
#include "engine/kb/md5.h"
#include "engine/kb/readable_buffer.h"
#include "engine/kb/spooky_hash.h"
#include "engine/kb/white_domains.h"
#include "engine/kb/words_db.h"
#include "tools/kbtools/hpdb_writer.h"
#include "tools/kbtools/wdb_writer.h"

namespace {

std::string Word(std::mt19937& random, std::size_t min, std::size_t max) {
  std::string word(min + random() % (max - min + 1), 'a');
  for (char& c : word) c = static_cast<char>('a' + random() % 26);
  return word;
}

struct WhiteSet {
  wd::WhiteDomains set;
  std::vector<std::string> hits;
  std::vector<std::string> misses;
};

WhiteSet MakeWhiteSet(int names) {
  std::mt19937 random(1);
  pelmix::kbtools::WdbWriter writer;
  std::vector<std::string> hits, misses;
  const char* suffixes[] = {"com", "net", "co.uk", "de"};
  for (int i = 0; i < names; ++i) {
    const std::string name = Word(random, 4, 12);
    const std::string suffix = suffixes[random() % 4];
    writer.Add(static_cast<std::uint16_t>(1 + i % 5000), name, suffix, false);
    hits.push_back("www." + name + "." + suffix);
    misses.push_back("login." + Word(random, 4, 12) + "." + suffix);
  }
  const std::string bytes = writer.Build();
  return WhiteSet{wd::WhiteDomains(std::vector<std::uint8_t>(bytes.begin(), bytes.end())),
                  std::move(hits), std::move(misses)};
}

void BM_WhiteDomainsLookup(benchmark::State& state) {
  static const WhiteSet white = MakeWhiteSet(20000);
  const auto& hosts = state.range(0) ? white.hits : white.misses;
  std::size_t i = 0;
  for (auto _ : state) {
    benchmark::DoNotOptimize(white.set.Lookup(hosts[i++ % hosts.size()]));
  }
  state.SetLabel(state.range(0) ? "listed" : "unlisted");
}
BENCHMARK(BM_WhiteDomainsLookup)->Arg(1)->Arg(0);

void BM_CategorisedHostsLookup(benchmark::State& state) {
  std::mt19937 random(2);
  pelmix::kbtools::HpdbWriter writer;
  std::vector<std::string> hosts;
  for (int i = 0; i < 20000; ++i) {
    hosts.push_back(Word(random, 5, 14) + ".example");
    writer.AddHost(hosts.back(), static_cast<std::uint16_t>(i % 10));
    writer.AddPath(hosts.back(), "/login/", 4);
  }
  const std::string bytes = writer.Build();
  const hpdb::HashedCatHostsPathes db(std::make_shared<util::ReadableBuffer>(
      bytes.data(), static_cast<std::uint32_t>(bytes.size())));
  const std::string path = "/login/form.php";
  std::uint16_t category;
  std::uint64_t mask;
  bool no_paths;
  std::size_t i = 0;
  for (auto _ : state) {
    benchmark::DoNotOptimize(db.lookup(hosts[i++ % hosts.size()], path, category, mask, no_paths));
  }
}
BENCHMARK(BM_CategorisedHostsLookup);

void BM_LexdbLoad(benchmark::State& state) {
  std::mt19937 random(3);
  std::string text;
  for (int i = 0; i < 500; ++i) {
    text += Word(random, 3, 8) + "(" + std::to_string(1 + random() % 3) + ")" + Word(random, 3, 8) +
            " 20 0 0\n";
  }
  for (int i = 0; i < state.range(0); ++i) text += Word(random, 3, 12) + " 10 0 1\n";
  for (auto _ : state) {
    lex::WordsDB<char, lex::LexemeStats> db;
    std::istringstream in(text);
    db.Load(in);
    benchmark::DoNotOptimize(db.term_count());
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * text.size()));
}
BENCHMARK(BM_LexdbLoad)->Arg(20000);

void BM_SpookyHash32(benchmark::State& state) {
  const std::string bytes(static_cast<std::size_t>(state.range(0)), 'x');
  for (auto _ : state) benchmark::DoNotOptimize(ap::SpookyHash32(bytes.data(), bytes.size(), 0));
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * bytes.size()));
}
BENCHMARK(BM_SpookyHash32)->Arg(8)->Arg(255);

void BM_Md5(benchmark::State& state) {
  const std::string bytes(static_cast<std::size_t>(state.range(0)), 'x');
  for (auto _ : state) benchmark::DoNotOptimize(ap::Md5Of(bytes));
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * bytes.size()));
}
BENCHMARK(BM_Md5)->Arg(20)->Arg(4096);

}  // namespace
