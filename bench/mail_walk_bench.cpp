// Throughput of the mail host's MIME walk (GMime parsing, decoding, charset conversion, link
// finding) on a typical commercial message, on the hand-made test corpus, and of the mbox
// splitter alone.
#include <benchmark/benchmark.h>

#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "tools/mail/message_splitter.h"
#include "tools/mail/message_walk.h"

namespace {

class CountingSink final : public pelmix::mail::MessageSink {
 public:
  void Subject(std::string_view s, int) override { bytes += s.size(); }
  void Text(std::string_view d, const pelmix::mail::PartInfo&) override { bytes += d.size(); }
  void Image(std::string_view d, const pelmix::mail::PartInfo&) override { bytes += d.size(); }
  void Attachment(std::string_view, std::string_view d, const pelmix::mail::PartInfo&) override {
    bytes += d.size();
  }
  void Url(std::string_view u) override { bytes += u.size(); }
  std::size_t bytes = 0;
};

std::string Base64(const std::string& in) {
  static constexpr char kAlphabet[] =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::string out;
  std::size_t line = 0;
  for (std::size_t i = 0; i < in.size(); i += 3) {
    std::uint32_t v = static_cast<std::uint8_t>(in[i]) << 16;
    if (i + 1 < in.size()) v |= static_cast<std::uint8_t>(in[i + 1]) << 8;
    if (i + 2 < in.size()) v |= static_cast<std::uint8_t>(in[i + 2]);
    out += kAlphabet[v >> 18];
    out += kAlphabet[(v >> 12) & 63];
    out += i + 1 < in.size() ? kAlphabet[(v >> 6) & 63] : '=';
    out += i + 2 < in.size() ? kAlphabet[v & 63] : '=';
    if ((line += 4) == 76) {
      out += "\r\n";
      line = 0;
    }
  }
  return out + "\r\n";
}

// About 48 KB: a newsletter with plain and HTML alternatives (Latin-1, quoted-printable), an
// inline logo and a small PDF attachment, the shape of most bulk mail.
const std::string& Newsletter() {
  static const std::string message = [] {
    std::string plain, html;
    for (int i = 0; i < 60; ++i) {
      plain += "Offre sp=E9ciale " + std::to_string(i) + ": voir https://shop.example/item/" +
               std::to_string(i) + " et www.shop.example/promo=\r\n" + std::to_string(i) + "\r\n";
      html += "<tr><td class=3D\"item\"><a href=3D\"https://shop.example/item/" +
              std::to_string(i) + "\">Offre sp=E9ciale " + std::to_string(i) +
              "</a></td><td>19,99 =80</td></tr>\r\n";
    }
    std::string logo(6000, '\0');
    for (std::size_t i = 0; i < logo.size(); ++i) logo[i] = static_cast<char>(i * 131);
    std::string pdf = "%PDF-1.4\n";
    while (pdf.size() < 20000) pdf += "1 0 obj << /Type /Page >> endobj\n";
    return "From: news@shop.example\r\nTo: you@example.org\r\n"
           "Subject: =?ISO-8859-1?Q?Offres_sp=E9ciales?=\r\nMIME-Version: 1.0\r\n"
           "Content-Type: multipart/mixed; boundary=\"m\"\r\n\r\n--m\r\n"
           "Content-Type: multipart/related; boundary=\"r\"\r\n\r\n--r\r\n"
           "Content-Type: multipart/alternative; boundary=\"a\"\r\n\r\n--a\r\n"
           "Content-Type: text/plain; charset=ISO-8859-1\r\n"
           "Content-Transfer-Encoding: quoted-printable\r\n\r\n" +
           plain +
           "\r\n--a\r\nContent-Type: text/html; charset=windows-1252\r\n"
           "Content-Transfer-Encoding: quoted-printable\r\n\r\n<html><body><table>\r\n" +
           html +
           "</table></body></html>\r\n--a--\r\n\r\n--r\r\nContent-Type: image/png\r\n"
           "Content-Transfer-Encoding: base64\r\nContent-ID: <logo>\r\n\r\n" +
           Base64(logo) +
           "--r--\r\n\r\n--m\r\nContent-Type: application/pdf; name=\"terms.pdf\"\r\n"
           "Content-Disposition: attachment; filename=\"terms.pdf\"\r\n"
           "Content-Transfer-Encoding: base64\r\n\r\n" +
           Base64(pdf) + "--m--\r\n";
  }();
  return message;
}

void BM_WalkNewsletter(benchmark::State& state) {
  const std::string& message = Newsletter();
  pelmix::mail::MessageBuffer buffer;
  buffer.Append(message);
  pelmix::mail::WalkReport report;
  std::size_t handed = 0;
  for (auto _ : state) {
    CountingSink sink;
    report = pelmix::mail::WalkMessage(buffer, sink);
    handed = sink.bytes;
    benchmark::DoNotOptimize(handed);
  }
  // What one walk found, so that a broken message shows in the figures.
  state.counters["parts"] = static_cast<double>(report.parts);
  state.counters["links"] = static_cast<double>(report.links);
  state.counters["handed"] = static_cast<double>(handed);
  state.SetItemsProcessed(state.iterations());
  state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(message.size()));
}
BENCHMARK(BM_WalkNewsletter);

void BM_WalkTestCorpus(benchmark::State& state) {
  std::vector<std::string> messages;
  for (const auto& entry :
       std::filesystem::directory_iterator(PELMIX_SOURCE_DIR "/tests/data/mail")) {
    std::ifstream in(entry.path(), std::ios::binary);
    std::ostringstream bytes;
    bytes << in.rdbuf();
    messages.push_back(bytes.str());
  }
  std::int64_t total = 0;
  for (auto _ : state) {
    for (const std::string& message : messages) {
      CountingSink sink;
      benchmark::DoNotOptimize(pelmix::mail::WalkMessage(message, sink).parts);
      total += static_cast<std::int64_t>(message.size());
    }
  }
  state.SetItemsProcessed(state.iterations() * static_cast<std::int64_t>(messages.size()));
  state.SetBytesProcessed(total);
}
BENCHMARK(BM_WalkTestCorpus);

void BM_SplitMbox(benchmark::State& state) {
  std::string mbox;
  while (mbox.size() < (8u << 20)) mbox += "From news@shop.example Sun Dec  6\r\n" + Newsletter();
  std::size_t messages = 0;
  for (auto _ : state) {
    pelmix::mail::MessageSplitter splitter(pelmix::mail::MessageSplitter::Mode::kMbox,
                                           [&](pelmix::mail::MessageBuffer&) { ++messages; });
    for (std::size_t at = 0; at < mbox.size(); at += 65536) {
      splitter.Feed(std::string_view(mbox).substr(at, 65536));
    }
    splitter.Finish();
  }
  benchmark::DoNotOptimize(messages);
  state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(mbox.size()));
}
BENCHMARK(BM_SplitMbox);

}  // namespace
