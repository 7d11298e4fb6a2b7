// The receivers of the decrunch pipeline: everything it extracts from a page leaves through
// these interfaces. html::Decrunch derives from DecrunchInterfaces, so users spell them
// html::Decrunch::TextHandler and html::Decrunch::Handler.
#pragma once

#include <cstddef>
#include <string_view>

namespace html_decrunch {
class HtmlHandler;
}

namespace html {

// What a reported URL is. Kinds 0 and 3 belong to the receiver's own vocabulary (anchors
// and script sources reach it through their sinks) and are never reported by the pipeline.
enum UrlKind : int {
  kUrlImage = 1,       // img src, src of an input of type "image"
  kUrlStyleSheet = 2,  // link rel="stylesheet"
  kUrlIcon = 4,        // link rel="shortcut icon"
  kUrlFormAction = 5,  // form action
  kUrlArea = 6,        // area href
  kUrlIframe = 7,      // iframe src
  kUrlFrame = 8,       // frame src
  kUrlEmbedded = 9,    // embed or object src
};

struct DecrunchInterfaces {
  // A text sink: page text, or the text of a title, description, select, anchor, script or
  // comment. Virtual operations in slot order: text, breakText, end, destructor.
  class TextHandler {
   public:
    virtual void text(const char* data, std::size_t length) = 0;
    // A block boundary: whatever comes next is not glued to what came before.
    virtual void breakText() = 0;
    // The element the sink was handed out for has ended.
    virtual void end() = 0;
    virtual ~TextHandler() = default;
  };

  // The receiver of a pipeline. Its TextHandler operations receive the visible page text.
  // Sinks it hands out stay owned by the receiver; the pipeline only calls them, and never
  // after their end. The handler passed to anchorSink, scriptSink and input exposes the
  // current element's strings (first: href or src or type; second: src; third: value).
  class Handler : public TextHandler {
   public:
    virtual void url(std::string_view value, UrlKind kind) = 0;
    // A URL found in the string literals of a script.
    virtual void scriptUrl(std::string_view text) = 0;
    virtual TextHandler* commentSink() = 0;
    virtual TextHandler* titleSink() = 0;
    virtual TextHandler* descriptionSink() = 0;
    virtual TextHandler* selectSink() = 0;
    virtual TextHandler* anchorSink(const html_decrunch::HtmlHandler& handler) = 0;
    virtual TextHandler* scriptSink(const html_decrunch::HtmlHandler& handler) = 0;
    virtual void input(const html_decrunch::HtmlHandler& handler) = 0;
    // Content decoded out of the page (a data URL behind a meta refresh, HTML written in a
    // script string) is reported between these two calls.
    virtual void beginNested() = 0;
    virtual void endNested() = 0;
  };
};

}  // namespace html
