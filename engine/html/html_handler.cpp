#include "engine/html/html_handler.h"

#include "engine/html/decrunch.h"
#include "engine/html/meta_url_decoder.h"
#include "engine/html/script_text_extractor.h"
#include "engine/html/script_text_handler.h"

namespace html_decrunch {

HtmlHandler::HtmlHandler(Receiver& receiver, std::size_t depth, bool announce)
    : tracker_(*this), receiver_(receiver), chain_(receiver), collector_(chain_), depth_(depth) {
  if (depth_ > 0 && announce) receiver_.beginNested();
}

// Sinks are not ended and buffered text is not delivered: the document simply stopped. An
// open script is finished as its end tag would, and nested pipelines end before this one.
HtmlHandler::~HtmlHandler() {
  try {
    finishScript();
  } catch (...) {
    // A destructor cannot report the receiver's failure.
  }
  scriptExtractor_.reset();
  scriptTextHandler_.reset();
  metaUrl_.reset();
  if (depth_ > 0) {
    try {
      receiver_.endNested();
    } catch (...) {
    }
  }
}

void HtmlHandler::text(const char* data, std::size_t length) { collector_.add(data, length); }

bool HtmlHandler::openElement(std::string_view name) {
  // Strings of an earlier element must never pass for this one's.
  clearStrings();
  tracker_.open(name);
  valueSlot_ = nullptr;
  charSlot_ = nullptr;
  const TagRow* row = findTag(name);
  if (row == nullptr) {
    attributeSlot_ = nullptr;
    tagEndSlot_ = nullptr;
    return false;
  }
  attributeSlot_ = row->attribute;
  tagEndSlot_ = row->tagEnd;
  return attributeSlot_ != nullptr;
}

bool HtmlHandler::startTagEnd() {
  const bool wantsRawText = tagEndSlot_ != nullptr && (this->*tagEndSlot_)();
  tracker_.startTagEnded();
  return wantsRawText;
}

void HtmlHandler::closeElement(std::string_view name) { tracker_.close(name); }

int HtmlHandler::attributeName(std::string_view name) {
  valueSlot_ = nullptr;
  charSlot_ = nullptr;
  return attributeSlot_ != nullptr ? (this->*attributeSlot_)(name) : html::kAttrSkip;
}

void HtmlHandler::attributeValue(std::string_view value) {
  if (valueSlot_ != nullptr) (this->*valueSlot_)(value);
}

void HtmlHandler::attributeChar(char byte) {
  if (charSlot_ != nullptr) (this->*charSlot_)(static_cast<std::uint8_t>(byte));
}

void HtmlHandler::attributeChars(const char* data, std::size_t length) {
  if (charSlot_ == &HtmlHandler::refreshByte) {
    refreshRun(data, length);
    return;
  }
  if (charSlot_ == nullptr) return;
  for (std::size_t i = 0; i < length; ++i) (this->*charSlot_)(static_cast<std::uint8_t>(data[i]));
}

void HtmlHandler::scriptText(const char* data, std::size_t length) {
  if (scriptExtractor_ != nullptr) scriptExtractor_->feed(data, length);
}

// Every change of the sink chain first hands the collected text to the chain as it stands,
// so text read inside an element reaches the sinks that were open while it was read.
void HtmlHandler::elementClosed(std::string_view name) {
  if (name == "a") {
    if (anchorNode_.linked()) {
      collector_.handOver();
      closeNode(anchorNode_);
    }
  } else if (name == "option") {
    if (selectNode_.linked()) {
      collector_.handOver();
      chain_.breakTextFrom(selectNode_);
      chain_.makeHeadCurrent();
    }
  } else if (name == "select") {
    if (selectNode_.linked()) {
      collector_.handOver();
      closeNode(selectNode_);
    }
  } else if (name == "script") {
    finishScript();
  } else if (name == "title") {
    collector_.handOver();
    chain_.makeHeadCurrent();
    if (titleNode_.linked()) closeNode(titleNode_);
  }
}

void HtmlHandler::openNode(SinkChain::Node& node, TextHandler* sink) {
  if (sink != nullptr) chain_.append(node, *sink);
}

void HtmlHandler::closeNode(SinkChain::Node& node) {
  TextHandler* sink = node.sink();
  chain_.unlink(node);
  sink->end();
}

void HtmlHandler::finishScript() {
  if (scriptExtractor_ == nullptr) return;
  // Both go even when the receiver throws; the extractor refers to the text handler.
  const std::unique_ptr<ScriptTextHandler> textHandler = std::move(scriptTextHandler_);
  const std::unique_ptr<ScriptTextExtractor> extractor = std::move(scriptExtractor_);
  extractor->finish();
}

void HtmlHandler::clearStrings() {
  for (ElementString& s : strings_) s.clear();
}

}  // namespace html_decrunch
