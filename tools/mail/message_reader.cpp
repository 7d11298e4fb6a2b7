#include "tools/mail/message_reader.h"

#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <optional>
#include <vector>

namespace pelmix::mail {

ReadResult ReadMessages(int fd, const MessageSplitter::MessageFn& onMessage,
                        std::size_t maxMessageBytes) {
  ReadResult result;
  std::vector<char> chunk(kReadChunkBytes);
  // The first bytes decide the mode; a pipe may deliver them one at a time.
  std::string head;
  std::optional<MessageSplitter> splitter;
  auto start = [&] {
    result.mbox = LooksLikeMbox(head);
    splitter.emplace(result.mbox ? MessageSplitter::Mode::kMbox : MessageSplitter::Mode::kSingle,
                     onMessage, maxMessageBytes);
    splitter->Feed(head);
  };
  for (;;) {
    const ssize_t n = ::read(fd, chunk.data(), chunk.size());
    if (n < 0) {
      if (errno == EINTR) continue;
      result.ok = false;
      result.error = std::strerror(errno);
      break;
    }
    if (n == 0) break;
    const std::string_view bytes(chunk.data(), static_cast<std::size_t>(n));
    if (splitter) {
      splitter->Feed(bytes);
      continue;
    }
    head.append(bytes);
    if (head.size() >= 5) start();
  }
  // Nothing read before a failure: no message at all, not an empty one.
  if (!result.ok && !splitter && head.empty()) return result;
  if (!splitter) start();
  // A message cut short by a read error is still delivered: whatever arrived is scanned.
  splitter->Finish();
  result.messages = splitter->messages();
  return result;
}

}  // namespace pelmix::mail
