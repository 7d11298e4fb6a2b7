// A shallow, byte-at-a-time push parser of PDF files. It finds indirect objects by their
// "N G obj" headers and "endobj", scans their dictionaries for /Subtype /Image and /URI
// strings, and hands the raw bytes between "stream" with its line end and "endstream" to its
// handler. It builds
// no object model, never reads the cross-reference table and never decodes anything: a
// damaged or hostile file can only make it miss things. Every buffer it keeps is bounded.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace pdf {

// Longest dictionary key or name value kept; the rest is dropped. PDF itself limits names to
// 127 bytes, and the scan only compares them with short names.
inline constexpr std::size_t kMaxNameLength = 127;
// Longest link kept from a /URI string; the rest is dropped.
inline constexpr std::size_t kMaxLinkLength = 16 * 1024;

// Bytes PDF treats as white space.
constexpr bool IsPdfWhiteSpace(unsigned char c) {
  return c == 0x00 || c == 0x09 || c == 0x0A || c == 0x0C || c == 0x0D || c == 0x20;
}

// A byte string of at most N bytes that drops what does not fit. Used for every name the
// parser collects, so that hostile input costs no memory beyond N.
template <std::size_t N>
class BoundedBytes {
 public:
  void push_back(char c) {
    if (size_ < N) bytes_[size_++] = c;
  }
  void clear() { size_ = 0; }
  bool empty() const { return size_ == 0; }
  std::size_t size() const { return size_; }
  std::string_view view() const { return std::string_view(bytes_.data(), size_); }

 private:
  std::array<char, N> bytes_{};
  std::size_t size_ = 0;
};

class Parser {
 public:
  // Receives the parser's events, in file order.
  class Handler {
   public:
    virtual void objectBegin(std::uint32_t number, std::uint32_t generation) = 0;
    virtual void objectEnd() = 0;
    virtual void streamBegin(bool image) = 0;  // image: the dictionary said /Subtype /Image
    virtual void streamEnd() = 0;
    virtual void streamByte(char c) = 0;               // one raw byte of stream data
    virtual void link(const std::string& target) = 0;  // the text of a /URI string
    virtual ~Handler() = default;
  };

  // A parser of object bodies; the parser routes each body byte to the current one.
  class Subparser {
   public:
    virtual void feed(char c, Parser& parser) = 0;
    virtual void finish(Parser& parser) = 0;

   protected:
    ~Subparser() = default;
  };

  // Picks the body parser from the first significant byte of an object.
  class SubMain final : public Subparser {
   public:
    void feed(char c, Parser& parser) override;
    void finish(Parser&) override {}
  };

  // Bodies that hold nothing of interest: arrays, numbers, the rest of a stream object.
  class SubArray final : public Subparser {
   public:
    void feed(char, Parser&) override {}
    void finish(Parser&) override {}
  };
  class SubNull final : public Subparser {
   public:
    void feed(char, Parser&) override {}
    void finish(Parser&) override {}
  };

  // Collects the string that follows /URI.
  class SubURI final : public Subparser {
   public:
    void feed(char c, Parser& parser) override;
    void finish(Parser& parser) override;  // delivers a non-empty link

   private:
    std::string collected_;
    bool inString_ = false;
  };

  // Passes stream bytes to the handler until "endstream".
  class SubStream final : public Subparser {
   public:
    void feed(char c, Parser& parser) override;
    void finish(Parser& parser) override;                     // reports the stream's end
    bool matching() const { return endstreamMatched_ != 0; }  // "endstream" half-matched

   private:
    std::size_t endstreamMatched_ = 0;
  };

  // The texts the dictionary scanner watches for, and what a match does. kOptional is the
  // index of a byte the text may go without (npos: none).
  struct MetaStream {
    // The keyword's line end is CR LF or a bare LF, as PDF writers use both.
    static constexpr std::string_view kText = "stream\r\n";
    static constexpr std::size_t kOptional = 6;
    static void Matched(Parser& parser);
  };
  struct MetaURI {
    static constexpr std::string_view kText = "/URI";
    static constexpr std::size_t kOptional = std::string_view::npos;
    static void Matched(Parser& parser);
  };

  // Watches the bytes of a dictionary for Meta::kText.
  template <typename Meta>
  class SubToken final : public Subparser {
   public:
    void feed(char c, Parser& parser) override {
      if (c == Meta::kText[matched_]) {
        ++matched_;
      } else if (matched_ == Meta::kOptional && c == Meta::kText[matched_ + 1]) {
        matched_ += 2;
      } else {
        matched_ = c == Meta::kText[0] ? 1 : 0;
        return;
      }
      if (matched_ == Meta::kText.size()) {
        matched_ = 0;  // the byte after a match may begin the next one
        Meta::Matched(parser);
      }
    }
    void finish(Parser&) override { matched_ = 0; }

   private:
    std::size_t matched_ = 0;
  };

  // Scans a dictionary for /Subtype /Image, runs the two watchers.
  class SubDict final : public Subparser {
   public:
    void feed(char c, Parser& parser) override;
    void finish(Parser& parser) override;  // forgets the dictionary and the image flag

   private:
    void CompletePair(Parser& parser);

    SubToken<MetaStream> streamWatcher_;
    SubToken<MetaURI> uriWatcher_;
    BoundedBytes<kMaxNameLength> key_;
    BoundedBytes<kMaxNameLength> value_;
    int state_ = 0;
  };

  explicit Parser(Handler& handler) : handler_(handler) {}
  Parser(const Parser&) = delete;
  Parser& operator=(const Parser&) = delete;

  // Feeds the next bytes of the file; any block size, any boundaries.
  void feed(const char* data, std::size_t size);
  void feed(std::string_view data) { feed(data.data(), data.size()); }

  // The data has ended. An object still open ends here as if "endobj" had followed, so a file
  // cut off inside a stream still reports that stream. Feeding may go on afterwards.
  void finish();

 private:
  void FeedByte(unsigned char c);
  void FeedBody(char c) { current_->feed(c, *this); }
  void FeedPendingEndobj();
  void EndObject();

  // The top-level states; 5 is inside an object.
  enum State : std::uint8_t {
    kBetween = 0,
    kComment = 1,
    kObjectNumber = 2,
    kGeneration = 3,
    kKeyword = 4,
    kInObject = 5,
  };

  Handler& handler_;
  State state_ = kBetween;
  bool imageFlag_ = false;
  // The top-level token. Digits are not kept: their value is accumulated (wrapping, as the
  // number is read) as they arrive, so a run of digits costs nothing; the keyword after the
  // generation is compared once it holds 3 bytes, so it never holds more.
  bool tokenHasDigits_ = false;
  std::uint32_t tokenNumber_ = 0;
  BoundedBytes<3> keyword_;
  std::uint32_t objectNumber_ = 0;
  std::uint32_t generation_ = 0;
  std::size_t endobjMatched_ = 0;
  Subparser* current_ = &subMain_;

  SubNull subNull_;
  SubStream subStream_;
  SubURI subURI_;
  SubArray subArray_;
  SubDict subDict_;
  SubMain subMain_;
};

}  // namespace pdf
