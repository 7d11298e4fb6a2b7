// The fuzzer's bytes are a page. It runs through the whole decrunch pipeline three times:
// whole, cut into pieces whose sizes come from the page's first byte, and whole with the bulk
// paths off (every byte through its state's process), and the receiver's calls must be the
// same every way. Nesting, sinks and element strings are exercised on every input.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

#include "engine/html/decrunch.h"
#include "engine/html/state_machine.h"

namespace {

// Folds every call into a digest, so that long pages cost no memory.
class DigestReceiver final : public html::Decrunch::Handler {
 public:
  class Sink final : public html::Decrunch::TextHandler {
   public:
    Sink(DigestReceiver& owner, char tag) : owner_(owner), tag_(tag) {}
    void text(const char* data, std::size_t n) override {
      owner_.add(tag_, std::string_view(data, n));
    }
    void breakText() override { owner_.add(tag_, "break"); }
    void end() override { owner_.add(tag_, "end"); }

   private:
    DigestReceiver& owner_;
    char tag_;
  };

  void text(const char* data, std::size_t n) override { add('t', std::string_view(data, n)); }
  void breakText() override { add('t', "break"); }
  void end() override { add('t', "end"); }
  void url(std::string_view value, html::UrlKind kind) override {
    add(static_cast<char>('0' + kind), value);
  }
  void scriptUrl(std::string_view text) override { add('u', text); }
  TextHandler* commentSink() override { return &comment_; }
  TextHandler* titleSink() override { return &title_; }
  TextHandler* descriptionSink() override { return &description_; }
  TextHandler* selectSink() override { return &select_; }
  TextHandler* anchorSink(const html_decrunch::HtmlHandler& h) override {
    add('a', h.first().value);
    return &anchor_;
  }
  TextHandler* scriptSink(const html_decrunch::HtmlHandler& h) override {
    add('s', h.first().value);
    return &script_;
  }
  void input(const html_decrunch::HtmlHandler& h) override {
    add('i', h.first().value);
    add('i', h.second().value);
    add('i', h.third().value);
  }
  void beginNested() override {
    ++depth_;
    add('n', "begin");
  }
  void endNested() override {
    if (depth_-- == 0) std::abort();  // more ends than begins
    add('n', "end");
  }

  std::uint64_t digest() const { return digest_; }
  std::size_t depth() const { return depth_; }

 private:
  void add(char tag, std::string_view bytes) {
    digest_ = (digest_ ^ static_cast<std::uint8_t>(tag)) * 1099511628211u;
    for (const char c : bytes) digest_ = (digest_ ^ static_cast<std::uint8_t>(c)) * 1099511628211u;
    digest_ = (digest_ ^ 0xFF) * 1099511628211u;
  }

  std::uint64_t digest_ = 14695981039346656037u;
  std::size_t depth_ = 0;
  Sink comment_{*this, 'c'}, title_{*this, 'T'}, description_{*this, 'd'}, select_{*this, 'S'},
      anchor_{*this, 'A'}, script_{*this, 'X'};
};

std::uint64_t Run(const std::uint8_t* data, std::size_t size, std::size_t piece) {
  DigestReceiver receiver;
  {
    html::Decrunch pipeline(receiver, false);
    const char* bytes = reinterpret_cast<const char*>(data);
    for (std::size_t at = 0; at < size; at += piece) {
      pipeline.feed(bytes + at, std::min(piece, size - at));
    }
  }
  if (receiver.depth() != 0) std::abort();  // a nested pipeline never ended
  return receiver.digest();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  if (size == 0) return 0;
  const std::size_t piece = 1 + data[0] % 13;
  const std::uint64_t whole = Run(data + 1, size - 1, size);
  if (whole != Run(data + 1, size - 1, piece)) std::abort();
  util::setBulkScanning(false);
  const std::uint64_t bytewise = Run(data + 1, size - 1, size);
  util::setBulkScanning(true);
  if (whole != bytewise) std::abort();
  return 0;
}
