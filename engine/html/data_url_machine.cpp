#include "engine/html/data_url_machine.h"

#include <string_view>

#include "engine/common/error.h"
#include "engine/html/base64_decoder.h"
#include "engine/html/byte_scan.h"
#include "engine/html/char_class.h"

namespace utils {

using util::Pop;
using util::Push;
using util::Stay;
using util::Transition;

// The bottom state: the scheme, exactly "data:".
class DataUrlMachine::WaitHeaderState final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    if (b != expected()) {
      ++machine().rejected_;
      return Stay();
    }
    if (++matched_ < kScheme.size()) return Stay();
    return Push<ParseHeader>(machine());
  }
  // Every byte up to the next expected one is rejected.
  static constexpr bool kBulk = true;
  const std::uint8_t* consume(const std::uint8_t* p, const std::uint8_t* end) override {
    const std::uint8_t* stop = html::findByte(p, end, expected());
    machine().rejected_ += static_cast<std::size_t>(stop - p);
    return stop;
  }

 private:
  static constexpr std::string_view kScheme = "data:";
  std::uint8_t expected() const { return static_cast<std::uint8_t>(kScheme[matched_]); }
  std::size_t matched_ = 0;
};

// Tokens separated by ';' up to the ',' that starts the data.
class DataUrlMachine::ParseHeader final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    DataUrlMachine& m = machine();
    if (b == ';') {
      if (!mediaTypeStored_) {
        mediaTypeStored_ = true;
        if (!token_.empty()) m.mediaType_ = token_;
      }
      token_.clear();
      return Stay();
    }
    if (b == ',') {
      if (token_ == "base64") return Push<base64::Decoder<Base64StateBase>>(m);
      // "data:text/html,..." names its media type without a parameter.
      if (!mediaTypeStored_ && !token_.empty()) m.mediaType_ = token_;
      return Push<DecodePercentage>(m);
    }
    if (token_.size() < kMaxDataUrlHeaderToken) token_.push_back(static_cast<char>(b));
    return Stay();
  }

 private:
  std::string token_;
  bool mediaTypeStored_ = false;
};

class DataUrlMachine::Base64StateBase : public state_t {
 protected:
  void output(std::uint8_t b) { machine().output(b); }
};

class DataUrlMachine::DecodePercentage final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    if (b == '%') return Push<HexPair>(machine());
    machine().output(b);
    return Stay();
  }
  static constexpr bool kBulk = true;
  const std::uint8_t* consume(const std::uint8_t* p, const std::uint8_t* end) override {
    const std::uint8_t* stop = html::findByte(p, end, '%');
    for (; p < stop; ++p) machine().output(*p);
    return stop;
  }
};

// After '%': two hexadecimal digits make one byte; anything else passes through as written.
class DataUrlMachine::HexPair final : public state_t {
 public:
  Transition process(std::uint8_t b) override {
    DataUrlMachine& m = machine();
    const int value = html::hexDigitValue(b);
    if (value < 0) {
      m.output('%');
      if (first_ >= 0) m.output(static_cast<std::uint8_t>(heldByte_));
      m.output(b);
      return Pop(1);
    }
    if (first_ < 0) {
      first_ = value;
      heldByte_ = b;
      return Stay();
    }
    m.output(static_cast<std::uint8_t>(first_ * 16 + value));
    return Pop(1);
  }

 private:
  int first_ = -1;  // value of the held first digit, -1 when none
  std::uint8_t heldByte_ = 0;
};

DataUrlMachine::DataUrlMachine(Handler& handler) : handler_(&handler) {
  pushState<WaitHeaderState>();
}

void DataUrlMachine::restart() {
  popAll();
  mediaType_ = "text/plain";
  rejected_ = 0;
  pushState<WaitHeaderState>();
}

void DataUrlMachine::feed(std::uint8_t byte) {
  const std::size_t before = rejected_;
  feedByte(byte);
  if (rejected_ != before) ap::ThrowError(kHeaderError);
}

std::size_t DataUrlMachine::offer(const char* data, std::size_t length) {
  const std::size_t before = rejected_;
  Engine::feed(data, length);
  return rejected_ - before;
}

}  // namespace utils
