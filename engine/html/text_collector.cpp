#include "engine/html/text_collector.h"

#include <algorithm>
#include <cstring>

#include "engine/html/char_class.h"
#include "engine/html/entities.h"

namespace html_decrunch {

static_assert(kMaxReferenceBytes >= html::kMaxDecodedReferenceBytes);

void TextCollector::add(const char* data, std::size_t length) {
  const char* const end = data + length;
  while (data < end) {
    if (inReference_) {
      add(static_cast<std::uint8_t>(*data++));
      continue;
    }
    // Plain text up to the next '&' is copied as it is.
    const void* amp = std::memchr(data, '&', static_cast<std::size_t>(end - data));
    const char* stop = amp != nullptr ? static_cast<const char*>(amp) : end;
    appendBytes(data, static_cast<std::size_t>(stop - data));
    data = stop;
    if (data < end) {
      inReference_ = true;
      referenceCount_ = 0;
      ++data;
    }
  }
}

void TextCollector::add(std::uint8_t byte) {
  if (byte == '&') {
    // A second '&' inside a reference: the first was not one, and keeps its bytes.
    if (inReference_) giveUpReference();
    inReference_ = true;
    referenceCount_ = 0;
    return;
  }
  if (!inReference_) {
    append(byte);
    return;
  }
  if (byte == ';') {
    endReference(byte);
    return;
  }
  reference_[referenceCount_++] = static_cast<char>(byte);
  const bool referenceByte = byte == '#' || html::isAsciiLetter(byte) || html::isAsciiDigit(byte);
  if (referenceByte && referenceCount_ < kMaxReferenceBytes) return;
  giveUpReference();
}

void TextCollector::endReference(std::uint8_t semicolon) {
  std::size_t n = referenceCount_;
  if (html::decodeReference(reference_, n)) {
    appendBytes(reference_, n);
  } else {
    append('&');
    appendBytes(reference_, referenceCount_);
    append(semicolon);
  }
  inReference_ = false;
  referenceCount_ = 0;
}

void TextCollector::giveUpReference() {
  append('&');
  appendBytes(reference_, referenceCount_);
  inReference_ = false;
  referenceCount_ = 0;
}

void TextCollector::append(std::uint8_t byte) {
  buffer_[count_++] = static_cast<char>(byte);
  if (count_ == kTextCollectorBytes) handOver();
}

void TextCollector::appendBytes(const char* data, std::size_t length) {
  while (length > 0) {
    const std::size_t n = std::min(length, kTextCollectorBytes - count_);
    std::memcpy(buffer_ + count_, data, n);
    count_ += n;
    data += n;
    length -= n;
    if (count_ == kTextCollectorBytes) handOver();
  }
}

void TextCollector::handOver() {
  if (count_ == 0) return;
  const std::size_t n = count_;
  count_ = 0;
  chain_.text(buffer_, n);
}

void TextCollector::flush() {
  if (inReference_) giveUpReference();
  handOver();
  chain_.breakText();
}

}  // namespace html_decrunch
