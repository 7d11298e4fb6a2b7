// Fixed sizes of the decrunch pipeline and the limits it puts on what a page controls.
#pragma once

#include <cstddef>

namespace html_decrunch {

// Page text reaches the sink chain in pieces of at most this many bytes.
inline constexpr std::size_t kTextCollectorBytes = 1000;
// A character reference held in page text gives up at this many bytes after its '&'.
inline constexpr std::size_t kMaxReferenceBytes = 11;

// Decoded script string text is handed on once it holds more than kScriptHandOverBytes
// bytes (and no '%' escape is half read), or when the buffer is full.
inline constexpr std::size_t kScriptTextBytes = 1000;
inline constexpr std::size_t kScriptHandOverBytes = 997;
// A URL found in script text keeps its first this many bytes.
inline constexpr std::size_t kScriptUrlBytes = 2000;
// A run after "://" is a URL only when it has more than this many bytes.
inline constexpr std::size_t kMinScriptUrlBytes = 4;

// Open elements remembered by the element tracker, and the bytes of their names. Past either
// limit the oldest records are forgotten (not closed), so a page of unclosed tags costs a
// bounded amount of memory and every end tag a bounded amount of work.
inline constexpr std::size_t kMaxOpenElements = 4096;
inline constexpr std::size_t kMaxOpenElementNameBytes = 64 * 1024;
// Names of elements no longer open that the tracker keeps counting (at zero) so that the
// usual elements do not cost an allocation each time they open.
inline constexpr std::size_t kMaxIdleElementNames = 64;

// The raw text of a meta refresh value and its fallback text keep at most this many bytes.
inline constexpr std::size_t kMaxRefreshTextBytes = 16 * 1024;
// A meta refresh URL that is not a data URL costs one swallowed error per byte; after this
// many the decoder is fed no more.
inline constexpr std::size_t kMaxMetaUrlRejectedBytes = 1024;

}  // namespace html_decrunch

namespace html {

// Pipelines nest (a data URL behind a meta refresh, HTML inside a script string, each of
// which may hold more of the same). A pipeline this many levels below the page's own creates
// no further nested pipeline, so a page cannot exhaust memory or the stack by nesting.
inline constexpr std::size_t kMaxDecrunchNesting = 8;

}  // namespace html
