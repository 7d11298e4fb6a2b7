// Splits an input into messages as they stream in: either the whole input is one message, or
// it is an mbox, where every line starting with "From " opens the next message (the line
// itself is the envelope, not part of the message). Lines quoted as ">From " stay as they are.
// A push machine: any chunking gives the same messages. Each message is held only up to the
// message budget; the rest of it is counted and skipped.
#pragma once

#include <cstddef>
#include <functional>
#include <string_view>

#include "tools/mail/mail_limits.h"
#include "tools/mail/message_buffer.h"

namespace pelmix::mail {

class MessageSplitter {
 public:
  enum class Mode { kSingle, kMbox };
  // Called once per message; the buffer is reused for the next one afterwards.
  using MessageFn = std::function<void(MessageBuffer&)>;

  MessageSplitter(Mode mode, MessageFn onMessage, std::size_t maxMessageBytes = kMaxMessageBytes);

  void Feed(std::string_view chunk);
  // Emits the last message. In single mode there is always exactly one, even when empty.
  void Finish();

  std::size_t messages() const { return count_; }

 private:
  enum class State { kLineStart, kInLine, kEnvelope };
  void Open();
  void Body(std::string_view bytes);
  void Emit();

  Mode mode_;
  MessageFn onMessage_;
  std::size_t maxMessageBytes_;
  State state_ = State::kLineStart;
  std::size_t matched_ = 0;  // bytes of "From " matched at the start of the current line
  bool open_ = false;
  std::size_t count_ = 0;
  MessageBuffer buffer_;
};

// Whether an input starting with `head` is an mbox; needs the first five bytes (fewer only
// when the input is shorter).
bool LooksLikeMbox(std::string_view head);

}  // namespace pelmix::mail
