// The tag table of the HTML handler: for the 22 elements it cares about, which attributes it
// keeps (collected whole or streamed byte by byte; every other attribute is skipped unread)
// and what happens at the '>' of the start tag.
#include <algorithm>
#include <array>
#include <cstdint>
#include <iterator>

#include "engine/html/char_class.h"
#include "engine/html/decrunch.h"
#include "engine/html/html_handler.h"
#include "engine/html/meta_url_decoder.h"
#include "engine/html/percent_decoding.h"
#include "engine/html/script_text_extractor.h"
#include "engine/html/script_text_handler.h"

namespace html_decrunch {
namespace {

void lowerAscii(std::string& text) {
  for (char& c : text) c = static_cast<char>(html::toLowerAscii(static_cast<std::uint8_t>(c)));
}

bool equalsIgnoringAsciiCase(std::string_view text, std::string_view lower) {
  return std::equal(text.begin(), text.end(), lower.begin(), lower.end(), [](char a, char b) {
    return html::toLowerAscii(static_cast<std::uint8_t>(a)) == static_cast<std::uint8_t>(b);
  });
}

}  // namespace

const HtmlHandler::TagRow* HtmlHandler::findTag(std::string_view name) {
  using H = HtmlHandler;
  static constexpr TagRow kTags[] = {
      {"a", &H::anchorAttribute, &H::anchorEnd},
      {"applet", &H::skipAttributes, nullptr},
      {"area", &H::areaAttribute, nullptr},
      {"body", &H::skipAttributes, nullptr},
      {"br", nullptr, &H::flushTextEnd},
      {"button", &H::skipAttributes, nullptr},
      {"div", &H::skipAttributes, &H::flushTextEnd},
      {"embed", &H::embedAttribute, nullptr},
      {"form", &H::formAttribute, nullptr},
      {"frame", &H::frameAttribute, nullptr},
      {"iframe", &H::iframeAttribute, nullptr},
      {"img", &H::imgAttribute, &H::flushTextEnd},
      {"input", &H::inputAttribute, &H::inputEnd},
      {"link", &H::linkAttribute, &H::linkEnd},
      {"map", nullptr, nullptr},
      {"meta", &H::metaAttribute, &H::metaEnd},
      {"object", &H::embedAttribute, nullptr},
      {"option", nullptr, &H::optionEnd},
      {"script", &H::scriptAttribute, &H::scriptEnd},
      {"select", nullptr, &H::selectEnd},
      {"style", nullptr, &H::styleEnd},
      {"title", nullptr, &H::titleEnd},
  };
  static_assert(std::size(kTags) == 22);
  static_assert(std::is_sorted(std::begin(kTags), std::end(kTags),
                               [](const TagRow& a, const TagRow& b) { return a.name < b.name; }));
  // Looked up packed: every start tag of a page comes here.
  static constexpr auto kKeys = [] {
    std::array<std::uint64_t, std::size(kTags)> keys{};
    for (std::size_t i = 0; i < keys.size(); ++i) keys[i] = html::packName(kTags[i].name);
    return keys;
  }();
  const std::uint64_t key = html::packName(name);
  if (key == 0) return nullptr;
  const auto* hit = std::find(kKeys.begin(), kKeys.end(), key);
  return hit != kKeys.end() ? &kTags[hit - kKeys.begin()] : nullptr;
}

// --- what an attribute is for -------------------------------------------------------------

int HtmlHandler::collectUrl(html::UrlKind kind) {
  urlKind_ = kind;
  valueSlot_ = &HtmlHandler::reportUrl;
  return html::kAttrCollect;
}

int HtmlHandler::collectInto(ElementString& target, bool percentDecoded) {
  valueTarget_ = &target;
  valueSlot_ = percentDecoded ? &HtmlHandler::storeDecodedValue : &HtmlHandler::storeValue;
  return html::kAttrCollect;
}

// Alternative text is page text, delivered byte by byte as it streams in.
int HtmlHandler::streamText() {
  collector_.flush();
  charSlot_ = &HtmlHandler::textByte;
  return html::kAttrStream;
}

void HtmlHandler::storeValue(std::string_view value) { valueTarget_->set(std::string(value)); }

void HtmlHandler::storeDecodedValue(std::string_view value) {
  valueTarget_->set(percentDecode(value));
}

void HtmlHandler::reportUrl(std::string_view value) {
  receiver_.url(percentDecode(value), urlKind_);
}

void HtmlHandler::textByte(std::uint8_t byte) {
  collector_.add(byte);
  collector_.handOver();
}

void HtmlHandler::descriptionByte(std::uint8_t byte) {
  const char c = static_cast<char>(byte);
  description_->text(&c, 1);
}

void HtmlHandler::refreshByte(std::uint8_t byte) {
  switch (refresh_.feed(byte)) {
    case RefreshParser::Step::kFirstUrl:
      refreshTargetBegins(byte);
      break;
    case RefreshParser::Step::kUrl:
      if (metaUrl_ != nullptr && metaUrl_->open()) metaUrl_->feed(byte);
      break;
    case RefreshParser::Step::kNone:
      break;
  }
}

void HtmlHandler::refreshTargetBegins(std::uint8_t first) {
  if (depth_ < html::kMaxDecrunchNesting) {
    // One decoder serves every refresh of the page.
    if (metaUrl_ == nullptr) metaUrl_ = std::make_unique<DecrunchMetaUrl>(receiver_, depth_);
    metaUrl_->start();
  }
  if (metaUrl_ != nullptr && metaUrl_->open()) metaUrl_->feed(first);
}

// A refresh value in runs: the parser reads up to the target; once it has reached the target
// (or given up) the rest of the run goes on as a whole.
void HtmlHandler::refreshRun(const char* data, std::size_t length) {
  while (length > 0) {
    if (refresh_.inTarget()) {
      if (metaUrl_ != nullptr && metaUrl_->open()) metaUrl_->feed(data, length);
      return;
    }
    if (refresh_.gaveUp()) {
      refresh_.addFallback(data, length);
      return;
    }
    const std::size_t taken = refresh_.feedUpToTarget(data, length);
    data += taken;
    length -= taken;
    if (refresh_.inTarget()) refreshTargetBegins(static_cast<std::uint8_t>(data[-1]));
  }
}

// --- attribute callbacks --------------------------------------------------------------------

int HtmlHandler::skipAttributes(std::string_view) { return html::kAttrSkip; }

int HtmlHandler::anchorAttribute(std::string_view name) {
  return name == "href" ? collectInto(strings_[0], true) : html::kAttrSkip;
}

int HtmlHandler::areaAttribute(std::string_view name) {
  return name == "href" ? collectUrl(html::kUrlArea) : html::kAttrSkip;
}

int HtmlHandler::embedAttribute(std::string_view name) {
  return name == "src" ? collectUrl(html::kUrlEmbedded) : html::kAttrSkip;
}

int HtmlHandler::formAttribute(std::string_view name) {
  return name == "action" ? collectUrl(html::kUrlFormAction) : html::kAttrSkip;
}

int HtmlHandler::frameAttribute(std::string_view name) {
  return name == "src" ? collectUrl(html::kUrlFrame) : html::kAttrSkip;
}

int HtmlHandler::iframeAttribute(std::string_view name) {
  return name == "src" ? collectUrl(html::kUrlIframe) : html::kAttrSkip;
}

int HtmlHandler::imgAttribute(std::string_view name) {
  if (name == "alt") return streamText();
  if (name == "src") return collectUrl(html::kUrlImage);
  return html::kAttrSkip;
}

int HtmlHandler::inputAttribute(std::string_view name) {
  if (name == "type") return collectInto(strings_[0], false);
  if (name == "src") return collectInto(strings_[1], true);
  if (name == "value") return collectInto(strings_[2], false);
  if (name == "placeholder") return streamText();
  return html::kAttrSkip;
}

int HtmlHandler::linkAttribute(std::string_view name) {
  if (name == "rel") return collectInto(strings_[1], false);
  if (name == "href") return collectInto(strings_[0], true);
  return html::kAttrSkip;
}

int HtmlHandler::metaAttribute(std::string_view name) {
  if (name == "http-equiv") return collectInto(strings_[0], false);
  if (name == "name") return collectInto(strings_[1], false);
  if (name != "content") return html::kAttrSkip;
  if (strings_[1].seen && equalsIgnoringAsciiCase(strings_[1].value, "description")) {
    // A second content of the same description goes to the sink already open.
    if (description_ == nullptr) description_ = receiver_.descriptionSink();
    if (description_ == nullptr) return html::kAttrSkip;
    charSlot_ = &HtmlHandler::descriptionByte;
    return html::kAttrStream;
  }
  refresh_.reset();
  charSlot_ = &HtmlHandler::refreshByte;
  return html::kAttrStream;
}

int HtmlHandler::scriptAttribute(std::string_view name) {
  return name == "src" ? collectInto(strings_[0], true) : html::kAttrSkip;
}

// --- start-tag-end callbacks ----------------------------------------------------------------

bool HtmlHandler::anchorEnd() {
  if (!strings_[0].seen) return false;
  collector_.handOver();
  // Only an anchor the element tracker has forgotten can still be open here.
  if (anchorNode_.linked()) closeNode(anchorNode_);
  openNode(anchorNode_, receiver_.anchorSink(*this));
  strings_[0].clear();
  return false;
}

bool HtmlHandler::flushTextEnd() {
  collector_.flush();
  return false;
}

bool HtmlHandler::inputEnd() {
  std::string& type = strings_[0].value;
  lowerAscii(type);
  if (type == "image") {
    receiver_.url(strings_[1].value, html::kUrlImage);
  } else if (type != "hidden") {
    if (strings_[2].seen && (type == "radio" || type == "submit")) {
      collector_.add(strings_[2].value.data(), strings_[2].value.size());
      collector_.flush();
    }
    receiver_.input(*this);
  }
  clearStrings();
  return false;
}

bool HtmlHandler::linkEnd() {
  lowerAscii(strings_[1].value);
  const std::string& rel = strings_[1].value;
  if (rel == "shortcut icon") {
    receiver_.url(strings_[0].value, html::kUrlIcon);
  } else if (rel == "stylesheet") {
    receiver_.url(strings_[0].value, html::kUrlStyleSheet);
  }
  strings_[0].clear();
  strings_[1].clear();
  return false;
}

bool HtmlHandler::metaEnd() {
  if (description_ != nullptr) {
    TextHandler* description = description_;
    description_ = nullptr;
    const std::string& fallback = refresh_.fallback();
    if (!fallback.empty()) description->text(fallback.data(), fallback.size());
    description->end();
  }
  refresh_.clearFallback();
  if (metaUrl_ != nullptr) metaUrl_->finish();
  return false;
}

bool HtmlHandler::optionEnd() {
  if (!selectNode_.linked()) return false;
  collector_.handOver();
  chain_.breakTextFrom(selectNode_);
  if (firstOptionPending_) {
    // The first option is also page text.
    firstOptionPending_ = false;
  } else {
    chain_.moveToTail(selectNode_);
    chain_.makeCurrent(selectNode_);
  }
  return false;
}

bool HtmlHandler::scriptEnd() {
  scriptExtractor_.reset();
  scriptTextHandler_ = std::make_unique<ScriptTextHandler>(*this);
  scriptExtractor_ = std::make_unique<ScriptTextExtractor>(*scriptTextHandler_, receiver_);
  return true;
}

bool HtmlHandler::selectEnd() {
  collector_.handOver();
  if (selectNode_.linked()) closeNode(selectNode_);
  firstOptionPending_ = true;
  collector_.flush();
  openNode(selectNode_, receiver_.selectSink());
  return false;
}

// The style text is read (so that its markup is not taken for tags) and dropped.
bool HtmlHandler::styleEnd() { return true; }

bool HtmlHandler::titleEnd() {
  collector_.handOver();
  if (titleNode_.linked()) closeNode(titleNode_);
  if (TextHandler* sink = receiver_.titleSink()) {
    chain_.append(titleNode_, *sink);
    chain_.makeCurrent(titleNode_);
  }
  return false;
}

}  // namespace html_decrunch
