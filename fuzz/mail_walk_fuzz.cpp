// The fuzzer's bytes are a mail input as a host receives it. The mbox splitter must give the
// same messages whole and in pieces whose sizes come from the first byte; each message is
// walked with the real budgets and with tight ones, and what the walk hands on must keep its
// promises (bare lower-case types, links that are links, nothing over a budget).
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>
#include <vector>

#include "tools/mail/message_splitter.h"
#include "tools/mail/message_walk.h"

namespace {

using pelmix::mail::MailLimits;
using pelmix::mail::MessageBuffer;
using pelmix::mail::MessageSplitter;

void Check(bool ok) {
  if (!ok) std::abort();
}

class CheckingSink final : public pelmix::mail::MessageSink {
 public:
  explicit CheckingSink(const MailLimits& limits) : limits_(limits) {}

  void Subject(std::string_view subject, int depth) override {
    Check(subject.size() <= limits_.maxSubjectBytes);
    CheckDepth(depth);
  }
  void Text(std::string_view data, const pelmix::mail::PartInfo& part) override {
    Check(part.contentType.starts_with("text/"));
    CheckPart(data, part);
  }
  void Image(std::string_view data, const pelmix::mail::PartInfo& part) override {
    Check(part.contentType.starts_with("image/"));
    CheckPart(data, part);
  }
  void Attachment(std::string_view, std::string_view data,
                  const pelmix::mail::PartInfo& part) override {
    CheckPart(data, part);
  }
  void Url(std::string_view url) override {
    Check(url.size() <= limits_.maxLinkBytes);
    Check(url.size() > 7 && (url[0] | 0x20) == 'h');
    Check(++links_ <= limits_.maxLinks);
  }

 private:
  void CheckDepth(int depth) { Check(depth >= 0 && depth <= limits_.maxDepth + 1); }
  void CheckPart(std::string_view data, const pelmix::mail::PartInfo& part) {
    Check(data.size() <= limits_.maxPartBytes);
    Check(part.contentType.find_first_of("; \tABCDEFGHIJKLMNOPQRSTUVWXYZ") ==
          std::string_view::npos);
    Check(part.contentType.find('/') != std::string_view::npos);
    CheckDepth(part.depth);
  }

  const MailLimits& limits_;
  std::size_t links_ = 0;
};

std::vector<std::string> Split(std::string_view input, std::size_t piece) {
  std::vector<std::string> messages;
  MessageSplitter splitter(
      MessageSplitter::Mode::kMbox, [&](MessageBuffer& m) { messages.emplace_back(m.bytes()); },
      1 << 16);
  for (std::size_t at = 0; at < input.size(); at += piece) splitter.Feed(input.substr(at, piece));
  splitter.Finish();
  return messages;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  if (size == 0) return 0;
  const std::string_view input(reinterpret_cast<const char*>(data) + 1, size - 1);
  const std::size_t piece = 1 + data[0] % 13;
  const std::vector<std::string> messages = Split(input, input.size() + 1);
  Check(Split(input, piece) == messages);

  MailLimits tight;
  tight.maxHeaderLines = 40;
  tight.maxHeaderParams = 20;
  tight.maxDelimiterLines = 20;
  tight.maxParts = 12;
  tight.maxDepth = 4;
  tight.maxPartBytes = 256;
  tight.maxSubjectBytes = 16;
  tight.maxLinks = 3;
  tight.maxLinkBytes = 24;
  const MailLimits real;
  // The whole input as one message, then each mbox message.
  const MailLimits* const both[] = {&real, &tight};
  for (const MailLimits* limits : both) {
    CheckingSink sink(*limits);
    const auto report = pelmix::mail::WalkMessage(input, sink, *limits);
    Check(report.readable == report.error.empty());
    Check(report.parts <= limits->maxParts);
  }
  for (const std::string& message : messages) {
    CheckingSink sink(tight);
    pelmix::mail::WalkMessage(message, sink, tight);
  }
  return 0;
}
