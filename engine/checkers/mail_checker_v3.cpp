#include "engine/checkers/mail_checker_v3.h"

#include <algorithm>
#include <cctype>

#include "engine/features/feature_layout.h"
#include "engine/html/decrunch.h"
#include "engine/kb/readable_buffer.h"
#include "engine/pdf/scan.h"

namespace easy3_impl {
namespace {

bool EndsWith(const std::string& s, std::string_view end) {
  return s.size() >= end.size() && std::string_view(s).substr(s.size() - end.size()) == end;
}

// Reads up to `size` bytes; a negative count, or a stream claiming more than it was asked
// for, ends the part like its end would.
std::size_t ReadPiece(ap::ReadableFileI& stream, char* buffer, std::size_t size) {
  const std::int64_t got = stream.file_read(buffer, size);
  if (got <= 0 || static_cast<std::uint64_t>(got) > size) return 0;
  return static_cast<std::size_t>(got);
}

// Byte buffers above 4 GiB cannot be wrapped whole: they are handed over in parts.
constexpr std::size_t kMaxWrapped = 0xFFFFFFFFu;

}  // namespace

bool IsDangerousAttachmentName(const std::string& name) {
  if (name.size() < 4 || name[name.size() - 4] != '.') return false;
  std::string ext = name.substr(name.size() - 3);
  for (char& c : ext) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return ext == "exe" || ext == "com" || ext == "iso" || ext == "msi" || ext == "dat";
}

bool MailCheckerV3::MailFeatures::operator()(const std::vector<float>& values) {
  if (nextIsUrl) {
    urls.insert(urls.end(), values.begin(), values.end());
    nextIsUrl = false;
    return false;
  }
  ++bodyLinkCount;
  bodyLinks.insert(bodyLinks.end(), values.begin(), values.end());
  return bodyLinkCount < 2;
}

void MailCheckerV3::PdfProxyToThis::text(const std::string& s) {
  checker_.features_.text(s.data(), s.size());
  checker_.CountText(s.size());
}

void MailCheckerV3::PdfProxyToThis::link(const std::string& u) {
  checker_.features_.url(u, static_cast<html::UrlKind>(11));
  checker_.AddUrl(u);
}

MailCheckerV3::MailCheckerV3(std::shared_ptr<const WebCheckerV3Data> data, FileTimeClock clock)
    : data_(std::move(data)),
      // Share links so that content anyone can publish is never white; categorised hosts so
      // that known phishing links are recognised.
      whiteDomains_(*data_->whiteDomains, data_->shareLinks, data_->categorisedHosts),
      features_(std::string(), whiteDomains_, data_->lexemes, &mailFeatures_),
      clock_(clock) {}

MailCheckerV3::~MailCheckerV3() = default;

void MailCheckerV3::CountText(std::size_t length) { bytes_ = html::addByteCount(bytes_, length); }

void MailCheckerV3::AddText(const char* data, std::size_t length) {
  while (length > 0) {
    const std::size_t part = std::min(length, kMaxWrapped);
    AddText(std::make_shared<util::ReadableBuffer>(data, static_cast<std::uint32_t>(part)));
    data += part;
    length -= part;
  }
}

void MailCheckerV3::AddText(std::shared_ptr<ap::ReadableFileI> stream) {
  // The first byte that is not a blank or a control decides: '<' starts HTML.
  char c = 0;
  for (;;) {
    if (ReadPiece(*stream, &c, 1) != 1) return;
    if (static_cast<unsigned char>(c) < 1 || static_cast<unsigned char>(c) > 32) break;
  }
  if (stream->file_seek(0) != 0) return;
  if (c == '<') {
    AddHtml(*stream);
  } else {
    AddPlainText(*stream);
  }
}

void MailCheckerV3::AddHtml(ap::ReadableFileI& stream) {
  html::Decrunch pipeline(features_, false);
  std::vector<char> piece(kMailPieceSize);
  while (const std::size_t got = ReadPiece(stream, piece.data(), piece.size())) {
    pipeline.feed(piece.data(), got);
    CountText(got);
  }
}

void MailCheckerV3::AddPlainText(ap::ReadableFileI& stream) {
  std::vector<char> piece(kMailPieceSize);
  while (const std::size_t got = ReadPiece(stream, piece.data(), piece.size())) {
    features_.text(piece.data(), got);
    CountText(got);
  }
}

void MailCheckerV3::SetSubject(const std::string& subject) {
  if (auto* title = features_.titleSink()) {
    title->text(subject.data(), subject.size());
    title->end();
  }
}

bool MailCheckerV3::AddUrl(const std::string& url) {
  if (features_.categorised(url)) categorised_ = true;
  if (mailFeatures_.urls.size() >= kMaxUrlValues) return true;
  mailFeatures_.nextIsUrl = true;
  const bool white = features_.analyseLink(url);
  mailFeatures_.nextIsUrl = false;
  return white;
}

void MailCheckerV3::SetParameter(const std::string&, const std::string&) {}
void MailCheckerV3::AddImage(std::shared_ptr<ap::logo::ImageDataProviderI>) {}
void MailCheckerV3::AddLogo(int, std::shared_ptr<ap::logo::ImageDataProviderI>) {}

void MailCheckerV3::AddAttachment(const std::string& name, const std::string& contentType,
                                  const char* data, std::size_t length) {
  if (length == 0) {
    if (IsDangerousAttachmentName(name)) mailFeatures_.bodyLinks[0] = 1.0f;
    return;
  }
  const std::size_t part = std::min(length, kMaxWrapped);
  AddAttachment(name, contentType,
                std::make_shared<util::ReadableBuffer>(data, static_cast<std::uint32_t>(part)));
}

void MailCheckerV3::AddAttachment(const std::string& name, const std::string& contentType,
                                  std::shared_ptr<ap::ReadableFileI> stream) {
  if (IsDangerousAttachmentName(name)) mailFeatures_.bodyLinks[0] = 1.0f;
  if (EndsWith(contentType, "/pdf") || EndsWith(name, ".pdf")) {
    PdfProxyToThis proxy(*this);
    pdf::Scan(*stream, proxy);
  } else if (contentType.rfind("image/", 0) == 0) {
    // images are not read
  } else if (contentType == "text/html") {
    AddHtml(*stream);
  } else if (contentType.rfind("text/", 0) == 0) {
    AddText(std::move(stream));
  }
}

bool MailCheckerV3::LastFeatures(std::vector<float>& vector) const {
  vector = lastFeatures_;
  return judged_;
}

void MailCheckerV3::GetVerdict(ap::easy2::EngineVerdict& out) {
  std::vector<float>& block = mailFeatures_.bodyLinks;
  if (block.size() < html_features::kMailLinkBlockSize) {
    block.insert(block.end(), mailFeatures_.urls.begin(), mailFeatures_.urls.end());
    block.resize(html_features::kMailLinkBlockSize, 0.0f);
  }
  const ap::EngineConfig& config = data_->config;
  judged_ = false;
  const FeatureSource source = [this, &block](std::string& target, std::vector<float>& vector) {
    features_.GetVector(target, vector, bytes_);
    lastFeatures_ = vector;
    lastFeatures_.insert(lastFeatures_.end(), block.begin(), block.end());
    judged_ = true;
  };
  ap::easy2::EngineVerdict verdict = Decide({.channel = config.mail,
                                             .solver = data_->mailSolver.get(),
                                             .dbstamp = config.dbstamp,
                                             .trusted = false,
                                             .features = source,
                                             .extra = &block});
  if (categorised_) {
    // A link the knowledge base lists as known phishing decides the message.
    verdict.quiet = false;
    verdict.phishing = true;
    verdict.weight = 1.0f;
    verdict.target += "|c";
  } else if (LoudDrawSaysQuiet(config.mail, bytes_, clock_)) {
    verdict.quiet = true;
  }
  out = std::move(verdict);
}

}  // namespace easy3_impl
