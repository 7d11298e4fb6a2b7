// A sink that writes down every walk event in a compact line, and the corpus reader.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "tests/tools/pelmix/cli_runner.h"
#include "tools/mail/message_sink.h"

namespace pelmix::mail_test {

// Lines: "S<depth> subject", "T<depth> type[ charset[>utf8]][ cut] | data",
// "I<depth> type size[ cut]", "A<depth> name|type|size[ cut]", "U url".
class RecordingSink : public mail::MessageSink {
 public:
  void Subject(std::string_view subject, int depth) override {
    events.push_back("S" + std::to_string(depth) + " " + std::string(subject));
  }
  void Text(std::string_view data, const mail::PartInfo& part) override {
    std::string line = "T" + std::to_string(part.depth) + " " + std::string(part.contentType);
    if (!part.charset.empty()) {
      line += " " + std::string(part.charset) + (part.converted ? ">utf8" : "");
    }
    events.push_back(line + Cut(part) + " | " + std::string(data));
  }
  void Image(std::string_view data, const mail::PartInfo& part) override {
    events.push_back("I" + std::to_string(part.depth) + " " + std::string(part.contentType) + " " +
                     std::to_string(data.size()) + Cut(part));
  }
  void Attachment(std::string_view name, std::string_view data,
                  const mail::PartInfo& part) override {
    events.push_back("A" + std::to_string(part.depth) + " " + std::string(name) + "|" +
                     std::string(part.contentType) + "|" + std::to_string(data.size()) + Cut(part));
    attachments.emplace_back(data);
  }
  void Url(std::string_view url) override { events.push_back("U " + std::string(url)); }

  std::vector<std::string> events;
  std::vector<std::string> attachments;  // data of each attachment, in order

 private:
  static std::string Cut(const mail::PartInfo& part) { return part.cut ? " cut" : ""; }
};

inline std::string CorpusPath(const std::string& name) {
  return std::string(PELMIX_MAIL_DATA_DIR) + "/" + name;
}

inline std::string Corpus(const std::string& name) {
  return pelmix::testing::SlurpFile(CorpusPath(name));
}

}  // namespace pelmix::mail_test
