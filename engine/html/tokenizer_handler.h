// What the HTML tokenizer asks of its handler. The tokenizer knows no tags beyond the raw-text
// elements and the comment opener; every decision about what is worth keeping is the
// handler's, taken while tokenizing, so uninteresting attributes are never stored.
#pragma once

#include <concepts>
#include <cstddef>
#include <string_view>
#include <type_traits>
#include <utility>

namespace html {

// The handler's answer to attributeName. Any other value skips the attribute.
enum AttrMode : int {
  kAttrCollect = 0,  // the whole value arrives through attributeValue
  kAttrStream = 1,   // each byte of the value arrives through attributeChar
  kAttrSkip = 2,
};

// The operations DefaultConfig forwards to. Where a handler has no interest (an "absent"
// callback), its operation answers false for startTagEnd, kAttrSkip for attributeName,
// nullptr for commentSink, and does nothing for the rest.
//   text(data, length)        page text between tags, at most 1024 bytes per call
//   openElement(name)         a start-tag name; true: report its attributes
//   startTagEnd()             the '>' of a start tag; true: deliver script text
//   closeElement(name)        an end tag, a self-closing start tag or the end of raw text
//   attributeName(name)       an attribute of a reported element; answers an AttrMode
//   attributeValue(value)     a collected value
//   attributeChar(byte)       one byte of a streamed value
//   commentSink()             a sink with text(data, length) and end(), or nullptr
//   scriptText(data, length)  the raw text of a script element, at most 1024 bytes per call
template <typename H, typename Char>
concept TokenizerHandler = requires(H& h, const Char* data, std::size_t n,
                                    std::basic_string_view<Char> name, Char byte) {
  h.text(data, n);
  { h.openElement(name) } -> std::convertible_to<bool>;
  { h.startTagEnd() } -> std::convertible_to<bool>;
  h.closeElement(name);
  { h.attributeName(name) } -> std::convertible_to<int>;
  h.attributeValue(name);
  h.attributeChar(byte);
  { h.commentSink() } -> std::convertible_to<const volatile void*>;
  h.commentSink()->text(data, n);
  h.commentSink()->end();
  h.scriptText(data, n);
};

// How the tokenizer calls its handler: member calls of the names above. A handler whose
// operations are spelled otherwise supplies its own configuration with the same members.
template <typename Handler, typename Char>
requires TokenizerHandler<Handler, Char>
struct DefaultConfig {
  using StringView = std::basic_string_view<Char>;
  using CommentSink = std::remove_pointer_t<decltype(std::declval<Handler&>().commentSink())>;

  static void text(Handler& h, const Char* data, std::size_t n) { h.text(data, n); }
  static bool openElement(Handler& h, StringView name) { return h.openElement(name); }
  static bool startTagEnd(Handler& h) { return h.startTagEnd(); }
  static void closeElement(Handler& h, StringView name) { h.closeElement(name); }
  static int attributeName(Handler& h, StringView name) { return h.attributeName(name); }
  static void attributeValue(Handler& h, StringView value) { h.attributeValue(value); }
  static void attributeChar(Handler& h, Char byte) { h.attributeChar(byte); }
  // A run of streamed bytes: one call when the handler takes runs (attributeChars), else
  // one attributeChar per byte. Either way it must mean the same as the bytes one by one.
  static void attributeChars(Handler& h, const Char* data, std::size_t n) {
    if constexpr (requires { h.attributeChars(data, n); }) {
      h.attributeChars(data, n);
    } else {
      for (std::size_t i = 0; i < n; ++i) h.attributeChar(data[i]);
    }
  }
  static CommentSink* commentSink(Handler& h) { return h.commentSink(); }
  static void commentText(CommentSink& sink, const Char* data, std::size_t n) {
    sink.text(data, n);
  }
  static void commentEnd(CommentSink& sink) { sink.end(); }
  static void scriptText(Handler& h, const Char* data, std::size_t n) { h.scriptText(data, n); }
};

}  // namespace html
