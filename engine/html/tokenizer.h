// The streaming HTML tokenizer: a push-down machine that turns bytes, fed in chunks of any
// size, into calls on its handler. It builds no tree and never looks back. It knows only the
// raw-text elements (script, style, noscript) and the comment opener; what is worth keeping
// is asked of the handler while tokenizing (see tokenizer_handler.h), so attributes nobody
// wants are skipped without being stored.
//
// Trusts nothing in the input: names are cut at fixed lengths, collected attribute values at
// kMaxAttributeValueBytes, and the stack never grows past nine states.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <type_traits>

#include "engine/html/byte_scan.h"
#include "engine/html/char_class.h"
#include "engine/html/state_machine.h"
#include "engine/html/tokenizer_handler.h"
#include "engine/html/tokenizer_parts.h"
#include "engine/html/void_elements.h"

namespace html {

template <typename Char, typename Handler, typename Config = DefaultConfig<Handler, Char>>
class FastParserMachine
    : public util::StateMachine<Char, FastParserMachine<Char, Handler, Config>> {
  static_assert(std::is_same_v<Char, char>, "the tokenizer reads 8-bit markup");
  using Engine = util::StateMachine<Char, FastParserMachine>;
  using Byte = typename Engine::Byte;
  static_assert(std::is_same_v<Byte, ScanByte>);
  using StringView = std::basic_string_view<Char>;
  using Transition = util::Transition;

 public:
  using state_t = typename Engine::State;

  explicit FastParserMachine(Handler& handler) : handler_(&handler) {
    this->template pushState<TextState>();
  }

  Handler& handler() const { return *handler_; }
  // Set when the start tag being read ends in "/>".
  bool selfClosing() const { return selfClosing_; }

 private:
  using TagName = html::FixedText<Char, kMaxTagNameBytes>;
  using Buffer = ChunkBuffer<Char, kTextChunkBytes>;

  class TagWaitState;
  class TagState;
  class CloseTagState;
  class CloseTagSkip;
  class CommentState;
  class CommentStateSkip;
  template <typename NameState>
  class AttributesState;
  class AttrName;
  class AttrNameSkip;
  template <typename Start>
  class AttrValueWait;
  template <typename Value, template <char> class Quoted>
  class AttrValueStart;
  class AttrValue;
  template <char Q>
  class AttrValueQuoted;
  class AttrSkipValue;
  template <char Q>
  class AttrSkipQuoted;
  class AttrStreamValue;
  class AttrStreamSlash;
  template <char Q>
  class AttrStreamQuoted;
  template <typename Trait>
  class ScriptState;
  template <typename Trait>
  class ScriptStateSkip;

  using CollectWait = AttrValueWait<AttrValueStart<AttrValue, AttrValueQuoted>>;
  using StreamWait = AttrValueWait<AttrValueStart<AttrStreamValue, AttrStreamQuoted>>;
  using SkipWait = AttrValueWait<AttrValueStart<AttrSkipValue, AttrSkipQuoted>>;

  static Transition pushValueWait(FastParserMachine& m, int mode, bool reprocess) {
    switch (mode) {
      case kAttrCollect:
        return reprocess ? util::PushReprocess<CollectWait>(m) : util::Push<CollectWait>(m);
      case kAttrStream:
        return reprocess ? util::PushReprocess<StreamWait>(m) : util::Push<StreamWait>(m);
      default:
        return reprocess ? util::PushReprocess<SkipWait>(m) : util::Push<SkipWait>(m);
    }
  }

  // 1 script, 2 style, 3 noscript, 0 anything else.
  static int rawTextKind(StringView name) {
    if (name == ScriptCloseTrait::kName) return 1;
    if (name == StyleCloseTrait::kName) return 2;
    if (name == NoscriptCloseTrait::kName) return 3;
    return 0;
  }

  // The bottom state: page text.
  class TextState final : public Engine::BufferedState {
   public:
    Transition process(Byte b) override {
      auto flush = [this](const Char* data, std::size_t n) { this->flush(data, n); };
      if (b == '<') {
        buffer_.flushIfAny(flush);
        return util::Push<TagWaitState>(this->machine());
      }
      buffer_.append(b, flush);
      return util::Stay();
    }
    // Text up to the next '<', then the tag it opens when the chunk holds it whole.
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      auto flush = [this](const Char* data, std::size_t n) { this->flush(data, n); };
      for (;;) {
        const Byte* stop = findByte(p, end, '<');
        buffer_.appendRun(p, static_cast<std::size_t>(stop - p), flush);
        if (stop == end) return stop;
        const Byte* after =
            this->machine().wholeTag(stop, end, [this, &flush] { buffer_.flushIfAny(flush); });
        if (after == nullptr) return stop;
        p = after;
      }
    }
    void flush(const Char* data, std::size_t n) override {
      Config::text(this->machine().handler(), data, n);
    }

   private:
    Buffer buffer_;
  };

  // After '<'.
  class TagWaitState final : public state_t {
   public:
    Transition process(Byte b) override {
      FastParserMachine& m = this->machine();
      if (b == '/') return util::Push<CloseTagState>(m);
      if (b == '>') {  // "<>": an element without a name
        Config::openElement(m.handler(), StringView());
        Config::startTagEnd(m.handler());
        return util::Pop(1);
      }
      return util::PushReprocess<TagState>(m);
    }
  };

  // The name of a start tag, then (once opened) the end of the tag.
  class TagState final : public state_t {
   public:
    Transition process(Byte b) override {
      FastParserMachine& m = this->machine();
      Handler& h = m.handler();
      if (isWhitespace(b)) {
        m.selfClosing_ = false;
        kind_ = rawTextKind(name_.view());
        opened_ = true;
        if (Config::openElement(h, name_.view())) {
          return util::Push<AttributesState<AttrName>>(m);
        }
        return util::Push<AttributesState<AttrNameSkip>>(m);
      }
      if (b == '>') {
        if (!opened_) {
          kind_ = rawTextKind(name_.view());
          if (name_.endsWithSlash()) {  // "<br/>"
            name_.dropLast();
            Config::openElement(h, name_.view());
            Config::startTagEnd(h);
            Config::closeElement(h, name_.view());
            return util::Pop(2);
          }
          opened_ = true;
          Config::openElement(h, name_.view());
          wantsRawText_ = Config::startTagEnd(h);
          return enterRawText(m);
        }
        wantsRawText_ = Config::startTagEnd(h);
        if (m.selfClosing_) {
          Config::closeElement(h, name_.view());
          return util::Pop(2);
        }
        return enterRawText(m);
      }
      name_.append(toLowerAscii(b));
      if (name_.view() == StringView("!--")) {
        if (auto* sink = Config::commentSink(h)) return util::Push<CommentState>(m, sink);
        return util::Push<CommentStateSkip>(m);
      }
      return util::Stay();
    }
    // The name's bytes, up to the byte that ends it or the '-' that makes it "!--".
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      if (opened_) return p;
      for (; p < end; ++p) {
        const Byte b = *p;
        if (kTagNameEnd.contains(b)) break;
        if (b == '-' && name_.view() == StringView("!-")) break;
        name_.append(toLowerAscii(b));
      }
      return p;
    }

   private:
    Transition enterRawText(FastParserMachine& m) {
      switch (kind_) {
        case 1:
          return wantsRawText_ ? util::Push<ScriptState<ScriptCloseTrait>>(m)
                               : util::Push<ScriptStateSkip<ScriptCloseTrait>>(m);
        case 2:
          return wantsRawText_ ? util::Push<ScriptState<StyleCloseTrait>>(m)
                               : util::Push<ScriptStateSkip<StyleCloseTrait>>(m);
        case 3:  // the content of noscript is never tokenized
          return util::Push<ScriptStateSkip<NoscriptCloseTrait>>(m);
        default:
          return util::Pop(2);
      }
    }

    TagName name_;
    int kind_ = 0;
    bool opened_ = false;
    bool wantsRawText_ = false;
  };

  class CloseTagState final : public state_t {
   public:
    Transition process(Byte b) override {
      FastParserMachine& m = this->machine();
      if (b == '>') {
        if (!isVoidElement(name_.view())) Config::closeElement(m.handler(), name_.view());
        return util::Pop(2);
      }
      if (isWhitespace(b)) return util::Push<CloseTagSkip>(m);
      name_.append(toLowerAscii(b));
      return util::Stay();
    }
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      for (; p < end && !kTagNameEnd.contains(*p); ++p) name_.append(toLowerAscii(*p));
      return p;
    }

   private:
    TagName name_;
  };

  // Whatever follows the name of an end tag, up to its '>'.
  class CloseTagSkip final : public state_t {
   public:
    Transition process(Byte b) override { return b == '>' ? util::PopReprocess(1) : util::Stay(); }
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override { return findByte(p, end, '>'); }
  };

  using CommentSink = typename Config::CommentSink;

  // Comment text goes to the sink, ending with the two '-' of its closing.
  class CommentState final : public Engine::BufferedState {
   public:
    explicit CommentState(CommentSink* sink) : sink_(sink) {}
    Transition process(Byte b) override {
      auto flush = [this](const Char* data, std::size_t n) { this->flush(data, n); };
      if (end_.closes(b)) {
        buffer_.flushIfAny(flush);
        CommentSink* sink = sink_;
        sink_ = nullptr;
        if (sink != nullptr) Config::commentEnd(*sink);
        return util::Pop(3);
      }
      end_.shift(b);
      buffer_.append(b, flush);
      return util::Stay();
    }
    // Only a '>' can end a comment.
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      const Byte* stop = findByte(p, end, '>');
      const std::size_t n = static_cast<std::size_t>(stop - p);
      end_.shiftRun(p, n);
      buffer_.appendRun(p, n, [this](const Char* data, std::size_t k) { this->flush(data, k); });
      return stop;
    }
    // The sink is gone only when the receiver failed while the comment was ending.
    void flush(const Char* data, std::size_t n) override {
      if (sink_ != nullptr) Config::commentText(*sink_, data, n);
    }

   private:
    CommentSink* sink_;
    Buffer buffer_;
    CommentEnd end_;
  };

  class CommentStateSkip final : public state_t {
   public:
    Transition process(Byte b) override {
      if (end_.closes(b)) return util::Pop(3);
      end_.shift(b);
      return util::Stay();
    }
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      const Byte* stop = findByte(p, end, '>');
      end_.shiftRun(p, static_cast<std::size_t>(stop - p));
      return stop;
    }

   private:
    CommentEnd end_;
  };

  // Between attributes of a start tag.
  template <typename NameState>
  class AttributesState final : public state_t {
   public:
    Transition process(Byte b) override {
      if (b == '>') return util::PopReprocess(1);
      if (isWhitespace(b)) return util::Stay();
      return util::PushReprocess<NameState>(this->machine());
    }
  };

  // Names of the attributes of an element whose attributes are reported.
  class AttrName final : public state_t {
   public:
    Transition process(Byte b) override {
      FastParserMachine& m = this->machine();
      if (isWhitespace(b)) {
        if (name_.empty()) return util::Stay();
        return reportName(m, false);
      }
      if (b == '=') return reportName(m, true);
      if (b == '>') {
        if (!name_.empty()) {
          if (name_.endsWithSlash()) {
            m.selfClosing_ = true;
            name_.dropSlash();
          }
          if (!name_.empty()) {
            Config::attributeName(m.handler(), name_.view());
            name_.clear();
          }
        }
        return util::PopReprocess(1);
      }
      name_.append(toLowerAscii(b));
      return util::Stay();
    }
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      const Byte* stop = kAttrNameEnd.find(p, end);
      for (; p < stop; ++p) name_.append(toLowerAscii(*p));
      return stop;
    }

   private:
    Transition reportName(FastParserMachine& m, bool reprocess) {
      const int mode = Config::attributeName(m.handler(), name_.view());
      name_.clear();
      return pushValueWait(m, mode, reprocess);
    }

    BoundedText<Char, kMaxAttributeNameBytes> name_;
  };

  // Names of the attributes of an element nobody asked about: only a trailing '/' matters.
  class AttrNameSkip final : public state_t {
   public:
    Transition process(Byte b) override {
      FastParserMachine& m = this->machine();
      if (isWhitespace(b)) return atStart_ ? util::Stay() : util::Push<SkipWait>(m);
      if (b == '=') {
        last_ = 0;
        atStart_ = true;
        return util::PushReprocess<SkipWait>(m);
      }
      if (b == '>') {
        if (last_ == '/') m.selfClosing_ = true;
        return util::PopReprocess(1);
      }
      last_ = b;
      atStart_ = false;
      return util::Stay();
    }
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      const Byte* stop = kAttrNameEnd.find(p, end);
      if (stop != p) {
        last_ = stop[-1];
        atStart_ = false;
      }
      return stop;
    }

   private:
    Byte last_ = 0;
    bool atStart_ = true;
  };

  // After an attribute name: an '=' or the next attribute.
  template <typename Start>
  class AttrValueWait final : public state_t {
   public:
    Transition process(Byte b) override {
      if (isWhitespace(b)) return util::Stay();
      if (b == '=') return util::Push<Start>(this->machine());
      return util::PopReprocess(1);
    }
  };

  // After '=': how the value is written.
  template <typename Value, template <char> class Quoted>
  class AttrValueStart final : public state_t {
   public:
    Transition process(Byte b) override {
      FastParserMachine& m = this->machine();
      if (isWhitespace(b)) return util::Stay();
      if (b == '"') return util::Push<Quoted<'"'>>(m);
      if (b == '\'') return util::Push<Quoted<'\''>>(m);
      if (b == '>') return util::PopReprocess(1);
      return util::PushReprocess<Value>(m);
    }
  };

  class AttrValue final : public state_t {
   public:
    Transition process(Byte b) override {
      FastParserMachine& m = this->machine();
      if (isWhitespace(b)) {
        Config::attributeValue(m.handler(), value_.view());
        return util::Pop(3);
      }
      if (b == '>') {
        if (value_.endsWithSlash()) {
          m.selfClosing_ = true;
          value_.dropSlash();
        }
        Config::attributeValue(m.handler(), value_.view());
        return util::PopReprocess(1);
      }
      value_.append(b);
      return util::Stay();
    }
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      const Byte* stop = kUnquotedEnd.find(p, end);
      value_.appendRun(p, static_cast<std::size_t>(stop - p));
      return stop;
    }

   private:
    BoundedText<Char, kMaxAttributeValueBytes> value_;
  };

  template <char Q>
  class AttrValueQuoted final : public state_t {
   public:
    Transition process(Byte b) override {
      if (b == static_cast<Byte>(Q)) {
        Config::attributeValue(this->machine().handler(), value_.view());
        return util::Pop(3);
      }
      if (b != '\n') value_.append(b);
      return util::Stay();
    }
    // Runs end at the quote or at a line feed (which is dropped by process).
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      const Byte* stop = findEither(p, end, static_cast<Byte>(Q), '\n');
      value_.appendRun(p, static_cast<std::size_t>(stop - p));
      return stop;
    }

   private:
    BoundedText<Char, kMaxAttributeValueBytes> value_;
  };

  class AttrStreamValue final : public state_t {
   public:
    Transition process(Byte b) override {
      FastParserMachine& m = this->machine();
      if (isWhitespace(b)) return util::Pop(3);
      if (b == '/') return util::Push<AttrStreamSlash>(m);
      if (b == '>') return util::PopReprocess(1);
      Config::attributeChar(m.handler(), static_cast<Char>(b));
      return util::Stay();
    }
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      const Byte* stop = kStreamedEnd.find(p, end);
      if (stop != p) {
        Config::attributeChars(this->machine().handler(), reinterpret_cast<const Char*>(p),
                               static_cast<std::size_t>(stop - p));
      }
      return stop;
    }
  };

  // A '/' in a streamed value: the end of a self-closing tag, or part of the value.
  class AttrStreamSlash final : public state_t {
   public:
    Transition process(Byte b) override {
      FastParserMachine& m = this->machine();
      if (b == '>') {
        m.selfClosing_ = true;
      } else {
        Config::attributeChar(m.handler(), static_cast<Char>('/'));
      }
      return util::PopReprocess(1);
    }
  };

  template <char Q>
  class AttrStreamQuoted final : public state_t {
   public:
    Transition process(Byte b) override {
      if (b == static_cast<Byte>(Q)) return util::Pop(3);
      if (b != '\n') Config::attributeChar(this->machine().handler(), static_cast<Char>(b));
      return util::Stay();
    }
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      const Byte* stop = findEither(p, end, static_cast<Byte>(Q), '\n');
      if (stop != p) {
        Config::attributeChars(this->machine().handler(), reinterpret_cast<const Char*>(p),
                               static_cast<std::size_t>(stop - p));
      }
      return stop;
    }
  };

  class AttrSkipValue final : public state_t {
   public:
    Transition process(Byte b) override {
      if (isWhitespace(b)) return util::Pop(3);
      if (b == '>') {
        this->machine().selfClosing_ = last_ == '/';
        return util::PopReprocess(1);
      }
      last_ = b;
      return util::Stay();
    }
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      const Byte* stop = kUnquotedEnd.find(p, end);
      if (stop != p) last_ = stop[-1];
      return stop;
    }

   private:
    Byte last_ = 0;
  };

  template <char Q>
  class AttrSkipQuoted final : public state_t {
   public:
    Transition process(Byte b) override {
      return b == static_cast<Byte>(Q) ? util::Pop(3) : util::Stay();
    }
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      return findByte(p, end, static_cast<Byte>(Q));
    }
  };

  // Raw text up to the closing literal, matched whatever the case of its letters. The bytes
  // of a partial match are held and given back to the text when the match fails.
  template <typename Trait>
  class ScriptState final : public Engine::BufferedState {
   public:
    Transition process(Byte b) override {
      auto flush = [this](const Char* data, std::size_t n) { this->flush(data, n); };
      if (toLowerAscii(b) == static_cast<Byte>(Trait::kLiteral[matched_])) {
        held_[matched_++] = b;
        if (matched_ < Trait::kLiteral.size()) return util::Stay();
        // Reset first: a receiver that fails below must not leave the match past the end.
        matched_ = 0;
        buffer_.flushIfAny(flush);
        Config::closeElement(this->machine().handler(), Trait::kName);
        return util::Pop(3);
      }
      for (std::size_t i = 0; i < matched_; ++i) buffer_.append(held_[i], flush);
      if (b == '<') {
        held_[0] = b;
        matched_ = 1;
      } else {
        matched_ = 0;
        buffer_.append(b, flush);
      }
      return util::Stay();
    }
    // Outside a partial match only a '<' can start the closing literal.
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      if (matched_ != 0) return p;
      const Byte* stop = findByte(p, end, '<');
      buffer_.appendRun(p, static_cast<std::size_t>(stop - p),
                        [this](const Char* data, std::size_t n) { this->flush(data, n); });
      return stop;
    }
    void flush(const Char* data, std::size_t n) override {
      if constexpr (Trait::kDelivers) Config::scriptText(this->machine().handler(), data, n);
    }

   private:
    Buffer buffer_;
    std::size_t matched_ = 0;
    Byte held_[Trait::kLiteral.size()];
  };

  template <typename Trait>
  class ScriptStateSkip final : public state_t {
   public:
    Transition process(Byte b) override {
      if (toLowerAscii(b) == static_cast<Byte>(Trait::kLiteral[matched_])) {
        if (++matched_ < Trait::kLiteral.size()) return util::Stay();
        matched_ = 0;
        Config::closeElement(this->machine().handler(), Trait::kName);
        return util::Pop(3);
      }
      matched_ = b == '<' ? 1 : 0;
      return util::Stay();
    }
    static constexpr bool kBulk = true;
    const Byte* consume(const Byte* p, const Byte* end) override {
      return matched_ != 0 ? p : findByte(p, end, '<');
    }

   private:
    std::size_t matched_ = 0;
  };

  // A tag longer than this (from its '<' to its '>') is left to the states.
  static constexpr std::size_t kMaxWholeTagBytes = 1024;
  static_assert(kMaxWholeTagBytes <= kMaxTagNameBytes &&
                kMaxWholeTagBytes <= kMaxAttributeNameBytes &&
                kMaxWholeTagBytes <= kMaxAttributeValueBytes);
  // The tag that starts at `lt` read whole, the text before it flushed first: answers where
  // its '>' was passed, or nullptr (and nothing done) when the states are to read it. See
  // tokenizer_whole_tag.h.
  template <typename FlushText>
  const Byte* wholeTag(const Byte* lt, const Byte* end, FlushText&& flushText);
  static const Byte* findStartTagEnd(const Byte* p, const Byte* end);
  template <bool Reported>
  void wholeAttributes(const Byte* p, const Byte* close);

  // Where an unquoted value ends (collected or skipped), and a streamed one ('/' may make the
  // tag self-closing).
  static constexpr ByteSet kUnquotedEnd{">", /*whitespace=*/true};
  static constexpr ByteSet kAttrNameEnd{">=", /*whitespace=*/true};
  static constexpr ByteSet kStreamedEnd{">/", /*whitespace=*/true};
  // Where a tag's name ends.
  static constexpr ByteSet kTagNameEnd{">", /*whitespace=*/true};

  Handler* handler_;
  bool selfClosing_ = false;
};

}  // namespace html

#include "engine/html/tokenizer_whole_tag.h"
