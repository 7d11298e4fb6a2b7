// The mail check alone, single-threaded: each message of the hand-made test corpus walked
// (GMime) and handed to a mail checker on the default knowledge base, then judged; and the
// checker's share without the walk, over parts walked once beforehand.
#include <benchmark/benchmark.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>
#include <vector>

#include "engine/checkers/mail_checker_v3.h"
#include "engine/kb/kb_loader.h"
#include "host/stream.h"
#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"
#include "tools/mail/checker_sink.h"
#include "tools/mail/message_walk.h"

namespace {

std::shared_ptr<const WebCheckerV3Data> Knowledge() {
  static const std::shared_ptr<const WebCheckerV3Data> data = [] {
    auto loaded = std::make_shared<WebCheckerV3Data>();
    auto file = pelmix::host::FileStream::Open(PELMIX_DEFAULT_KB);
    if (file) {
      loaders_misc::load(*loaded,
                         std::make_shared<cf::adapters::AntiphishingIOAdapter>(file.Get()));
    }
    return loaded;
  }();
  return data;
}

std::vector<std::string> Messages() {
  std::vector<std::string> out;
  for (const auto& entry :
       std::filesystem::directory_iterator(PELMIX_SOURCE_DIR "/tests/data/mail")) {
    const std::string name = entry.path().filename().string();
    if (name.size() < 4 || name.substr(name.size() - 4) != ".eml") continue;
    std::ifstream in(entry.path(), std::ios::binary);
    out.emplace_back(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
  }
  return out;
}

void BM_MailCheck(benchmark::State& state) {
  const auto knowledge = Knowledge();
  if (!knowledge->whiteDomains) {
    state.SkipWithError("the default knowledge base did not load");
    return;
  }
  const std::vector<std::string> messages = Messages();
  std::size_t bytes = 0, count = 0;
  for (auto _ : state) {
    for (const std::string& message : messages) {
      easy3_impl::MailCheckerV3 checker(knowledge);
      pelmix::mail::CheckerSink sink(checker);
      pelmix::mail::WalkMessage(message, sink);
      ap::easy2::EngineVerdict verdict;
      checker.GetVerdict(verdict);
      benchmark::DoNotOptimize(verdict.weight);
      bytes += message.size();
      ++count;
    }
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(bytes));
  state.SetItemsProcessed(static_cast<std::int64_t>(count));
}
BENCHMARK(BM_MailCheck);

}  // namespace
