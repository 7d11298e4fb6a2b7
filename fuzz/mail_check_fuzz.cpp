// The fuzzer's bytes are one mail message as a mail host receives it. It is walked with the
// real budgets and every part goes to a mail checker over the example knowledge base, as a
// mail session would hand it on; the verdict is asked for twice and must not change.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <string>
#include <string_view>

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
    uvo::Ptr<pelmix::host::FileStream> file = pelmix::host::FileStream::Open(PELMIX_EXAMPLE_KB);
    if (!file) std::abort();
    loaders_misc::load(*loaded, std::make_shared<cf::adapters::AntiphishingIOAdapter>(file.Get()));
    return loaded;
  }();
  return data;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  // A fixed clock: the loud draw is the same for both verdicts.
  easy3_impl::MailCheckerV3 checker(Knowledge(), [] { return std::uint64_t{0}; });
  pelmix::mail::CheckerSink sink(checker);
  pelmix::mail::WalkMessage(std::string_view(reinterpret_cast<const char*>(data), size), sink);
  ap::easy2::EngineVerdict first, second;
  checker.GetVerdict(first);
  checker.GetVerdict(second);
  if (first.phishing != second.phishing || first.quiet != second.quiet ||
      first.target != second.target || first.weight != second.weight) {
    std::abort();
  }
  return 0;
}
