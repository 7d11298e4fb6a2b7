#include "engine/html/meta_url_decoder.h"

#include <algorithm>

#include "engine/html/decrunch.h"

namespace html_decrunch {

HtmlHandler::DecrunchMetaUrl::DecrunchMetaUrl(Receiver& receiver, std::size_t parentDepth)
    : receiver_(receiver), parentDepth_(parentDepth), decoder_(*this) {}

HtmlHandler::DecrunchMetaUrl::~DecrunchMetaUrl() { finish(); }

void HtmlHandler::DecrunchMetaUrl::start() {
  finish();
  decoder_.restart();
  rejected_ = 0;
  decodedCount_ = 0;
  receiver_.beginNested();
  open_ = true;
}

// A page that was built ends itself; otherwise the nesting the receiver was told of ends here.
void HtmlHandler::DecrunchMetaUrl::finish() noexcept {
  if (!open_) return;
  open_ = false;
  if (page_ != nullptr) {
    page_.reset();
    return;
  }
  try {
    receiver_.endNested();
  } catch (...) {
    // Nobody is left to report the receiver's failure to.
  }
}

void HtmlHandler::DecrunchMetaUrl::feed(const char* data, std::size_t length) {
  while (length > 0 && rejected_ < kMaxMetaUrlRejectedBytes) {
    // While the scheme is incomplete, a slice no longer than the rejections still allowed
    // cannot overshoot them; after it nothing is rejected any more.
    const std::size_t slice =
        decoder_.inHeader() ? std::min(length, kMaxMetaUrlRejectedBytes - rejected_) : length;
    rejected_ += decoder_.offer(data, slice);
    data += slice;
    length -= slice;
  }
  // Nothing else reaches the receiver while a target streams in, so the decoded bytes of
  // one call may go to the page together.
  handOver();
}

void HtmlHandler::DecrunchMetaUrl::byte(std::uint8_t b) {
  decoded_[decodedCount_++] = static_cast<char>(b);
  if (decodedCount_ == sizeof decoded_) handOver();
}

void HtmlHandler::DecrunchMetaUrl::handOver() {
  if (decodedCount_ == 0) return;
  const std::size_t n = decodedCount_;
  decodedCount_ = 0;
  if (page_ == nullptr) {
    page_ = std::make_unique<html::Decrunch>(
        receiver_, html::Decrunch::NestedIn{parentDepth_, /*announced=*/true});
  }
  page_->feed(decoded_, n);
}

}  // namespace html_decrunch
