// The target of a meta refresh, decoded as a data URL as it streams in; the decoded bytes
// are a document of their own and run through a nested pipeline that reports to the same
// receiver. A target that is not a data URL yields nothing.
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

  // One byte of the target. A failure stops this byte and is swallowed; after
  // kMaxMetaUrlRejectedBytes failures the decoder takes no more bytes.
  void feed(std::uint8_t byte);

 private:
  void byte(std::uint8_t b) override;

  std::unique_ptr<html::Decrunch> page_;
  utils::DataUrlMachine decoder_;
  std::size_t rejected_ = 0;
};

}  // namespace html_decrunch
