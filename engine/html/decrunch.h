// The decrunch pipeline of one document: a byte counter, the JSON validator and the HTML
// tokenizer driving the HTML handler, which reports everything it extracts to a receiver
// (html::Decrunch::Handler). Content hidden inside the page (a data URL behind a meta
// refresh, HTML written in script strings) runs through nested pipelines of the same kind
// that report to the same receiver, at most kMaxDecrunchNesting levels deep.
//
// Feed the document in chunks of any size: the receiver hears the same calls. There is no
// end-of-input call; text still buffered when the pipeline is destroyed is not delivered.
#pragma once

#include <cstddef>
#include <cstdint>

#include "engine/html/decrunch_interfaces.h"
#include "engine/html/decrunch_limits.h"
#include "engine/html/html_handler.h"
#include "engine/html/json_state_machine.h"
#include "engine/html/tokenizer.h"

namespace html {

// The pipeline's byte count after `added` more bytes: it stops at the largest 32-bit value
// rather than wrapping round to a small count.
constexpr std::uint32_t addByteCount(std::uint32_t total, std::size_t added) {
  constexpr std::uint32_t kMax = 0xFFFFFFFFu;
  return added >= kMax - total ? kMax : total + static_cast<std::uint32_t>(added);
}

class Decrunch : public DecrunchInterfaces {
 public:
  // A nested pipeline tells the receiver beginNested now and endNested when it is destroyed.
  Decrunch(Handler& receiver, bool nested);

  // The pipeline of content found inside a document read by a pipeline at `parentDepth`
  // (the top-level document is at depth 0). Callers create none when parentDepth has
  // reached kMaxDecrunchNesting.
  struct NestedIn {
    std::size_t parentDepth;
    // The owner has told the receiver beginNested already (it builds the pipeline late).
    bool announced = false;
  };
  Decrunch(Handler& receiver, NestedIn parent);

  ~Decrunch();
  Decrunch(const Decrunch&) = delete;
  Decrunch& operator=(const Decrunch&) = delete;

  void feed(const char* data, std::size_t length);

  // Bytes fed so far (saturating at the largest 32-bit value).
  std::uint32_t byteCount() const { return bytes_; }
  // Whether the document so far can still be one JSON value.
  bool jsonAccepted() const { return !jsonRejected_ && json_.accepted(); }
  std::size_t depth() const { return handler_.depth(); }
  const html_decrunch::HtmlHandler& handler() const { return handler_; }

 private:
  std::uint32_t bytes_ = 0;
  utils::JSONStateMachine<char> json_;
  html_decrunch::HtmlHandler handler_;
  FastParserMachine<char, html_decrunch::HtmlHandler> tokenizer_;
  bool jsonRejected_ = false;
};

}  // namespace html
