// Tags read whole. When the text state meets a '<' whose tag ends within the same chunk, the
// tokenizer reads the tag in one go instead of pushing a state for each of its parts (the
// name, each attribute name, the '=' and the value). The handler hears exactly what the states
// would have told it, call for call and byte for byte, and the flag of a self-closing tag
// ends the same. Tags the states are left to: raw-text elements (script, style, noscript),
// names starting with '!' (comments, declarations), "<>", and any tag cut by the end of the
// chunk or longer than kMaxWholeTagBytes, which also keeps every name and value inside the
// states' own limits.
//
// Included at the end of tokenizer.h; not a header of its own.
#pragma once

namespace html {

// Where the '>' that ends a start tag is, from the first byte after its name's whitespace, or
// `end`. The answers of the handler change what is reported, never where the tag ends: names
// run up to whitespace, '=' or '>', an '=' starts a value, a value in quotes runs to its
// closing quote whatever it holds, and an unquoted value up to whitespace or '>'.
template <typename Char, typename Handler, typename Config>
auto FastParserMachine<Char, Handler, Config>::findStartTagEnd(const Byte* p, const Byte* end)
    -> const Byte* {
  static constexpr ByteSet kBetweenStops{">="};
  while (p < end) {
    // Between values: names and blanks up to an '=' or the '>'.
    p = kBetweenStops.find(p, end);
    if (p == end) return end;
    if (*p == '>') return p;
    // After '=': blanks, then a value in quotes or an unquoted one (or the '>').
    ++p;
    while (p < end && isWhitespace(*p)) ++p;
    if (p == end) return end;
    const Byte b = *p;
    if (b == '"' || b == '\'') {
      p = findByte(p + 1, end, b);
      if (p == end) return end;
      ++p;
    } else if (b == '>') {
      return p;
    } else {
      p = kUnquotedEnd.find(p, end);
      if (p == end) return end;
      if (*p == '>') return p;
    }
  }
  return end;
}

template <typename Char, typename Handler, typename Config>
template <typename FlushText>
auto FastParserMachine<Char, Handler, Config>::wholeTag(const Byte* lt, const Byte* end,
                                                        FlushText&& flushText) -> const Byte* {
  const Byte* const limit =
      static_cast<std::size_t>(end - lt) > kMaxWholeTagBytes ? lt + kMaxWholeTagBytes : end;
  const Byte* p = lt + 1;
  if (p >= limit) return nullptr;
  Handler& h = handler();
  Char name[kMaxWholeTagBytes];

  if (*p == '/') {  // an end tag: its name, then anything up to '>'
    ++p;
    const Byte* nameEnd = kTagNameEnd.find(p, limit);
    if (nameEnd == limit) return nullptr;
    const Byte* close = *nameEnd == '>' ? nameEnd : findByte(nameEnd, limit, '>');
    if (close == limit) return nullptr;
    const std::size_t n = static_cast<std::size_t>(nameEnd - p);
    for (std::size_t i = 0; i < n; ++i) name[i] = static_cast<Char>(toLowerAscii(p[i]));
    flushText();
    const StringView tagName(name, n);
    if (!isVoidElement(tagName)) Config::closeElement(h, tagName);
    return close + 1;
  }
  if (*p == '>' || *p == '!') return nullptr;

  const Byte* nameEnd = kTagNameEnd.find(p, limit);
  if (nameEnd == limit) return nullptr;
  const std::size_t n = static_cast<std::size_t>(nameEnd - p);
  for (std::size_t i = 0; i < n; ++i) name[i] = static_cast<Char>(toLowerAscii(p[i]));
  const StringView tagName(name, n);
  if (rawTextKind(tagName) != 0) return nullptr;
  if (*nameEnd == '>') {  // no attributes
    flushText();
    if (n > 0 && name[n - 1] == '/') {  // "<br/>"
      const StringView shorter(name, n - 1);
      Config::openElement(h, shorter);
      Config::startTagEnd(h);
      Config::closeElement(h, shorter);
    } else {
      Config::openElement(h, tagName);
      Config::startTagEnd(h);
    }
    return nameEnd + 1;
  }
  const Byte* close = findStartTagEnd(nameEnd + 1, limit);
  if (close == limit) return nullptr;
  flushText();
  selfClosing_ = false;
  if (Config::openElement(h, tagName)) {
    wholeAttributes<true>(nameEnd + 1, close);
  } else {
    wholeAttributes<false>(nameEnd + 1, close);
  }
  Config::startTagEnd(h);
  if (selfClosing_) Config::closeElement(h, tagName);
  return close + 1;
}

// The attributes of a start tag up to its '>' at `close`, the states of the attribute list
// kept as a small stack of their kinds. Reported: the handler is asked about each name
// (AttrName); otherwise only a trailing '/' matters (AttrNameSkip).
template <typename Char, typename Handler, typename Config>
template <bool Reported>
void FastParserMachine<Char, Handler, Config>::wholeAttributes(const Byte* p, const Byte* close) {
  enum Kind : std::uint8_t {
    kList,          // AttributesState
    kName,          // AttrName or AttrNameSkip
    kWait,          // AttrValueWait
    kStart,         // AttrValueStart
    kValue,         // AttrValue
    kQuoted,        // AttrValueQuoted
    kStreamValue,   // AttrStreamValue
    kStreamSlash,   // AttrStreamSlash
    kStreamQuoted,  // AttrStreamQuoted
    kSkipValue,     // AttrSkipValue
    kSkipQuoted,    // AttrSkipQuoted
  };
  Kind stack[8];
  int top = 0;
  stack[0] = kList;
  Handler& h = handler();
  int mode = kAttrSkip;  // of the value being waited for
  Byte quote = 0;
  // AttrName's name, or AttrNameSkip's last byte and whether it is between names.
  Char name[kMaxWholeTagBytes];
  std::size_t nameLength = 0;
  Byte skipLast = 0;
  bool skipAtStart = true;
  // A collected value, or a skipped unquoted value's last byte.
  Char value[kMaxWholeTagBytes];
  std::size_t valueLength = 0;
  Byte valueLast = 0;

  // A streamed run [p, stop) in one call; answers the byte before stop, for the loop to step
  // onto stop.
  auto streamRun = [&h](const Byte* from, const Byte* stop) {
    Config::attributeChars(h, reinterpret_cast<const Char*>(from),
                           static_cast<std::size_t>(stop - from));
    return stop - 1;
  };
  auto reportName = [&] {
    mode = Config::attributeName(h, StringView(name, nameLength));
    nameLength = 0;
  };

  for (;; ++p) {
    const Byte b = *p;
    bool again;
    do {
      again = false;
      switch (stack[top]) {
        case kList:
          if (b == '>') return;  // the tag state takes the '>'
          if (isWhitespace(b)) break;
          stack[++top] = kName;
          nameLength = 0;
          skipLast = 0;
          skipAtStart = true;
          again = true;
          break;
        case kName:
          if constexpr (Reported) {
            if (isWhitespace(b)) {
              if (nameLength == 0) break;
              reportName();
              stack[++top] = kWait;
            } else if (b == '=') {
              reportName();
              stack[++top] = kWait;
              again = true;
            } else if (b == '>') {
              if (nameLength > 0) {
                if (name[nameLength - 1] == '/') {
                  selfClosing_ = true;
                  --nameLength;
                }
                if (nameLength > 0) {
                  Config::attributeName(h, StringView(name, nameLength));
                  nameLength = 0;
                }
              }
              --top;
              again = true;
            } else {
              name[nameLength++] = static_cast<Char>(toLowerAscii(b));
            }
          } else {
            if (isWhitespace(b)) {
              if (skipAtStart) break;
              mode = kAttrSkip;
              stack[++top] = kWait;
            } else if (b == '=') {
              skipLast = 0;
              skipAtStart = true;
              mode = kAttrSkip;
              stack[++top] = kWait;
              again = true;
            } else if (b == '>') {
              if (skipLast == '/') selfClosing_ = true;
              --top;
              again = true;
            } else {
              skipLast = b;
              skipAtStart = false;
            }
          }
          break;
        case kWait:
          if (isWhitespace(b)) break;
          if (b == '=') {
            stack[++top] = kStart;
          } else {
            --top;
            again = true;
          }
          break;
        case kStart:
          if (isWhitespace(b)) break;
          valueLength = 0;
          valueLast = 0;
          if (b == '"' || b == '\'') {
            quote = b;
            stack[++top] = mode == kAttrCollect  ? kQuoted
                           : mode == kAttrStream ? kStreamQuoted
                                                 : kSkipQuoted;
          } else if (b == '>') {
            --top;
            again = true;
          } else {
            stack[++top] = mode == kAttrCollect  ? kValue
                           : mode == kAttrStream ? kStreamValue
                                                 : kSkipValue;
            again = true;
          }
          break;
        case kValue:
          if (isWhitespace(b)) {
            Config::attributeValue(h, StringView(value, valueLength));
            top -= 3;
          } else if (b == '>') {
            if (valueLength > 0 && valueLast == '/') {
              selfClosing_ = true;
              --valueLength;
            }
            Config::attributeValue(h, StringView(value, valueLength));
            --top;
            again = true;
          } else {
            const Byte* stop = kUnquotedEnd.find(p, close);
            const std::size_t n = static_cast<std::size_t>(stop - p);
            std::memcpy(value + valueLength, p, n);
            valueLength += n;
            valueLast = stop[-1];
            p = stop - 1;
          }
          break;
        case kQuoted:
          if (b == quote) {
            Config::attributeValue(h, StringView(value, valueLength));
            top -= 3;
          } else if (b != '\n') {
            const Byte* stop = findEither(p, close, quote, '\n');
            const std::size_t n = static_cast<std::size_t>(stop - p);
            std::memcpy(value + valueLength, p, n);
            valueLength += n;
            p = stop - 1;
          }
          break;
        case kStreamValue:
          if (isWhitespace(b)) {
            top -= 3;
          } else if (b == '/') {
            stack[++top] = kStreamSlash;
          } else if (b == '>') {
            --top;
            again = true;
          } else {
            p = streamRun(p, kStreamedEnd.find(p, close));
          }
          break;
        case kStreamSlash:
          if (b == '>') {
            selfClosing_ = true;
          } else {
            Config::attributeChar(h, static_cast<Char>('/'));
          }
          --top;
          again = true;
          break;
        case kStreamQuoted:
          if (b == quote) {
            top -= 3;
          } else if (b != '\n') {
            p = streamRun(p, findEither(p, close, quote, '\n'));
          }
          break;
        case kSkipValue:
          if (isWhitespace(b)) {
            top -= 3;
          } else if (b == '>') {
            selfClosing_ = valueLast == '/';
            --top;
            again = true;
          } else {
            const Byte* stop = kUnquotedEnd.find(p, close);
            valueLast = stop[-1];
            p = stop - 1;
          }
          break;
        case kSkipQuoted:
          if (b == quote) {
            top -= 3;
          } else {
            p = findByte(p, close, quote) - 1;
          }
          break;
      }
    } while (again);
  }
}

}  // namespace html
