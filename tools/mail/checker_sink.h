// A MessageSink that hands every part straight to a mail checker of the engine (anything with
// the mail checker's SetSubject, AddText, AddAttachment and AddUrl), without a session in
// between: for the fuzz target and the benchmark that drive the engine directly. Hosts go
// through the module's mail sessions instead.
#pragma once

#include <string>
#include <string_view>

#include "tools/mail/message_sink.h"

namespace pelmix::mail {

template <class Checker>
class CheckerSink final : public MessageSink {
 public:
  explicit CheckerSink(Checker& checker) : checker_(checker) {}
  void Subject(std::string_view subject, int depth) override {
    if (depth == 0) checker_.SetSubject(std::string(subject));
  }
  void Text(std::string_view data, const PartInfo&) override {
    checker_.AddText(data.data(), data.size());
  }
  void Image(std::string_view, const PartInfo&) override {}  // the checker ignores images
  void Attachment(std::string_view name, std::string_view data, const PartInfo& part) override {
    checker_.AddAttachment(std::string(name), std::string(part.contentType), data.data(),
                           data.size());
  }
  void Url(std::string_view url) override {
    if (!url.empty()) checker_.AddUrl(std::string(url));
  }

 private:
  Checker& checker_;
};

}  // namespace pelmix::mail
