// Page text on its way to the sink chain: character references are decoded, and the bytes
// are handed on in pieces of at most kTextCollectorBytes. Text is delivered when the buffer
// fills, when a tag flushes it (with a break), or when a change of the sink chain hands it
// over first (without one). Whatever is still held when the page ends is not delivered.
#pragma once

#include <cstddef>
#include <cstdint>

#include "engine/html/decrunch_limits.h"
#include "engine/html/sink_chain.h"

namespace html_decrunch {

class TextCollector {
 public:
  explicit TextCollector(SinkChain& chain) : chain_(chain) {}
  TextCollector(const TextCollector&) = delete;
  TextCollector& operator=(const TextCollector&) = delete;

  void add(const char* data, std::size_t length);
  void add(std::uint8_t byte);
  // Hands the buffered bytes to the chain as it stands; a reference being read stays
  // pending.
  void handOver();
  // Gives up a pending reference (its bytes become text), hands the buffer over, then sends
  // a break along the chain.
  void flush();

 private:
  void append(std::uint8_t byte);
  void appendBytes(const char* data, std::size_t length);
  void endReference(std::uint8_t byte);
  // The '&' and the held bytes, as written.
  void giveUpReference();

  SinkChain& chain_;
  char buffer_[kTextCollectorBytes];
  std::size_t count_ = 0;
  char reference_[kMaxReferenceBytes];
  std::size_t referenceCount_ = 0;
  bool inReference_ = false;
};

}  // namespace html_decrunch
