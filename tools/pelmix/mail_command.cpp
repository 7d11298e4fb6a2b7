// pelmix mail: judges mail messages through the module's mail sessions, as a mail filter
// would: one line (or one JSON object) per message, in input order whatever --jobs says.
// An input is one message, or an mbox (its first line starts with "From "), whose messages
// are named FILE#N.
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstring>
#include <iostream>

#include "tools/mail/message_reader.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/judging.h"
#include "tools/pelmix/mail_scan.h"
#include "tools/pelmix/module_host.h"

namespace pelmix::cli {
namespace {

using namespace cf::services::anti_phishing;

struct MailArgs {
  std::string kb;
  MailScanOptions message;
  bool json = false;
  unsigned jobs = 1;
  std::vector<std::string> inputs;
};

int Parse(const std::vector<std::string>& args, MailArgs& m) {
  m.kb = DefaultKnowledgeBase();
  for (std::size_t i = 0; i < args.size(); ++i) {
    const std::string& arg = args[i];
    std::string text;
    std::size_t number = 0;
    const auto value = [&](std::string& into) {
      if (i + 1 >= args.size()) return false;
      into = args[++i];
      return true;
    };
    if (arg == "--kb") {
      if (!value(m.kb)) return UsageError("mail: --kb needs a file");
    } else if (arg == "--level") {
      if (!value(text) || !ParseNumber(text, 1, 3, number)) {
        return UsageError("mail: --level needs 1, 2 or 3");
      }
      m.message.level = static_cast<std::int32_t>(number);
    } else if (arg == "--jobs") {
      if (!value(text) || !ParseNumber(text, 1, kMaxJobs, number)) {
        return UsageError("mail: --jobs needs a count from 1 to " + std::to_string(kMaxJobs));
      }
      m.jobs = static_cast<unsigned>(number);
    } else if (arg == "--json") {
      m.json = true;
    } else if (arg == "--features") {
      m.message.features = true;
    } else if (arg.size() > 1 && arg[0] == '-') {
      return UsageError("mail: unknown option " + arg);
    } else {
      m.inputs.push_back(arg);
    }
  }
  if (m.inputs.empty()) return UsageError("mail needs a FILE, - or DIR");
  if (m.message.features && !m.json) return UsageError("mail: --features needs --json");
  if (std::count(m.inputs.begin(), m.inputs.end(), "-") > 1) {
    return UsageError("mail: stdin (-) can be read only once");
  }
  return 0;
}

int RunMail(const std::vector<std::string>& args, const GlobalOptions& options) {
  MailArgs m;
  if (const int usage = Parse(args, m); usage != 0) return usage;
  std::vector<InputFile> inputs;
  for (const std::string& input : m.inputs) AddInput(input, inputs);

  LoadedService loaded;
  if (const int status = LoadService("mail", m.kb, options, loaded); status != kExitOk) {
    return status;
  }
  uvo::Ptr<IMailSessionFactory> sessions;
  if (const uvo::result_t result = loaded.service->GetMailSessionFactory(sessions.Receive());
      result < 0) {
    std::cerr << "pelmix mail: no mail sessions: " << DescribeResult(result) << "\n";
    return kExitModule;
  }

  // One input per job: its messages are read one at a time (an mbox is never held whole)
  // and their lines kept together.
  std::atomic<bool> failed{false}, phishing{false};
  RunInOrder(inputs.size(), m.jobs, [&](std::size_t i) {
    const InputFile& input = inputs[i];
    Judgement refused;
    if (!input.error.empty()) {
      failed = true;
      refused.error = input.error;
      return FormatJudgement(input.path, nullptr, refused, m.json, m.message.features);
    }
    const bool useStdin = input.path == "-";
    const int fd = useStdin ? STDIN_FILENO : ::open(input.path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) {
      failed = true;
      refused.error = std::strerror(errno);
      return FormatJudgement(input.path, nullptr, refused, m.json, m.message.features);
    }
    std::vector<Judgement> judged;
    const mail::ReadResult read = mail::ReadMessages(fd, [&](mail::MessageBuffer& message) {
      judged.push_back(ScanMessage(*sessions.Get(), message, m.message));
      if (!judged.back().error.empty()) failed = true;
      if (judged.back().error.empty() && judged.back().phishing) phishing = true;
    });
    if (!useStdin) ::close(fd);
    std::string lines;
    for (std::size_t n = 0; n < judged.size(); ++n) {
      const std::string name = read.mbox ? input.path + "#" + std::to_string(n + 1) : input.path;
      lines += FormatJudgement(name, nullptr, judged[n], m.json, m.message.features);
    }
    if (!read.ok) {
      failed = true;
      refused.error = read.error;
      lines += FormatJudgement(input.path, nullptr, refused, m.json, m.message.features);
    }
    return lines;
  });
  if (failed) return kExitFailure;
  return phishing ? kExitPhishing : kExitOk;
}

}  // namespace

PELMIX_COMMAND({"mail",
                "[--kb FILE] [--level 1|2|3] [--json] [--features] [--jobs N] FILE|-|DIR...",
                "judge mail messages (RFC 822 files or mbox) through the module's mail sessions "
                "(exit 3: phishing found)",
                RunMail})

}  // namespace pelmix::cli
