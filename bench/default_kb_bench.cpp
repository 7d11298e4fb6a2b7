// Loading the default knowledge base (build/default.kb) as the service does: the whole load
// from the host file, and from bytes already in memory (what the file reads cost).
#include <benchmark/benchmark.h>

#include <fstream>
#include <sstream>

#include "engine/kb/kb_loader.h"
#include "engine/kb/web_checker_v3_data.h"
#include "host/stream.h"
#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"

namespace {

template <class Stream>
void LoadFrom(const uvo::Ptr<Stream>& stream) {
  WebCheckerV3Data knowledge;
  loaders_misc::load(knowledge,
                     std::make_shared<cf::adapters::AntiphishingIOAdapter>(stream.Get()));
  benchmark::DoNotOptimize(knowledge);
}

void BM_DefaultKbLoadFromFile(benchmark::State& state) {
  for (auto _ : state) LoadFrom(pelmix::host::FileStream::Open(PELMIX_DEFAULT_KB));
}
BENCHMARK(BM_DefaultKbLoadFromFile)->Unit(benchmark::kMillisecond);

void BM_DefaultKbLoadFromMemory(benchmark::State& state) {
  std::ifstream in(PELMIX_DEFAULT_KB, std::ios::binary);
  std::ostringstream bytes;
  bytes << in.rdbuf();
  const std::string image = std::move(bytes).str();
  for (auto _ : state) LoadFrom(pelmix::host::MemoryStream::Create(image));
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * image.size()));
}
BENCHMARK(BM_DefaultKbLoadFromMemory)->Unit(benchmark::kMillisecond);

}  // namespace
