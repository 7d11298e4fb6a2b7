// What the string literals of one script element say. The script scanner finds the strings;
// the extractor percent-decodes their text and hands it on in pieces of about
// kScriptTextBytes to the script text handler and to a URL finder that reports every
// "scheme://host/path" it sees to the receiver. Both see the same pieces, so a URL may span
// strings and hand-overs.
#pragma once

#include <cstddef>
#include <cstdint>

#include "engine/html/decrunch_interfaces.h"
#include "engine/html/decrunch_limits.h"
#include "engine/html/js_parser.h"

namespace html_decrunch {

// Waits for "://", then collects the run of URL bytes after it and reports it through the
// receiver's scriptUrl when it is longer than kMinScriptUrlBytes.
class ScriptUrlFinder {
 public:
  explicit ScriptUrlFinder(html::DecrunchInterfaces::Handler& receiver) : receiver_(receiver) {}
  void feed(const char* data, std::size_t length);
  // The end of the script ends a run in progress too.
  void finish();

 private:
  void endRun();

  html::DecrunchInterfaces::Handler& receiver_;
  std::size_t separator_ = 0;  // bytes of "://" matched
  bool inRun_ = false;
  std::size_t runBytes_ = 0;  // bytes of the run, including those beyond the buffer
  char url_[kScriptUrlBytes];
};

class ScriptTextExtractor final : private ap::JSParser<char>::Handler {
 public:
  using TextHandler = html::DecrunchInterfaces::TextHandler;

  ScriptTextExtractor(TextHandler& output, html::DecrunchInterfaces::Handler& receiver);
  ScriptTextExtractor(const ScriptTextExtractor&) = delete;
  ScriptTextExtractor& operator=(const ScriptTextExtractor&) = delete;

  // Raw script text.
  void feed(const char* data, std::size_t length) { scanner_.feed(data, length); }
  // The end of the script: a pending string, a half-read escape and the buffer are handed
  // over, then the output hears `end`.
  void finish();

 private:
  // Decoded string text from the scanner.
  void text(const char* data, std::size_t length) override;
  void decode(std::uint8_t byte);
  void append(std::uint8_t byte);
  void appendRun(const std::uint8_t* data, std::size_t length);
  void handOver();

  TextHandler& output_;
  ScriptUrlFinder urls_;
  // A '%' escape being read: 0 none, 1 after the '%', 2 after its first digit.
  int escape_ = 0;
  std::uint8_t firstDigit_ = 0;
  char buffer_[kScriptTextBytes];
  std::size_t count_ = 0;
  ap::JSParser<char> scanner_;  // last: it calls back into the members above
};

}  // namespace html_decrunch
