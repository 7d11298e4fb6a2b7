// Turns the PDF parser's events into what the mail checker wants from an attachment: the
// strings that content streams show and the targets of /URI entries. Streams are buffered,
// inflated with zlib, read line by line for the BT/ET, Tj and TJ operators and searched for
// /URI strings, which also finds links packed into compressed object streams. Every buffer
// here is bounded, and a stream cut at a bound is still scanned as far as it got.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "engine/pdf/parser.h"
#include "engine/pdf/pdf_handler.h"

namespace pdf_strs {

// Raw bytes of one stream kept for inflation; the rest of the stream is dropped.
inline constexpr std::size_t kMaxStreamBytes = 4 * 1024 * 1024;
// Inflated bytes of one stream; inflation stops there and the output so far is scanned.
inline constexpr std::size_t kMaxInflatedBytes = 16 * 1024 * 1024;
// Inflated bytes of all streams of one scan; later streams are not inflated. Deflate packs
// about a thousand to one, so without this a file of many small bombs would cost minutes.
inline constexpr std::size_t kMaxInflatedBytesPerScan = 256 * 1024 * 1024;
// The output window offered to each inflate call.
inline constexpr std::size_t kInflateWindow = 16384;

enum class InflateResult {
  kEmpty,       // no input, no output
  kDone,        // the output is the whole inflated data (or all of it the input held)
  kLimit,       // the output stopped at the limit
  kError,       // bad data: the output is what came before it, or "err"
  kInitFailed,  // the output is "inflateInit not Z_OK"
};

// Inflates the zlib data at the start of `input` into `output` (replaced), producing at most
// `limit` bytes. Bytes after the end of the compressed data are ignored; data cut short gives
// what it held. Failures leave a placeholder text that holds no operator and no link.
InflateResult Decompress(std::string_view input, std::size_t limit, std::string& output);

// Sends the strings of the Tj and TJ lines inside BT ... ET to `sink`, in order.
void ExtractText(std::string_view data, ap::PdfHandler& sink);
// Sends each "/URI (target)" target found in `data` to `sink`, in order.
void ExtractLinks(std::string_view data, ap::PdfHandler& sink);

class Simplifier final : public pdf::Parser::Handler {
 public:
  explicit Simplifier(ap::PdfHandler& sink) : sink_(sink) {}
  Simplifier(const Simplifier&) = delete;
  Simplifier& operator=(const Simplifier&) = delete;

  void objectBegin(std::uint32_t, std::uint32_t) override {}
  void objectEnd() override {}
  void streamBegin(bool image) override { isImage_ = image; }
  void streamEnd() override;
  void streamByte(char c) override {
    // Image data is never read, so it is not kept either.
    if (!isImage_ && buffer_.size() < kMaxStreamBytes) buffer_.push_back(c);
  }
  void link(const std::string& target) override { sink_.link(target); }

 private:
  ap::PdfHandler& sink_;
  bool isImage_ = false;
  std::string buffer_;    // raw bytes of the current stream
  std::string inflated_;  // kept between streams so that its memory is reused
  std::size_t inflatedTotal_ = 0;
  bool streamCutTraced_ = false;
  bool inflateCutTraced_ = false;
};

}  // namespace pdf_strs
