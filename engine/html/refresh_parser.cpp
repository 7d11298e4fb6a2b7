#include "engine/html/refresh_parser.h"

#include <algorithm>

#include "engine/html/char_class.h"
#include "engine/html/decrunch_limits.h"

namespace html_decrunch {

void RefreshParser::reset() {
  state_ = State::kStart;
  matched_ = 0;
  raw_.clear();
}

RefreshParser::Step RefreshParser::feed(std::uint8_t b) {
  if (state_ == State::kGaveUp) {
    appendBounded(fallback_, b);
    return Step::kNone;
  }
  if (state_ == State::kTarget) return Step::kUrl;
  appendBounded(raw_, b);
  const bool blank = html::isWhitespace(b);
  switch (state_) {
    case State::kStart:
      if (blank) break;
      if (html::isAsciiDigit(b)) {
        state_ = State::kDelay;
      } else {
        giveUp();
      }
      break;
    case State::kDelay:
      if (html::isAsciiDigit(b)) break;
      if (blank) {
        state_ = State::kAfterDelay;
      } else if (b == ';') {
        state_ = State::kUrl;
      } else {
        giveUp();
      }
      break;
    case State::kAfterDelay:
      if (blank) break;
      if (b == ';') {
        state_ = State::kUrl;
      } else {
        giveUp();
      }
      break;
    case State::kUrl: {
      static constexpr char kUrl[] = "url=";
      if (blank && (matched_ == 0 || matched_ == 3)) break;
      const std::uint8_t wanted = static_cast<std::uint8_t>(kUrl[matched_]);
      if (html::toLowerAscii(b) != wanted) {
        giveUp();
      } else if (++matched_ == 4) {
        state_ = State::kValue;
      }
      break;
    }
    case State::kValue:
      if (blank) break;
      state_ = State::kTarget;
      return Step::kFirstUrl;
    case State::kTarget:
    case State::kGaveUp:
      break;
  }
  return Step::kNone;
}

std::size_t RefreshParser::feedUpToTarget(const char* data, std::size_t length) {
  std::size_t taken = 0;
  while (taken < length && state_ != State::kTarget && state_ != State::kGaveUp) {
    feed(static_cast<std::uint8_t>(data[taken++]));
  }
  return taken;
}

void RefreshParser::addFallback(const char* data, std::size_t length) {
  const std::size_t room = kMaxRefreshTextBytes - std::min(kMaxRefreshTextBytes, fallback_.size());
  fallback_.append(data, std::min(length, room));
}

void RefreshParser::giveUp() {
  state_ = State::kGaveUp;
  fallback_ = std::move(raw_);
  raw_.clear();
}

void RefreshParser::appendBounded(std::string& text, std::uint8_t b) {
  if (text.size() < kMaxRefreshTextBytes) text.push_back(static_cast<char>(b));
}

}  // namespace html_decrunch
