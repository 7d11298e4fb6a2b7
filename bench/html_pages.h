// Pages for the HTML benchmarks: a synthetic page of realistic markup, and the files below
// $PELMIX_BENCH_CORPUS when it is set.
#pragma once

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

namespace bench_pages {

// About 1 MB: a head with the usual meta, title, links, style and script, then rows of
// anchors, images, paragraphs with character references, and now and then a login form and
// a script that writes markup.
inline std::string SyntheticPage() {
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

// Every regular file below $PELMIX_BENCH_CORPUS; empty when it is not set.
inline std::vector<std::string> CorpusDocuments() {
  std::vector<std::string> documents;
  const char* dir = std::getenv("PELMIX_BENCH_CORPUS");
  if (dir == nullptr || *dir == '\0') return documents;
  std::error_code error;
  for (const auto& entry : std::filesystem::recursive_directory_iterator(dir, error)) {
    if (!entry.is_regular_file()) continue;
    std::ifstream in(entry.path(), std::ios::binary);
    documents.emplace_back(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
  }
  return documents;
}

// 2.3 MB of plain text, closed by a tag that flushes it.
inline std::string PlainText() {
  std::string text;
  while (text.size() < 2'300'000) text += "Plain words of a page, line after line.\n";
  return text + "<br>";
}

// 2.3 MB of ordinary meta refreshes with 1.1 KB targets.
inline std::string RefreshFlood() {
  std::string page;
  while (page.size() < 2'300'000) {
    page += "<meta http-equiv=\"refresh\" content=\"0; url=https://example.test/" +
            std::string(1100, 'p') + "\">\n";
  }
  return page;
}

// 50,000 short meta refreshes (2.2 MB).
inline std::string ShortRefreshFlood() {
  std::string flood;
  for (int i = 0; i < 50000; ++i) flood += "<meta http-equiv=refresh content='5;url=/a'>";
  return flood;
}

}  // namespace bench_pages
