#include "engine/html/script_text_handler.h"

#include <cstdint>

#include "engine/html/decrunch.h"

namespace html_decrunch {

HtmlHandler::ScriptTextHandler::ScriptTextHandler(HtmlHandler& owner) : owner_(owner) {}

HtmlHandler::ScriptTextHandler::~ScriptTextHandler() = default;

void HtmlHandler::ScriptTextHandler::text(const char* data, std::size_t length) {
  if (!decided_) {
    while (length > 0 && static_cast<std::uint8_t>(*data) <= 32) {
      ++data;
      --length;
    }
    if (length == 0) return;
    decide(*data);
  }
  if (html_ != nullptr) {
    html_->feed(data, length);
  } else if (sink_ != nullptr) {
    sink_->text(data, length);
  }
}

void HtmlHandler::ScriptTextHandler::decide(char first) {
  decided_ = true;
  // At the nesting limit HTML in a script is only script text.
  if (first == '<' && owner_.depth_ < html::kMaxDecrunchNesting) {
    html_ =
        std::make_unique<HtmlInScript>(owner_.receiver_, html::Decrunch::NestedIn{owner_.depth_});
    return;
  }
  sink_ = owner_.receiver_.scriptSink(owner_);
  owner_.strings_[0].clear();
}

void HtmlHandler::ScriptTextHandler::end() {
  if (sink_ != nullptr) sink_->end();
}

}  // namespace html_decrunch
