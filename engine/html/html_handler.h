// The handler of the page's tokenizer: turns tokens into what the receiver of the decrunch
// pipeline wants. It tracks open elements, keeps the few attributes the tag table names,
// routes page text through the text collector and the sink chain, reads meta refreshes
// (decoding data URLs through a nested pipeline), and runs script text through the script
// scanner (sending HTML written in script strings through a nested pipeline).
//
// Everything in the page is hostile; sizes it controls are bounded by the constants of
// decrunch_limits.h and of the tokenizer.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "engine/html/decrunch_interfaces.h"
#include "engine/html/element_tracker.h"
#include "engine/html/refresh_parser.h"
#include "engine/html/sink_chain.h"
#include "engine/html/text_collector.h"

namespace html {
class Decrunch;
}

namespace html_decrunch {

class ScriptTextExtractor;

// One of the current element's three strings, and whether the element set it.
struct ElementString {
  std::string value;
  bool seen = false;

  void set(std::string text) {
    value = std::move(text);
    seen = true;
  }
  void clear() {
    value.clear();
    seen = false;
  }
};

class HtmlHandler final : private ElementTracker::Listener {
 public:
  using Receiver = html::DecrunchInterfaces::Handler;
  using TextHandler = html::DecrunchInterfaces::TextHandler;

  class DecrunchMetaUrl;
  class ScriptTextHandler;
  // HTML written in script strings runs through a pipeline of its own.
  using HtmlInScript = html::Decrunch;

  // `depth` is the number of pipelines this one is nested in; a nested handler tells the
  // receiver beginNested now (unless `announce` is false: its owner has done so) and
  // endNested when it is destroyed.
  HtmlHandler(Receiver& receiver, std::size_t depth, bool announce = true);
  ~HtmlHandler();
  HtmlHandler(const HtmlHandler&) = delete;
  HtmlHandler& operator=(const HtmlHandler&) = delete;

  // The current element's strings: a href, script src, link href, input type, meta
  // http-equiv (first); input src, link rel, meta name (second); input value (third).
  const ElementString& first() const { return strings_[0]; }
  const ElementString& second() const { return strings_[1]; }
  const ElementString& third() const { return strings_[2]; }

  Receiver& receiver() const { return receiver_; }
  std::size_t depth() const { return depth_; }
  std::vector<std::string> openElements() const { return tracker_.openNames(); }

  // What the tokenizer calls (see tokenizer_handler.h).
  void text(const char* data, std::size_t length);
  bool openElement(std::string_view name);
  bool startTagEnd();
  void closeElement(std::string_view name);
  int attributeName(std::string_view name);
  void attributeValue(std::string_view value);
  void attributeChar(char byte);
  // A run of streamed bytes: the same as attributeChar for each.
  void attributeChars(const char* data, std::size_t length);
  TextHandler* commentSink() { return receiver_.commentSink(); }
  void scriptText(const char* data, std::size_t length);

 private:
  using AttributeFn = int (HtmlHandler::*)(std::string_view name);
  using TagEndFn = bool (HtmlHandler::*)();
  using ValueFn = void (HtmlHandler::*)(std::string_view value);
  using CharFn = void (HtmlHandler::*)(std::uint8_t byte);

  struct TagRow {
    std::string_view name;
    AttributeFn attribute;  // null: the element's attributes are not read
    TagEndFn tagEnd;        // null: nothing happens at the '>'
  };
  static const TagRow* findTag(std::string_view name);

  // The element-closed dispatch.
  void elementClosed(std::string_view name) override;

  // Sink chain changes.
  void openNode(SinkChain::Node& node, TextHandler* sink);
  void closeNode(SinkChain::Node& node);
  void finishScript();

  // Attribute callbacks of the tag table (html_handler_tags.cpp).
  int skipAttributes(std::string_view name);
  int anchorAttribute(std::string_view name);
  int areaAttribute(std::string_view name);
  int embedAttribute(std::string_view name);
  int formAttribute(std::string_view name);
  int frameAttribute(std::string_view name);
  int iframeAttribute(std::string_view name);
  int imgAttribute(std::string_view name);
  int inputAttribute(std::string_view name);
  int linkAttribute(std::string_view name);
  int metaAttribute(std::string_view name);
  int scriptAttribute(std::string_view name);

  // Start-tag-end callbacks.
  bool anchorEnd();
  bool flushTextEnd();
  bool inputEnd();
  bool linkEnd();
  bool metaEnd();
  bool optionEnd();
  bool scriptEnd();
  bool selectEnd();
  bool styleEnd();
  bool titleEnd();

  // What an attribute's value or bytes are for.
  int collectUrl(html::UrlKind kind);
  int collectInto(ElementString& target, bool percentDecoded);
  int streamText();
  void storeValue(std::string_view value);
  void storeDecodedValue(std::string_view value);
  void reportUrl(std::string_view value);
  void textByte(std::uint8_t byte);
  void descriptionByte(std::uint8_t byte);
  void refreshByte(std::uint8_t byte);
  void refreshRun(const char* data, std::size_t length);
  void refreshTargetBegins(std::uint8_t first);

  void clearStrings();

  ElementString strings_[3];
  ElementTracker tracker_;
  Receiver& receiver_;
  SinkChain chain_;
  TextCollector collector_;

  // Configuration slots: what the current element does with its attributes and its '>'.
  AttributeFn attributeSlot_ = nullptr;
  TagEndFn tagEndSlot_ = nullptr;
  ValueFn valueSlot_ = nullptr;
  CharFn charSlot_ = nullptr;
  ElementString* valueTarget_ = nullptr;
  html::UrlKind urlKind_ = html::kUrlImage;

  RefreshParser refresh_;
  SinkChain::Node anchorNode_;
  SinkChain::Node titleNode_;
  SinkChain::Node selectNode_;
  bool firstOptionPending_ = false;
  TextHandler* description_ = nullptr;
  std::unique_ptr<DecrunchMetaUrl> metaUrl_;
  std::unique_ptr<ScriptTextHandler> scriptTextHandler_;
  std::unique_ptr<ScriptTextExtractor> scriptExtractor_;
  std::size_t depth_;
};

}  // namespace html_decrunch
