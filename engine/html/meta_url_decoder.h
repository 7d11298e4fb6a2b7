// The target of a meta refresh, decoded as a data URL as it streams in; the decoded bytes
// are a document of their own and run through a nested pipeline that reports to the same
// receiver. A target that is not a data URL yields nothing.
//
// The receiver hears beginNested when a target starts and endNested when it finishes, as for
// any nested pipeline; the pipeline itself is only built once the URL yields its first byte,
// so the ordinary refreshes of a page cost no pipeline each. A page's handler keeps one
// decoder for all its refreshes: starting on a new target allocates nothing.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>

#include "engine/html/data_url_machine.h"
#include "engine/html/html_handler.h"

namespace html_decrunch {

class HtmlHandler::DecrunchMetaUrl final : private utils::DataUrlMachine::Handler {
 public:
  // `parentDepth` is the depth of the pipeline whose page holds the meta element. A decoder
  // is made idle.
  DecrunchMetaUrl(Receiver& receiver, std::size_t parentDepth);
  // Finishes a target still open, as finish() does.
  ~DecrunchMetaUrl() override;
  DecrunchMetaUrl(const DecrunchMetaUrl&) = delete;
  DecrunchMetaUrl& operator=(const DecrunchMetaUrl&) = delete;

  // A new target: finishes the open one, then tells the receiver beginNested.
  void start();
  // Ends the open target, if any: its pipeline ends itself, or the receiver hears endNested.
  // A failure of the receiver here is swallowed, as when a pipeline is dropped.
  void finish() noexcept;
  bool open() const { return open_; }

  // Bytes of the open target. After kMaxMetaUrlRejectedBytes bytes that did not continue
  // "data:" the decoder takes no more.
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
  bool open_ = false;
  // Decoded bytes of one feed call, handed to the page together.
  char decoded_[1024];
  std::size_t decodedCount_ = 0;
};

}  // namespace html_decrunch
