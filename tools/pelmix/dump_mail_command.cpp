// pelmix dump mail: what the mail walk hands a mail session, message by message, as JSON Lines:
// the subject, each text part (type, charset, length and first bytes), each attachment and
// image (name, type, size) and each link of the plain-text parts, then the limits and GMime
// warnings the message ran into. An mbox (first line "From ") gives one block per message.
#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <iostream>

#include "tools/mail/message_reader.h"
#include "tools/mail/message_walk.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/json_lines.h"

namespace pelmix::cli {
namespace {

// Bytes of a text part shown in its "head".
constexpr std::size_t kHeadBytes = 64;

class DumpSink : public mail::MessageSink {
 public:
  void Subject(std::string_view subject, int depth) override {
    JsonLine().Bytes("ev", "subject").Int("depth", depth).Bytes("data", subject).Write(std::cout);
  }
  void Text(std::string_view data, const mail::PartInfo& part) override {
    JsonLine line;
    line.Bytes("ev", "text").Bytes("type", part.contentType).Int("depth", part.depth);
    if (!part.charset.empty())
      line.Bytes("charset", part.charset).Bool("converted", part.converted);
    line.Int("length", static_cast<std::int64_t>(data.size()))
        .Bytes("head", data.substr(0, kHeadBytes));
    Finish(line, part);
  }
  void Image(std::string_view data, const mail::PartInfo& part) override {
    JsonLine line;
    line.Bytes("ev", "image").Bytes("type", part.contentType).Int("depth", part.depth);
    line.Int("size", static_cast<std::int64_t>(data.size()));
    Finish(line, part);
  }
  void Attachment(std::string_view name, std::string_view data,
                  const mail::PartInfo& part) override {
    JsonLine line;
    line.Bytes("ev", "attachment").Bytes("name", name).Bytes("type", part.contentType);
    line.Int("depth", part.depth).Int("size", static_cast<std::int64_t>(data.size()));
    Finish(line, part);
  }
  void Url(std::string_view url) override {
    JsonLine().Bytes("ev", "url").Bytes("data", url).Write(std::cout);
  }

 private:
  static void Finish(JsonLine& line, const mail::PartInfo& part) {
    if (part.cut) line.Bool("cut", true);
    line.Write(std::cout);
  }
};

int RunDumpMail(const std::vector<std::string>& args, const GlobalOptions&) {
  std::string path;
  for (const std::string& arg : args) {
    if (arg.size() > 1 && arg[0] == '-') return UsageError("dump mail: unknown option " + arg);
    if (!path.empty()) return UsageError("dump mail takes one input file");
    path = arg;
  }
  if (path.empty()) return UsageError("dump mail needs an input file (or - for stdin)");

  const bool useStdin = path == "-";
  const int fd = useStdin ? STDIN_FILENO : ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
  if (fd < 0) {
    std::cerr << "pelmix: " << path << ": " << std::strerror(errno) << "\n";
    return kExitFailure;
  }
  DumpSink sink;
  bool unreadable = false;
  const mail::ReadResult read = mail::ReadMessages(fd, [&](mail::MessageBuffer& message) {
    JsonLine head;
    head.Bytes("ev", "message").Int("index", static_cast<std::int64_t>(message.index));
    head.Int("bytes", static_cast<std::int64_t>(message.inputBytes));
    head.Write(std::cout);
    const mail::WalkReport report = mail::WalkMessage(message, sink);
    JsonLine end;
    if (report.readable) {
      end.Bytes("ev", "end").Int("parts", static_cast<std::int64_t>(report.parts));
      end.Int("links", static_cast<std::int64_t>(report.links));
    } else {
      unreadable = true;
      end.Bytes("ev", "error").Bytes("reason", report.error);
    }
    end.Strings("limits", mail::LimitNames(report.limits))
        .Strings("warnings", mail::WarningNames(report.warnings))
        .Write(std::cout);
  });
  if (!useStdin) ::close(fd);
  std::cout.flush();
  if (!read.ok) {
    std::cerr << "pelmix: " << path << ": " << read.error << "\n";
    return kExitFailure;
  }
  return unreadable ? kExitFailure : kExitOk;
}

}  // namespace

PELMIX_COMMAND({"dump mail", "FILE|-",
                "print what the MIME walk hands a mail session (subject, texts, attachments, "
                "images, links) as JSON Lines; an mbox gives every message",
                RunDumpMail})

}  // namespace pelmix::cli
