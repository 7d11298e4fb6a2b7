// Knowledge-base reading: container checks, entry reads through the host-file adapter, and
// the float reader that every text base goes through.
#include <benchmark/benchmark.h>

#include <random>

#include "engine/kb/engine_config.h"
#include "engine/kb/float_parser.h"
#include "engine/kb/packed_file.h"
#include "engine/kb/readable_stream.h"
#include "host/stream.h"
#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"
#include "tools/kbtools/container_writer.h"

namespace {

std::string Container(std::size_t entry_size) {
  std::mt19937 random(1);
  std::string data(entry_size, '\0');
  for (char& c : data) c = static_cast<char>('a' + random() % 26);
  for (std::size_t i = 80; i < data.size(); i += 81) data[i] = '\n';
  pelmix::kbtools::ContainerWriter writer;
  writer.Add("entry", data);
  writer.Add("v3.cfg", "dbstamp=1;\nweb_threshold=0.05;\n");
  return writer.Build();
}

std::shared_ptr<ap::FileIO> Handle(const std::string& bytes) {
  const auto stream = pelmix::host::MemoryStream::Create(bytes);
  return std::make_shared<cf::adapters::AntiphishingIOAdapter>(stream.Get());
}

// Construction: header reads and the body checksum over the whole container.
void BM_PackedFileOpenContainer(benchmark::State& state) {
  const std::string bytes = Container(static_cast<std::size_t>(state.range(0)));
  for (auto _ : state) {
    ap::PackedFile packed(Handle(bytes));
    benchmark::DoNotOptimize(packed.entry_count());
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * bytes.size()));
}
BENCHMARK(BM_PackedFileOpenContainer)->Arg(1 << 20);

// open(): record walk, entry checksum, then reading it all in 4096-byte pieces.
void BM_PackedFileReadEntry(benchmark::State& state) {
  const std::size_t size = static_cast<std::size_t>(state.range(0));
  ap::PackedFile packed(Handle(Container(size)));
  char buffer[4096];
  for (auto _ : state) {
    const auto entry = packed.open("entry");
    while (entry->file_read(buffer, sizeof buffer) > 0) {
    }
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * size));
}
BENCHMARK(BM_PackedFileReadEntry)->Arg(1 << 20);

// Line reading through the entry text stream, as the line-oriented loaders do.
void BM_EntryTextStreamLines(benchmark::State& state) {
  const std::size_t size = static_cast<std::size_t>(state.range(0));
  ap::PackedFile packed(Handle(Container(size)));
  std::string line;
  for (auto _ : state) {
    ap::EntryTextStream stream(packed.open("entry"));
    std::size_t lines = 0;
    while (std::getline(stream, line)) ++lines;
    benchmark::DoNotOptimize(lines);
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * size));
}
BENCHMARK(BM_EntryTextStreamLines)->Arg(1 << 20);

void BM_FloatParser(benchmark::State& state) {
  const char* const texts[] = {"0.05",  "-0.5",    "1e-3", "0.123456789012345678", "12345.6789",
                               "3e+12", "-0.0001", "1",    "123456789012345678901"};
  std::size_t bytes = 0;
  for (const char* text : texts) bytes += std::char_traits<char>::length(text);
  for (auto _ : state) {
    for (const char* text : texts) benchmark::DoNotOptimize(ap::FloatParser::Parse(text));
  }
  state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * std::size(texts)));
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * bytes));
}
BENCHMARK(BM_FloatParser);

void BM_EngineConfigLoad(benchmark::State& state) {
  ap::PackedFile packed(Handle(Container(16)));
  for (auto _ : state) {
    ap::EngineConfig config;
    ap::LoadEngineConfig(packed, config);
    benchmark::DoNotOptimize(config);
  }
}
BENCHMARK(BM_EngineConfigLoad);

}  // namespace
