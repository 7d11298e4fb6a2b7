#include "engine/pdf/parser.h"

#include <cstring>

namespace pdf {
namespace {

constexpr std::string_view kEndobj = "endobj";
constexpr std::string_view kEndstream = "endstream";

bool IsDigit(unsigned char c) { return c >= '0' && c <= '9'; }

}  // namespace

void Parser::feed(const char* data, std::size_t size) {
  std::size_t i = 0;
  while (i < size) {
    // Inside stream data with no keyword half-matched, every byte up to the next "e" (the
    // first byte of both "endobj" and "endstream") is plain data: hand it on directly.
    if (current_ == &subStream_ && endobjMatched_ == 0 && !subStream_.matching()) {
      const void* e = std::memchr(data + i, 'e', size - i);
      const std::size_t stop = e == nullptr ? size : static_cast<const char*>(e) - data;
      for (; i < stop; ++i) handler_.streamByte(data[i]);
      if (i == size) return;
    }
    FeedByte(static_cast<unsigned char>(data[i++]));
  }
}

void Parser::finish() {
  if (state_ == kInObject) {
    FeedPendingEndobj();
    EndObject();
    return;
  }
  // A header cut off by the end of data is dropped.
  state_ = kBetween;
  tokenHasDigits_ = false;
  tokenNumber_ = 0;
  keyword_.clear();
}

void Parser::FeedByte(unsigned char c) {
  switch (state_) {
    case kBetween:
      if (c == '%') {
        state_ = kComment;
      } else if (IsDigit(c)) {
        tokenHasDigits_ = true;
        tokenNumber_ = c - '0';
        state_ = kObjectNumber;
      }
      return;

    case kComment:
      if (c == '\n') state_ = kBetween;
      return;

    case kObjectNumber:
    case kGeneration:
      if (IsDigit(c)) {
        tokenHasDigits_ = true;
        tokenNumber_ = tokenNumber_ * 10u + (c - '0');  // wraps, as the number is read
        return;
      }
      if (IsPdfWhiteSpace(c) && tokenHasDigits_) {
        if (state_ == kObjectNumber) {
          objectNumber_ = tokenNumber_;
          state_ = kGeneration;
        } else {
          generation_ = tokenNumber_;
          state_ = kKeyword;
        }
      } else {
        state_ = kBetween;
      }
      tokenHasDigits_ = false;
      tokenNumber_ = 0;
      return;

    case kKeyword:
      if (IsPdfWhiteSpace(c)) {
        // White space after one or two bytes is an object reference ("1 0 R") or a
        // cross-reference entry ("... 00000 n"): not an object, so keep looking. Linearised
        // and updated files have these before their pages.
        if (!keyword_.empty()) {
          keyword_.clear();
          state_ = kBetween;
        }
        return;
      }
      keyword_.push_back(static_cast<char>(c));
      if (keyword_.size() == 3) {
        const bool isObj = keyword_.view() == "obj";
        keyword_.clear();
        if (isObj) {
          state_ = kInObject;
          handler_.objectBegin(objectNumber_, generation_);
        } else {
          state_ = kBetween;
        }
      }
      return;

    case kInObject:
      // "endobj" is watched over every byte of the object, stream data included; the bytes
      // of a partial match are held back until they turn out not to be the keyword.
      if (c == static_cast<unsigned char>(kEndobj[endobjMatched_])) {
        if (++endobjMatched_ == kEndobj.size()) {
          endobjMatched_ = 0;
          EndObject();
        }
        return;
      }
      FeedPendingEndobj();
      if (c == 'e') {
        endobjMatched_ = 1;
      } else {
        FeedBody(static_cast<char>(c));
      }
      return;
  }
}

void Parser::FeedPendingEndobj() {
  const std::size_t pending = endobjMatched_;
  endobjMatched_ = 0;
  for (std::size_t i = 0; i < pending; ++i) FeedBody(kEndobj[i]);
}

void Parser::EndObject() {
  state_ = kBetween;
  current_->finish(*this);
  current_ = &subMain_;
  // The next object starts with a fresh dictionary scan whatever this one ended in: a
  // dictionary state, a half-matched keyword or an image flag left over from a stream object
  // would hide the next object's dictionary or mark its stream as an image.
  subDict_.finish(*this);
  handler_.objectEnd();
}

void Parser::SubMain::feed(char c, Parser& parser) {
  const auto b = static_cast<unsigned char>(c);
  if (b == '<') {
    parser.current_ = &parser.subDict_;
  } else if (b == '[') {
    parser.current_ = &parser.subArray_;
  } else if (IsDigit(b)) {
    parser.current_ = &parser.subNull_;
  }
}

void Parser::SubDict::feed(char c, Parser& parser) {
  streamWatcher_.feed(c, parser);
  uriWatcher_.feed(c, parser);

  const auto b = static_cast<unsigned char>(c);
  switch (state_) {
    case 0:  // the second "<" of "<<"
      state_ = b == '<' ? 1 : 5;
      break;
    case 1:  // before a key
      if (b == '/') state_ = 2;
      break;
    case 2:  // key
      if (b == '/') {
        state_ = 4;
      } else if (IsPdfWhiteSpace(b)) {
        state_ = 3;
      } else {
        key_.push_back(c);
      }
      break;
    case 3:  // between key and value: only a name value keeps the scan going
      if (b == '/') {
        state_ = 4;
      } else if (!IsPdfWhiteSpace(b)) {
        state_ = 5;
      }
      break;
    case 4:  // name value
      if (IsPdfWhiteSpace(b)) {
        if (!value_.empty()) {
          CompletePair(parser);
          state_ = 1;
        }
      } else if (b == '/') {
        CompletePair(parser);
        state_ = 2;
      } else if (b == '<') {
        state_ = 5;
      } else {
        value_.push_back(c);
      }
      break;
    default:  // 5: the scan of this dictionary is over; the watchers still run
      break;
  }
}

void Parser::SubDict::CompletePair(Parser& parser) {
  if (key_.view() == "Subtype" && value_.view() == "Image") parser.imageFlag_ = true;
  key_.clear();
  value_.clear();
}

void Parser::SubDict::finish(Parser& parser) {
  parser.imageFlag_ = false;
  streamWatcher_.finish(parser);
  uriWatcher_.finish(parser);
  key_.clear();
  value_.clear();
  state_ = 0;
}

void Parser::MetaStream::Matched(Parser& parser) {
  parser.handler_.streamBegin(parser.imageFlag_);
  parser.current_ = &parser.subStream_;
}

void Parser::MetaURI::Matched(Parser& parser) { parser.current_ = &parser.subURI_; }

void Parser::SubURI::feed(char c, Parser& parser) {
  if (!inString_) {
    if (c == '(') {
      inString_ = true;
    } else if (!IsPdfWhiteSpace(static_cast<unsigned char>(c))) {
      finish(parser);  // not a string (a reference, say): wait for the next "("
    }
    return;
  }
  if (c == ')') {
    finish(parser);
    parser.current_ = &parser.subDict_;
  } else if (collected_.size() < kMaxLinkLength) {
    collected_.push_back(c);
  }
}

void Parser::SubURI::finish(Parser& parser) {
  if (!collected_.empty()) parser.handler_.link(collected_);
  collected_.clear();
  inString_ = false;
}

void Parser::SubStream::feed(char c, Parser& parser) {
  if (c == kEndstream[endstreamMatched_]) {
    if (++endstreamMatched_ == kEndstream.size()) {
      endstreamMatched_ = 0;
      parser.current_ = &parser.subNull_;
      finish(parser);
    }
    return;
  }
  for (std::size_t i = 0; i < endstreamMatched_; ++i) parser.handler_.streamByte(kEndstream[i]);
  if (c == 'e') {
    endstreamMatched_ = 1;
  } else {
    endstreamMatched_ = 0;
    parser.handler_.streamByte(c);
  }
}

void Parser::SubStream::finish(Parser& parser) {
  // A stream ended by "endobj" or by the end of data keeps the bytes that only looked like
  // the start of "endstream".
  for (std::size_t i = 0; i < endstreamMatched_; ++i) parser.handler_.streamByte(kEndstream[i]);
  endstreamMatched_ = 0;
  parser.handler_.streamEnd();
}

}  // namespace pdf
