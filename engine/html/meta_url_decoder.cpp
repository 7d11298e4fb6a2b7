#include "engine/html/meta_url_decoder.h"

#include <exception>

#include "engine/html/decrunch.h"

namespace html_decrunch {

HtmlHandler::DecrunchMetaUrl::DecrunchMetaUrl(Receiver& receiver, std::size_t parentDepth)
    : page_(std::make_unique<html::Decrunch>(receiver, html::Decrunch::NestedIn{parentDepth})),
      decoder_(*this) {}

HtmlHandler::DecrunchMetaUrl::~DecrunchMetaUrl() = default;

void HtmlHandler::DecrunchMetaUrl::feed(std::uint8_t byte) {
  if (rejected_ >= kMaxMetaUrlRejectedBytes) return;
  try {
    decoder_.feed(byte);
  } catch (const std::exception&) {
    // Bytes before "data:" (or the target of an ordinary refresh) end up here.
    ++rejected_;
  }
}

void HtmlHandler::DecrunchMetaUrl::byte(std::uint8_t b) {
  const char c = static_cast<char>(b);
  page_->feed(&c, 1);
}

}  // namespace html_decrunch
