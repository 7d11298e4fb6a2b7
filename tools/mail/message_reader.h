// Reads the messages of one input (a file descriptor): an mbox when its first line starts
// with "From ", otherwise one message. Reads in fixed chunks, so a large mbox is never held
// whole: at most one message (within the message budget) is in memory at a time.
#pragma once

#include <cstddef>
#include <string>

#include "tools/mail/message_splitter.h"

namespace pelmix::mail {

inline constexpr std::size_t kReadChunkBytes = 64u << 10;

struct ReadResult {
  bool ok = true;
  std::string error;  // why reading stopped, when !ok (messages before it were delivered)
  bool mbox = false;
  std::size_t messages = 0;
};

ReadResult ReadMessages(int fd, const MessageSplitter::MessageFn& onMessage,
                        std::size_t maxMessageBytes = kMaxMessageBytes);

}  // namespace pelmix::mail
