// The target of a meta refresh, decoded as a data URL as it streams in; the decoded bytes
// are a document of their own and run through a nested pipeline that reports to the same
// receiver. A target that is not a data URL yields nothing.
//
// The receiver hears beginNested when the decoder is made and endNested when it goes, as for
// any nested pipeline; the pipeline itself is only built once the URL yields its first byte,
// so the ordinary refreshes of a page cost no pipeline each.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>

#include "engine/html/data_url_machine.h"
#include "engine/html/html_handler.h"

namespace html_decrunch {

class HtmlHandler::DecrunchMetaUrl final : private utils::DataUrlMachine::Handler {
 public:
  // `parentDepth` is the depth of the pipeline whose page holds the meta element.
  DecrunchMetaUrl(Receiver& receiver, std::size_t parentDepth);
  ~DecrunchMetaUrl() override;
  DecrunchMetaUrl(const DecrunchMetaUrl&) = delete;
  DecrunchMetaUrl& operator=(const DecrunchMetaUrl&) = delete;

  // Bytes of the target. After kMaxMetaUrlRejectedBytes bytes that did not continue "data:"
  // the decoder takes no more.
  void feed(std::uint8_t byte) { feed(reinterpret_cast<const char*>(&byte), 1); }
  void feed(const char* data, std::size_t length);

 private:
  void byte(std::uint8_t b) override;
  void handOver();

  Receiver& receiver_;
  std::size_t parentDepth_;
  std::unique_ptr<html::Decrunch> page_;  // built at the first decoded byte
  utils::DataUrlMachine decoder_;
  std::size_t rejected_ = 0;
  // Decoded bytes of one feed call, handed to the page together.
  char decoded_[1024];
  std::size_t decodedCount_ = 0;
};

}  // namespace html_decrunch
