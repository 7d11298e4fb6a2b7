// Throughput of the HTML tokenizer, in bytes per second, over a synthetic page of realistic
// markup and, when PELMIX_BENCH_CORPUS names a directory, over every file below it.
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <string_view>
#include <vector>

#include "engine/html/tokenizer.h"

namespace {

// Wants what a page analyser wants: a few URL attributes collected, image text streamed,
// script text delivered, everything else skipped.
class AnalyserLikeHandler {
 public:
  struct Sink {
    void text(const char*, std::size_t n) { bytes += n; }
    void end() {}
    std::size_t bytes = 0;
  };

  void text(const char*, std::size_t n) { textBytes += n; }
  bool openElement(std::string_view name) {
    ++elements;
    return name == "a" || name == "img" || name == "input" || name == "form" || name == "link" ||
           name == "meta" || name == "script" || name == "iframe";
  }
  bool startTagEnd() { return true; }
  void closeElement(std::string_view) {}
  int attributeName(std::string_view name) {
    if (name == "href" || name == "src" || name == "action" || name == "content") {
      return html::kAttrCollect;
    }
    if (name == "alt" || name == "placeholder") return html::kAttrStream;
    return html::kAttrSkip;
  }
  void attributeValue(std::string_view value) { valueBytes += value.size(); }
  void attributeChar(char) { ++valueBytes; }
  Sink* commentSink() { return &comments; }
  void scriptText(const char*, std::size_t n) { scriptBytes += n; }

  std::size_t elements = 0;
  std::size_t textBytes = 0;
  std::size_t valueBytes = 0;
  std::size_t scriptBytes = 0;
  Sink comments;
};

std::string SyntheticPage() {
  std::string page =
      "<!DOCTYPE html>\n<html lang=\"en\"><head><meta charset=\"utf-8\">"
      "<meta name=\"description\" content=\"Online banking: sign in to your account\">"
      "<title>Sign in - Example Bank</title>"
      "<link rel=\"stylesheet\" href=\"/static/css/main.css?v=12\">"
      "<link rel=\"shortcut icon\" href=\"/favicon.ico\">"
      "<style>body{font-family:Arial,sans-serif;margin:0}.nav a{color:#036}</style>"
      "<script>window.dataLayer=window.dataLayer||[];function gtag(){dataLayer.push(arguments)}"
      "gtag('js',new Date());gtag('config','UA-000000-1');</script></head>\n<body class=main>";
  for (int i = 0; page.size() < 1'000'000; ++i) {
    const std::string n = std::to_string(i);
    page += "<div class=\"row item-" + n + "\" id=\"r" + n + "\" data-track='{\"pos\":" + n +
            "}'>\n  <!-- item " + n +
            " -->\n  <a href=\"https://www.example.com/products/item?id=" + n +
            "&amp;ref=home\" class=\"nav link\" target=_blank>Product number " + n +
            " &ndash; see the details</a>\n  <img src=\"/img/p" + n +
            ".jpg\" alt=\"Picture of product " + n +
            "\" width=120 height=90 />\n  <p>Lorem ipsum dolor sit amet, consectetur adipiscing "
            "elit, sed do eiusmod tempor incididunt ut labore et dolore magna aliqua. Ut enim "
            "ad minim veniam, quis nostrud exercitation.<br>Price: &euro;" +
            n + ".99</p>\n";
    if (i % 10 == 0) {
      page +=
          "<form action=\"/login.php\" method=post><input type=text name=user "
          "placeholder=\"Your e-mail\"><input type=password name=pass>"
          "<input type=submit value=\"Sign in\"></form>\n"
          "<script type=\"text/javascript\">var url = \"https://cdn.example.net/t.js?i=" +
          n +
          "\"; if (a < b && c > d) { document.write('<img src=\"' + url + '\">'); }"
          "</script>\n";
    }
    page += "</div>\n";
  }
  return page + "</body></html>\n";
}

constexpr std::size_t kChunk = 4096;  // the size the web session hands over

void TokenizeDocuments(benchmark::State& state, const std::vector<std::string>& documents) {
  std::size_t bytes = 0;
  for (auto _ : state) {
    for (const std::string& doc : documents) {
      AnalyserLikeHandler handler;
      html::FastParserMachine<char, AnalyserLikeHandler> tokenizer(handler);
      for (std::size_t at = 0; at < doc.size(); at += kChunk) {
        tokenizer.feed(doc.data() + at, std::min(kChunk, doc.size() - at));
      }
      benchmark::DoNotOptimize(handler.elements);
      bytes += doc.size();
    }
  }
  state.SetBytesProcessed(static_cast<std::int64_t>(bytes));
}

void BM_TokenizeSyntheticPage(benchmark::State& state) {
  static const std::vector<std::string> page = {SyntheticPage()};
  state.counters["page_bytes"] = static_cast<double>(page[0].size());
  TokenizeDocuments(state, page);
}
BENCHMARK(BM_TokenizeSyntheticPage);

// Every regular file below $PELMIX_BENCH_CORPUS, each through a fresh tokenizer.
bool RegisterCorpus() {
  const char* dir = std::getenv("PELMIX_BENCH_CORPUS");
  if (dir == nullptr || *dir == '\0') return false;
  std::vector<std::string> documents;
  std::error_code error;
  for (const auto& entry : std::filesystem::recursive_directory_iterator(dir, error)) {
    if (!entry.is_regular_file()) continue;
    std::ifstream in(entry.path(), std::ios::binary);
    documents.emplace_back(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
  }
  if (documents.empty()) return false;
  benchmark::RegisterBenchmark("BM_TokenizeCorpus", [documents](benchmark::State& state) {
    state.counters["files"] = static_cast<double>(documents.size());
    TokenizeDocuments(state, documents);
  });
  return true;
}
[[maybe_unused]] const bool corpusRegistered = RegisterCorpus();

}  // namespace
