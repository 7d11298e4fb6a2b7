// The fuzzer's bytes are a PDF attachment. Its raw parser events are compared whole and in
// pieces whose sizes come from the first byte, then the whole scan (parser, inflation, text
// and link extraction) runs over it as the mail checker would read it.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

#include "engine/pdf/memory_file.h"
#include "engine/pdf/parser.h"
#include "engine/pdf/scan.h"

namespace {

// Folds every event into a digest, so that long streams cost no memory.
class DigestEvents final : public pdf::Parser::Handler {
 public:
  void objectBegin(std::uint32_t number, std::uint32_t generation) override {
    add('o', std::to_string(number) + " " + std::to_string(generation));
  }
  void objectEnd() override { add('e', {}); }
  void streamBegin(bool image) override { add(image ? 'I' : 's', {}); }
  void streamEnd() override { add('E', {}); }
  void streamByte(char c) override { add('b', std::string_view(&c, 1)); }
  void link(const std::string& target) override { add('l', target); }

  std::uint64_t digest() const { return digest_; }

 private:
  void add(char tag, std::string_view bytes) {
    digest_ = (digest_ ^ static_cast<std::uint8_t>(tag)) * 1099511628211u;
    for (const char c : bytes) digest_ = (digest_ ^ static_cast<std::uint8_t>(c)) * 1099511628211u;
  }

  std::uint64_t digest_ = 14695981039346656037u;
};

class Discard final : public ap::PdfHandler {
 public:
  void text(const std::string&) override {}
  void link(const std::string&) override {}
};

std::uint64_t Events(std::string_view data, std::size_t piece) {
  DigestEvents events;
  pdf::Parser parser(events);
  for (std::size_t at = 0; at < data.size(); at += piece) {
    parser.feed(data.substr(at, piece));
  }
  parser.finish();
  return events.digest();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  if (size == 0) return 0;
  const std::size_t piece = 1 + data[0] % 13;
  const std::string_view bytes(reinterpret_cast<const char*>(data) + 1, size - 1);
  if (Events(bytes, bytes.size() + 1) != Events(bytes, piece)) std::abort();
  pdf::MemoryFile file(bytes);
  Discard sink;
  pdf::Scan(file, sink);
  return 0;
}
