#include "engine/pdf/simplifier.h"

#include <zlib.h>

#include <algorithm>
#include <climits>

#include "engine/common/trace.h"

namespace pdf_strs {
namespace {

// White space as the C library's isspace() sees it in the "C" locale.
bool IsLineSpace(char c) {
  return c == ' ' || c == '\t' || c == '\n' || c == '\v' || c == '\f' || c == '\r';
}

std::string_view Trim(std::string_view line) {
  while (!line.empty() && IsLineSpace(line.front())) line.remove_prefix(1);
  while (!line.empty() && IsLineSpace(line.back())) line.remove_suffix(1);
  return line;
}

void Send(ap::PdfHandler& sink, std::string_view text) { sink.text(std::string(text)); }

// "(A) 5 (B\)) -3 (C)] TJ": every parenthesised string; a backslash makes the next byte
// ordinary, so "\)" stays inside and "\\)" ends the string after an escaped backslash.
void SendShowArray(std::string_view line, ap::PdfHandler& sink) {
  std::size_t open = line.find('(');
  while (open != std::string_view::npos) {
    std::size_t i = open + 1;
    while (i < line.size() && line[i] != ')') i += line[i] == '\\' ? 2 : 1;
    if (i >= line.size()) return;  // no closing parenthesis: the rest of the line is lost
    Send(sink, line.substr(open + 1, i - open - 1));
    open = std::string_view::npos;
    for (std::size_t j = i + 1; j < line.size(); j += line[j] == '\\' ? 2 : 1) {
      if (line[j] == '(') {
        open = j;
        break;
      }
    }
  }
}

// "(Hello) Tj": the bytes between the first "(" and the first ")" after it.
void SendShowString(std::string_view line, ap::PdfHandler& sink) {
  const std::size_t open = line.find('(');
  if (open == std::string_view::npos) return;
  const std::size_t close = line.find(')', open + 1);
  if (close == std::string_view::npos) return;
  Send(sink, line.substr(open + 1, close - open - 1));
}

}  // namespace

InflateResult Decompress(std::string_view input, std::size_t limit, std::string& output) {
  output.clear();
  if (input.empty()) return InflateResult::kEmpty;

  z_stream stream{};
  if (inflateInit(&stream) != Z_OK) {
    output = "inflateInit not Z_OK";
    return InflateResult::kInitFailed;
  }
  // The whole input at once; zlib counts input in 32 bits.
  stream.next_in = reinterpret_cast<Bytef*>(const_cast<char*>(input.data()));
  stream.avail_in = static_cast<uInt>(std::min<std::size_t>(input.size(), UINT_MAX));

  InflateResult result = InflateResult::kDone;
  unsigned char window[kInflateWindow];
  for (;;) {
    const std::size_t room = std::min(kInflateWindow, limit - output.size());
    if (room == 0) {
      result = InflateResult::kLimit;
      break;
    }
    stream.next_out = window;
    stream.avail_out = static_cast<uInt>(room);
    const int rc = inflate(&stream, Z_NO_FLUSH);
    // What this call produced before any error is kept: it is as good as the earlier windows.
    output.append(reinterpret_cast<const char*>(window), room - stream.avail_out);
    if (rc == Z_NEED_DICT || rc == Z_DATA_ERROR || rc == Z_MEM_ERROR) {
      result = InflateResult::kError;
      break;
    }
    if (stream.avail_out != 0) break;  // inflate had nothing more to give
  }
  inflateEnd(&stream);
  if (result == InflateResult::kError && output.empty()) output = "err";
  return result;
}

void ExtractText(std::string_view data, ap::PdfHandler& sink) {
  bool inText = false;
  std::size_t start = 0;
  for (;;) {
    const std::size_t lf = data.find('\n', start);
    const std::string_view line = Trim(
        data.substr(start, lf == std::string_view::npos ? std::string_view::npos : lf - start));
    if (!inText) {
      inText = line.ends_with("BT");
    } else if (line.ends_with("TJ")) {
      SendShowArray(line, sink);
    } else if (line.ends_with("Tj")) {
      SendShowString(line, sink);
    } else if (line.ends_with("ET")) {
      inText = false;
    }
    if (lf == std::string_view::npos) return;
    start = lf + 1;
  }
}

void ExtractLinks(std::string_view data, ap::PdfHandler& sink) {
  constexpr std::string_view kUri = "/URI";
  std::size_t from = 0;
  for (;;) {
    const std::size_t at = data.find(kUri, from);
    if (at == std::string_view::npos) return;
    from = at + kUri.size();
    std::size_t i = from;
    while (i < data.size() && pdf::IsPdfWhiteSpace(static_cast<unsigned char>(data[i]))) ++i;
    if (i >= data.size()) return;
    if (data[i] != '(') continue;  // a reference or another value: search on
    const std::size_t close = data.find(')', i + 1);
    if (close == std::string_view::npos) return;
    const std::size_t length = std::min(close - i - 1, pdf::kMaxLinkLength);
    sink.link(std::string(data.substr(i + 1, length)));
    from = close + 1;
  }
}

void Simplifier::streamEnd() {
  if (isImage_) {
    buffer_.clear();
    return;
  }
  if (buffer_.size() >= kMaxStreamBytes && !streamCutTraced_) {
    streamCutTraced_ = true;
    AP_TRACE(ap::kSeverityWarning)
        << "pdf: stream longer than " << kMaxStreamBytes << " bytes, the rest was not read";
  }
  const std::size_t limit = std::min(kMaxInflatedBytes, kMaxInflatedBytesPerScan - inflatedTotal_);
  const InflateResult result = Decompress(buffer_, limit, inflated_);
  buffer_.clear();
  if (result == InflateResult::kLimit && !inflateCutTraced_) {
    inflateCutTraced_ = true;
    AP_TRACE(ap::kSeverityWarning) << "pdf: inflated stream cut at " << limit << " bytes";
  }
  // A placeholder text may be longer than a nearly spent budget.
  inflatedTotal_ += std::min(inflated_.size(), limit);
  ExtractText(inflated_, sink_);
  ExtractLinks(inflated_, sink_);
}

}  // namespace pdf_strs
