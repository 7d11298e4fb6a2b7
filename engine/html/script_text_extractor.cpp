#include "engine/html/script_text_extractor.h"

#include <algorithm>
#include <cstring>

#include "engine/html/byte_scan.h"
#include "engine/html/char_class.h"

namespace html_decrunch {
namespace {

bool isUrlByte(std::uint8_t b) {
  if (html::isAsciiLetter(b) || html::isAsciiDigit(b)) return true;
  switch (b) {
    case '%':
    case '+':
    case '-':
    case '.':
    case '/':
    case '_':
    case '~':
      return true;
    default:
      return false;
  }
}

}  // namespace

void ScriptUrlFinder::feed(const char* data, std::size_t length) {
  static constexpr char kSeparator[] = "://";
  const auto* const bytes = reinterpret_cast<const std::uint8_t*>(data);
  for (std::size_t i = 0; i < length; ++i) {
    // Waiting for a ':' with nothing matched: no byte before it changes anything.
    if (!inRun_ && separator_ == 0) {
      i = static_cast<std::size_t>(html::findByte(bytes + i, bytes + length, ':') - bytes);
      if (i == length) break;
    }
    const std::uint8_t b = bytes[i];
    if (inRun_) {
      if (isUrlByte(b)) {
        if (runBytes_ < kScriptUrlBytes) url_[runBytes_] = static_cast<char>(b);
        ++runBytes_;
        continue;
      }
      endRun();
    }
    if (b == static_cast<std::uint8_t>(kSeparator[separator_])) {
      if (++separator_ == 3) {
        separator_ = 0;
        inRun_ = true;
        runBytes_ = 0;
      }
    } else {
      separator_ = b == ':' ? 1 : 0;
    }
  }
}

void ScriptUrlFinder::finish() {
  if (inRun_) endRun();
  separator_ = 0;
}

void ScriptUrlFinder::endRun() {
  inRun_ = false;
  const std::size_t kept = std::min(runBytes_, kScriptUrlBytes);
  if (kept > kMinScriptUrlBytes) receiver_.scriptUrl(std::string_view(url_, kept));
}

ScriptTextExtractor::ScriptTextExtractor(TextHandler& output,
                                         html::DecrunchInterfaces::Handler& receiver)
    : output_(output), urls_(receiver), scanner_(this) {}

void ScriptTextExtractor::finish() {
  scanner_.finish();
  // A half-read escape stands for itself.
  if (escape_ >= 1) append('%');
  if (escape_ == 2) append(firstDigit_);
  escape_ = 0;
  handOver();
  urls_.finish();
  output_.end();
}

void ScriptTextExtractor::text(const char* data, std::size_t length) {
  const auto* p = reinterpret_cast<const std::uint8_t*>(data);
  const auto* const end = p + length;
  while (p < end) {
    // Outside an escape, everything up to the next '%' is copied as it is.
    if (escape_ == 0) {
      const std::uint8_t* stop = html::findByte(p, end, '%');
      appendRun(p, static_cast<std::size_t>(stop - p));
      p = stop;
      if (p == end) break;
    }
    decode(*p++);
  }
}

void ScriptTextExtractor::decode(std::uint8_t b) {
  if (escape_ == 1) {
    if (html::hexDigitValue(b) >= 0) {
      firstDigit_ = b;
      escape_ = 2;
      return;
    }
    escape_ = 0;
    append('%');
  } else if (escape_ == 2) {
    const int low = html::hexDigitValue(b);
    escape_ = 0;
    if (low >= 0) {
      append(static_cast<std::uint8_t>(html::hexDigitValue(firstDigit_) * 16 + low));
      return;
    }
    append('%');
    append(firstDigit_);
  }
  // The byte that broke an escape may start the next one.
  if (b == '%') {
    escape_ = 1;
    return;
  }
  append(b);
}

void ScriptTextExtractor::append(std::uint8_t b) {
  // A full buffer is handed over even while an escape is pending ("%%%..." never ends one).
  if (count_ == kScriptTextBytes) handOver();
  buffer_[count_++] = static_cast<char>(b);
  if (count_ > kScriptHandOverBytes && escape_ == 0) handOver();
}

// The same as append for each byte, with no escape pending.
void ScriptTextExtractor::appendRun(const std::uint8_t* data, std::size_t length) {
  while (length > 0) {
    if (count_ == kScriptTextBytes) handOver();
    // append hands over as soon as the buffer holds more than kScriptHandOverBytes.
    const std::size_t room = count_ > kScriptHandOverBytes ? 1 : kScriptHandOverBytes + 1 - count_;
    const std::size_t n = std::min(length, room);
    std::memcpy(buffer_ + count_, data, n);
    count_ += n;
    data += n;
    length -= n;
    if (count_ > kScriptHandOverBytes) handOver();
  }
}

void ScriptTextExtractor::handOver() {
  if (count_ == 0) return;
  const std::size_t n = count_;
  count_ = 0;
  output_.text(buffer_, n);
  urls_.feed(buffer_, n);
}

}  // namespace html_decrunch
