// The normaliser in front of a word finder: decodes UTF-8 and character references, folds
// case as the lexeme database's loader does (one folding, engine/kb/case_fold.h), and ends
// words at delimiters, at the punctuation blocks of Unicode and after every CJK ideograph.
// Malformed text is never refused: stray bytes become part of the current word.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "engine/html/entities.h"
#include "engine/kb/case_fold.h"

namespace lex {

// ASCII controls, blank, the marks !"#$%&'()*+,-./ :;<=>? [\]^_` and {|}~ DEL end a word.
struct DefaultDelimeters {
  static constexpr bool isDelimiter(unsigned char c) {
    return c <= 47 || (c >= 58 && c <= 63) || (c >= 91 && c <= 96) || (c >= 123 && c <= 127);
  }
};

template <class Finder, class Delimeters = DefaultDelimeters>
class UTF8Normalizer {
 public:
  // Longest character reference held while it is read ("&" not counted).
  static constexpr std::size_t kReferenceBytes = 11;

  explicit UTF8Normalizer(Finder& finder) : finder_(finder) {}

  void text(const char* data, std::size_t length) {
    const auto* p = reinterpret_cast<const unsigned char*>(data);
    const auto* const end = p + length;
    while (p != end) {
      // Plain ASCII outside a reference or a sequence, the bulk of most text, is read here:
      // what byte() would do for it, without its tests.
      if (!inReference_ && pending_ == 0) {
        if constexpr (requires { finder_.feedRun(p, end, kAscii.data()); }) {
          // A finder that takes whole runs of word bytes (the lexeme word finder) gets them
          // so; a word end on a finder outside a word does nothing, so a run of delimiters
          // (the blanks that indent markup) ends the word once.
          while (p != end) {
            const std::uint8_t kind = kAscii[*p];
            if (kind == kWordEnd) {
              if (finder_.inWord()) finder_.wordEnd();
              ++p;
              if constexpr (kBlanksEndWords) {
                // Eight bytes at a time while all are controls or blanks (at most 0x20):
                // adding 0x5F sets no byte's top bit exactly then.
                constexpr std::uint64_t kAdd = 0x5F5F5F5F5F5F5F5Full;
                constexpr std::uint64_t kTops = 0x8080808080808080ull;
                std::uint64_t eight;
                while (end - p >= 8 &&
                       (std::memcpy(&eight, p, 8), ((eight + kAdd) | eight) & kTops) == 0)
                  p += 8;
              }
              while (p != end && kAscii[*p] == kWordEnd) ++p;
            } else if (kind != kOther) {
              p = finder_.feedRun(p, end, kAscii.data());
            } else {
              break;
            }
          }
        } else {
          for (; p != end; ++p) {
            const std::uint8_t kind = kAscii[*p];
            if (kind == kWordEnd) {
              finder_.wordEnd();
            } else if (kind != kOther) {
              finder_.feed(kind);
            } else {
              break;
            }
          }
        }
        if (p == end) break;
      }
      byte(*p++);
    }
  }

  // The per-byte reader alone, without the ASCII path of text(): the reference that path
  // is tested against.
  void textByteByByte(const char* data, std::size_t length) {
    for (std::size_t i = 0; i < length; ++i) byte(static_cast<unsigned char>(data[i]));
  }

  // A word break from outside (a block boundary). A reference or sequence still open is
  // given up first, so its bytes belong to the word they started in.
  void wordEnd() {
    if (inReference_) giveUpReference();
    flushSequence();
    finder_.wordEnd();
  }

  Finder& finder() { return finder_; }

 private:
  void byte(unsigned char c) {
    if (inReference_) {
      if (c == ';') {
        std::size_t count = refCount_;
        char buffer[kReferenceBytes + html::kMaxDecodedReferenceBytes];
        std::memcpy(buffer, reference_, refCount_);
        inReference_ = false;
        if (count > 0 && html::decodeReference(buffer, count)) {
          refCount_ = 0;
          for (std::size_t i = 0; i < count; ++i) decoded(static_cast<unsigned char>(buffer[i]));
          return;
        }
        inReference_ = true;
        giveUpReference();
        decoded(c);
        return;
      }
      const bool fits =
          c == '#' || (c >= '0' && c <= '9') || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
      if (fits && refCount_ < kReferenceBytes) {
        reference_[refCount_++] = static_cast<char>(c);
        return;
      }
      giveUpReference();
      // fall through: the byte that ended the attempt is read as text
    }
    if (c == '&') {
      flushSequence();
      inReference_ = true;
      refCount_ = 0;
      return;
    }
    decoded(c);
  }

  // The attempt failed: the word ends at the '&', and the held bytes are plain text.
  void giveUpReference() {
    inReference_ = false;
    finder_.wordEnd();
    for (std::size_t i = 0; i < refCount_; ++i) decoded(static_cast<unsigned char>(reference_[i]));
    refCount_ = 0;
  }

  // A byte of text, after character references.
  void decoded(unsigned char c) {
    if (pending_ > 0) {
      if (c >= 0x80 && c <= 0xBF) {
        sequence_[seqCount_++] = c;
        codePoint_ = codePoint_ << 6 | (c & 0x3F);
        if (--pending_ == 0) completeSequence();
        return;
      }
      flushSequence();  // cut short: its bytes stay as they were
    }
    if (c < 0x80) {
      if (Delimeters::isDelimiter(c)) {
        finder_.wordEnd();
      } else {
        finder_.feed(c >= 'A' && c <= 'Z' ? static_cast<unsigned char>(c + 32) : c);
      }
      return;
    }
    if (c >= 0xC0 && c <= 0xF7) {
      pending_ = c <= 0xDF ? 1 : c <= 0xEF ? 2 : 3;
      codePoint_ = c & (c <= 0xDF ? 0x1F : c <= 0xEF ? 0x0F : 0x07);
      sequence_[0] = c;
      seqCount_ = 1;
      return;
    }
    finder_.feed(c);  // a stray continuation byte, or 0xF8-0xFF
  }

  void completeSequence() {
    const char32_t cp = static_cast<char32_t>(codePoint_);
    const std::size_t count = seqCount_;
    seqCount_ = 0;
    if ((cp >= 0x80 && cp <= 0xA1) || (cp >= 0x2000 && cp <= 0x20CF) ||
        (cp >= 0x3000 && cp <= 0x303F)) {
      finder_.wordEnd();
      return;
    }
    if (const auto folded = FoldCodePoint(cp)) {
      if (*folded < 0x80) {
        finder_.feed(static_cast<unsigned char>(*folded));
      } else {
        // Every folded range maps below U+0800: two bytes.
        finder_.feed(static_cast<unsigned char>(0xC0 | (*folded >> 6 & 0x1F)));
        finder_.feed(static_cast<unsigned char>(0x80 | (*folded & 0x3F)));
      }
    } else {
      for (std::size_t i = 0; i < count; ++i) finder_.feed(sequence_[i]);
    }
    if (cp >= 0x3400 && cp <= 0xA0AF) finder_.wordEnd();
  }

  void flushSequence() {
    for (std::size_t i = 0; i < seqCount_; ++i) finder_.feed(sequence_[i]);
    seqCount_ = 0;
    pending_ = 0;
  }

  // What a byte means on the ASCII path: the byte to feed (lower-cased), a word end, or
  // kOther for '&' and every byte from 0x80 on, which take the per-byte path.
  static constexpr std::uint8_t kWordEnd = 0;
  static constexpr std::uint8_t kOther = 0xFF;
  static constexpr auto kAscii = [] {
    std::array<std::uint8_t, 256> table{};
    for (unsigned c = 0; c < 256; ++c) {
      const auto b = static_cast<unsigned char>(c);
      if (c >= 0x80 || c == '&' || (c == 0 && !Delimeters::isDelimiter(b))) {
        table[c] = kOther;
      } else if (Delimeters::isDelimiter(b)) {
        table[c] = kWordEnd;
      } else {
        table[c] = static_cast<std::uint8_t>(c >= 'A' && c <= 'Z' ? c + 32 : c);
      }
    }
    return table;
  }();

  // Whether every byte up to 0x20 ends a word, as with the default delimiters.
  static constexpr bool kBlanksEndWords = [] {
    for (unsigned c = 0; c <= 0x20; ++c)
      if (kAscii[c] != kWordEnd) return false;
    return true;
  }();

  Finder& finder_;
  bool inReference_ = false;
  char reference_[kReferenceBytes] = {};
  std::size_t refCount_ = 0;
  unsigned char sequence_[4] = {};
  std::size_t seqCount_ = 0;
  int pending_ = 0;
  std::uint64_t codePoint_ = 0;
};

}  // namespace lex
