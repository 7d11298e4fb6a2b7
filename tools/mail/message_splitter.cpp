#include "tools/mail/message_splitter.h"

#include <cstring>
#include <utility>

namespace pelmix::mail {
namespace {

constexpr std::string_view kEnvelope = "From ";

}  // namespace

bool LooksLikeMbox(std::string_view head) { return head.substr(0, kEnvelope.size()) == kEnvelope; }

MessageSplitter::MessageSplitter(Mode mode, MessageFn onMessage, std::size_t maxMessageBytes)
    : mode_(mode), onMessage_(std::move(onMessage)), maxMessageBytes_(maxMessageBytes) {
  if (mode_ == Mode::kSingle) Open();
}

void MessageSplitter::Open() {
  open_ = true;
  buffer_.Clear();
  buffer_.index = ++count_;
}

void MessageSplitter::Body(std::string_view bytes) {
  if (bytes.empty()) return;
  if (!open_) Open();  // text before the first envelope line is a message of its own
  buffer_.inputBytes += bytes.size();
  const std::size_t room = maxMessageBytes_ - buffer_.size();
  if (bytes.size() > room) {
    buffer_.cut = true;
    bytes = bytes.substr(0, room);
  }
  buffer_.Append(bytes);
}

void MessageSplitter::Emit() {
  if (!open_) return;
  // An mbox writer ends each message with a blank line before the next envelope.
  if (mode_ == Mode::kMbox && !buffer_.cut) {
    const std::string_view bytes = buffer_.bytes();
    std::size_t drop = 0;
    if (bytes.ends_with("\r\n\r\n")) {
      drop = 2;
    } else if (bytes.ends_with("\n\n")) {
      drop = 1;
    }
    buffer_.DropBack(drop);
    buffer_.inputBytes -= drop;
  }
  open_ = false;
  onMessage_(buffer_);
}

void MessageSplitter::Feed(std::string_view chunk) {
  if (mode_ == Mode::kSingle) {
    Body(chunk);
    return;
  }
  std::size_t i = 0;
  while (i < chunk.size()) {
    switch (state_) {
      case State::kLineStart: {
        if (chunk[i] == kEnvelope[matched_]) {
          ++i;
          if (++matched_ == kEnvelope.size()) {
            matched_ = 0;
            Emit();
            Open();
            state_ = State::kEnvelope;
          }
          break;
        }
        // Not an envelope after all: the matched bytes belong to the line.
        Body(kEnvelope.substr(0, matched_));
        matched_ = 0;
        state_ = State::kInLine;
        break;
      }
      case State::kInLine:
      case State::kEnvelope: {
        const char* start = chunk.data() + i;
        const void* lf = std::memchr(start, '\n', chunk.size() - i);
        const std::size_t n =
            lf == nullptr ? chunk.size() - i : static_cast<const char*>(lf) - start + 1;
        if (state_ == State::kInLine) Body(chunk.substr(i, n));
        i += n;
        if (lf != nullptr) state_ = State::kLineStart;
        break;
      }
    }
  }
}

void MessageSplitter::Finish() {
  if (matched_ > 0) {
    Body(kEnvelope.substr(0, matched_));
    matched_ = 0;
  }
  state_ = State::kLineStart;
  Emit();
}

}  // namespace pelmix::mail
