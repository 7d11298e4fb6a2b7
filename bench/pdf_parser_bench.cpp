// Throughput of the PDF scanner on a large generated file: the parser alone, and the whole
// scan with stream inflation and text and link extraction.
#include <benchmark/benchmark.h>
#include <zlib.h>

#include <random>
#include <string>

#include "engine/pdf/memory_file.h"
#include "engine/pdf/parser.h"
#include "engine/pdf/scan.h"
#include "tests/engine/pdf/pdf_test_support.h"

namespace {

std::string Object(int number, const std::string& body) {
  return std::to_string(number) + " 0 obj\r\n" + body + "\r\nendobj\r\n";
}

std::string Stream(int number, const std::string& entries, const std::string& data) {
  return Object(number, "<< " + entries + " /Length " + std::to_string(data.size()) +
                            " >>\r\nstream\r\n" + data + "\r\nendstream");
}

// About 18 MB: 400 pages, each with a compressed content stream of 60 text lines, an
// uncompressed 40 KB image, a compressed 8 KB font program and a link annotation, then a
// cross-reference table.
const std::string& LargePdf() {
  static const std::string pdf = [] {
    std::mt19937 random(42);
    std::string doc = "%PDF-1.7\n%\xE2\xE3\xCF\xD3\n";
    doc += Object(1, "<< /Type /Catalog /Pages 2 0 R >>");
    int number = 3;
    for (int page = 0; page < 400; ++page) {
      std::string content = "q 1 0 0 1 0 0 cm\nBT\n/F1 11 Tf\n";
      for (int line = 0; line < 60; ++line) {
        content += "72 " + std::to_string(720 - line * 11) + " Td\n[(Line " + std::to_string(line) +
                   " of page " + std::to_string(page) +
                   ": please verify your account) -250 (at once)] TJ\n";
      }
      content += "ET\nQ\n";
      std::string image(40 * 1024, '\0');
      for (char& c : image) c = static_cast<char>(random());
      std::string font(8 * 1024, '\0');
      for (char& c : font) c = static_cast<char>('a' + random() % 8);
      const int first = number;
      doc +=
          Object(number++, "<< /Type /Page /Parent 2 0 R /Contents " + std::to_string(first + 1) +
                               " 0 R /Annots [" + std::to_string(first + 4) + " 0 R] >>");
      doc += Stream(number++, "/Filter /FlateDecode", pdf_test::Deflate(content));
      doc += Stream(number++, "/Type /XObject /Subtype /Image /Width 128 /Height 320", image);
      doc += Stream(number++, "/Filter /FlateDecode", pdf_test::Deflate(font));
      doc += Object(number++, "<< /Type /Annot /Subtype /Link /A << /S /URI /URI (http://p" +
                                  std::to_string(page) + ".example/login) >> >>");
    }
    doc += "xref\n0 " + std::to_string(number) + "\n0000000000 65535 f \n";
    for (int i = 1; i < number; ++i) doc += "0000012345 00000 n \n";
    return doc + "trailer\n<< /Size " + std::to_string(number) +
           " /Root 1 0 R >>\nstartxref\n12345\n%%EOF\n";
  }();
  return pdf;
}

class CountingHandler : public pdf::Parser::Handler {
 public:
  void objectBegin(std::uint32_t, std::uint32_t) override { ++events; }
  void objectEnd() override { ++events; }
  void streamBegin(bool) override { ++events; }
  void streamEnd() override { ++events; }
  void streamByte(char) override { ++bytes; }
  void link(const std::string&) override { ++events; }
  std::size_t events = 0;
  std::size_t bytes = 0;
};

class CountingSink : public ap::PdfHandler {
 public:
  void text(const std::string&) override { ++texts; }
  void link(const std::string&) override { ++links; }
  std::size_t texts = 0;
  std::size_t links = 0;
};

void BM_PdfParser(benchmark::State& state) {
  const std::string& pdf = LargePdf();
  for (auto _ : state) {
    CountingHandler handler;
    pdf::Parser parser(handler);
    pdf::MemoryFile file(pdf);
    pdf::FeedFile(file, parser);
    benchmark::DoNotOptimize(handler.events + handler.bytes);
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * pdf.size()));
  state.counters["file_bytes"] = static_cast<double>(pdf.size());
}
BENCHMARK(BM_PdfParser)->Unit(benchmark::kMillisecond);

void BM_PdfScan(benchmark::State& state) {
  const std::string& pdf = LargePdf();
  CountingSink sink;
  for (auto _ : state) {
    sink = CountingSink();
    pdf::MemoryFile file(pdf);
    pdf::Scan(file, sink);
  }
  state.counters["texts"] = static_cast<double>(sink.texts);
  state.counters["links"] = static_cast<double>(sink.links);
  state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * pdf.size()));
}
BENCHMARK(BM_PdfScan)->Unit(benchmark::kMillisecond);

}  // namespace
