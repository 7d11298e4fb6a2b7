#include "engine/html/js_parser.h"

#include <algorithm>
#include <cstdint>
#include <cstring>

#include "engine/common/error.h"
#include "engine/common/trace.h"
#include "engine/html/byte_scan.h"
#include "engine/html/char_class.h"
#include "engine/html/entities.h"

namespace ap {
namespace {

// A string literal is handed on in pieces of at most this size.
constexpr std::size_t kStringChunkBytes = 1024;

struct JSQuote {
  static constexpr std::uint8_t kQuote = '\'';
};
struct JSDoubleQuote {
  static constexpr std::uint8_t kQuote = '"';
};

// Bytes of code that push a state; every other byte only decides whether a '/' after it
// divides.
constexpr html::ByteSet kCodeStops{"\"'/"};
constexpr html::ByteSet kCodeBlanks{"\t\n\r "};
constexpr html::ByteSet kOperatorEnds{"(,;="};

}  // namespace

using util::Pop;
using util::PopReprocess;
using util::Push;
using util::Stay;
using util::Transition;

// The bottom state: code between strings, comments and regular expressions.
template <typename Char>
class JSParser<Char>::ScriptState final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    JSParser& m = this->machine();
    switch (b) {
      case 9:
      case 10:
      case 13:
      case 32:
        return Stay();
      case '"':
        return Push<ScriptStringState<JSDoubleQuote>>(m);
      case '\'':
        return Push<ScriptStringState<JSQuote>>(m);
      case '(':
      case ',':
      case ';':
      case '=':
        afterOperand_ = false;
        return Stay();
      case '/':
        m.divisionContext_ = afterOperand_;
        afterOperand_ = false;
        return Push<ScriptDiv>(m);
      default:
        afterOperand_ = true;
        return Stay();
    }
  }
  // Up to the next quote or '/': only the last byte that is not a blank counts.
  static constexpr bool kBulk = true;
  const std::uint8_t* consume(const std::uint8_t* p, const std::uint8_t* end) override {
    const std::uint8_t* stop = kCodeStops.find(p, end);
    for (const std::uint8_t* q = stop; q > p;) {
      if (!kCodeBlanks.contains(*--q)) {
        afterOperand_ = !kOperatorEnds.contains(*q);
        break;
      }
    }
    return stop;
  }

 private:
  bool afterOperand_ = false;
};

// After a '/': a comment, a division or a regular expression.
template <typename Char>
class JSParser<Char>::ScriptDiv final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    JSParser& m = this->machine();
    if (b == '/') return Push<ScriptOLComment>(m);
    if (b == '*') return Push<ScriptMLComment>(m);
    if (m.divisionContext_) return PopReprocess(1);
    return Push<RegexpState>(m);  // the byte is the first of the expression
  }
};

template <typename Char>
class JSParser<Char>::ScriptOLComment final : public state_t {
 public:
  Transition process(std::uint8_t b) override { return b == '\n' ? Pop(2) : Stay(); }
  static constexpr bool kBulk = true;
  const std::uint8_t* consume(const std::uint8_t* p, const std::uint8_t* end) override {
    return html::findByte(p, end, '\n');
  }
};

template <typename Char>
class JSParser<Char>::ScriptMLComment final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    if (b == '/' && afterStar_) return Pop(2);
    afterStar_ = b == '*';
    return Stay();
  }
  static constexpr bool kBulk = true;
  const std::uint8_t* consume(const std::uint8_t* p, const std::uint8_t* end) override {
    const std::uint8_t* stop = html::findByte(p, end, '/');
    if (stop != p) afterStar_ = stop[-1] == '*';
    return stop;
  }

 private:
  bool afterStar_ = false;
};

template <typename Char>
class JSParser<Char>::RegexpState final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    if (escape_) {
      escape_ = false;
      return Stay();
    }
    if (b == '\\') {
      escape_ = true;
      return Stay();
    }
    return (b == '/' || b == '\n') ? Pop(2) : Stay();
  }

 private:
  bool escape_ = false;
};

template <typename Char>
template <typename Quote>
class JSParser<Char>::ScriptStringState final : public state_t {
 public:
  ~ScriptStringState() override {
    if (count_ == 0) return;
    try {
      AP_TRACE(ap::kSeverityMessage) << "SCRIPT STRING " << count_ << " chars unflushed";
    } catch (...) {
      // A trace line must not end the process from a destructor.
    }
  }
  Transition process(std::uint8_t b) override {
    if (b == '\\') {
      flush();
      return Push<EscScriptStringState>(this->machine());
    }
    buffer_[count_++] = static_cast<Char>(b);
    if (b == Quote::kQuote) {
      flush();
      return Pop(1);
    }
    if (count_ == kStringChunkBytes) flush();
    return Stay();
  }
  // Up to the closing quote or a backslash, flushing whenever the buffer fills.
  static constexpr bool kBulk = true;
  const std::uint8_t* consume(const std::uint8_t* p, const std::uint8_t* end) override {
    const std::uint8_t* stop = html::findEither(p, end, Quote::kQuote, '\\');
    for (const std::uint8_t* q = p; q < stop;) {
      const std::size_t n =
          std::min(static_cast<std::size_t>(stop - q), kStringChunkBytes - count_);
      std::memcpy(buffer_ + count_, q, n);
      count_ += n;
      q += n;
      if (count_ == kStringChunkBytes) flush();
    }
    return stop;
  }
  void finish() override { flush(); }

 private:
  void flush() {
    const std::size_t n = count_;
    count_ = 0;
    this->machine().handler_->text(buffer_, n);
  }

  Char buffer_[kStringChunkBytes];
  std::size_t count_ = 0;
};

// After a backslash in a string.
template <typename Char>
class JSParser<Char>::EscScriptStringState final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    JSParser& m = this->machine();
    Char c;
    switch (b) {
      case 'b':
        c = 8;
        break;
      case 'n':
        c = 10;
        break;
      case 'r':
        c = 13;
        break;
      case 't':
        c = 9;
        break;
      case 'u':
        return Push<EscUState>(m);
      default:
        c = static_cast<Char>(b);
        break;
    }
    m.handler_->text(&c, 1);
    return Pop(1);
  }
};

// After "\u": four hexadecimal digits make one UTF-16 code unit, given on in UTF-8.
template <typename Char>
class JSParser<Char>::EscUState final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    JSParser& m = this->machine();
    const int digit = html::hexDigitValue(b);
    if (digit >= 0) {
      held_[count_++] = static_cast<Char>(b);
      unit_ = static_cast<std::uint16_t>(unit_ * 16 + digit);
      if (count_ < 4) return Stay();
      char utf8[3];
      const std::size_t n = html::encodeUtf8(unit_, utf8);
      Char out[3];
      for (std::size_t i = 0; i < n; ++i) out[i] = static_cast<Char>(utf8[i]);
      m.handler_->text(out, n);
      return Pop(2);
    }
    // Not an escape after all: give the bytes back as written; the breaking byte goes to the
    // escape state again.
    Char text[6] = {'\\', 'u'};
    for (std::size_t i = 0; i < count_; ++i) text[2 + i] = held_[i];
    m.handler_->text(text, 2 + count_);
    return PopReprocess(1);
  }

 private:
  Char held_[4];
  std::size_t count_ = 0;
  std::uint16_t unit_ = 0;
};

template <typename Char>
JSParser<Char>::JSParser(Handler* handler) : handler_(handler) {
  if (handler == nullptr) ThrowError("JSParser(): null handler");
  this->template pushState<ScriptState>();
}

template class JSParser<char>;

}  // namespace ap
