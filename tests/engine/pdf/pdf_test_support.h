// Shared by the PDF tests: event recorders, zlib compression and a small PDF writer.
#pragma once

#include <zlib.h>

#include <string>
#include <string_view>
#include <vector>

#include "engine/pdf/parser.h"
#include "engine/pdf/pdf_handler.h"

namespace pdf_test {

// The parser's events as text; the bytes of a stream are gathered into one "data:" entry.
class EventLog : public pdf::Parser::Handler {
 public:
  void objectBegin(std::uint32_t n, std::uint32_t g) override {
    events.push_back("obj " + std::to_string(n) + " " + std::to_string(g));
  }
  void objectEnd() override { events.push_back("endobj"); }
  void streamBegin(bool image) override {
    events.push_back(image ? "stream image" : "stream");
    data.clear();
  }
  void streamEnd() override {
    events.push_back("data:" + data);
    events.push_back("endstream");
  }
  void streamByte(char c) override { data.push_back(c); }
  void link(const std::string& target) override { events.push_back("link:" + target); }

  std::vector<std::string> events;
  std::string data;
};

class TextLog : public ap::PdfHandler {
 public:
  void text(const std::string& s) override { events.push_back("text:" + s); }
  void link(const std::string& u) override { events.push_back("link:" + u); }
  std::vector<std::string> events;
};

inline std::string Deflate(std::string_view data) {
  uLongf size = compressBound(data.size());
  std::string out(size, '\0');
  compress(reinterpret_cast<Bytef*>(out.data()), &size, reinterpret_cast<const Bytef*>(data.data()),
           data.size());
  out.resize(size);
  return out;
}

inline std::string Object(int number, std::string_view body) {
  return std::to_string(number) + " 0 obj\r\n" + std::string(body) + "\r\nendobj\r\n";
}

// A stream object whose dictionary holds `entries`.
inline std::string StreamObject(int number, std::string_view entries, std::string_view data) {
  return Object(number, "<< " + std::string(entries) + " /Length " + std::to_string(data.size()) +
                            " >>\r\nstream\r\n" + std::string(data) + "\r\nendstream");
}

inline std::string ContentObject(int number, std::string_view content) {
  return StreamObject(number, "/Filter /FlateDecode", Deflate(content));
}

}  // namespace pdf_test
