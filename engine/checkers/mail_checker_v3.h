// The mail checker: one message, handed over part by part. Text and HTML parts and the
// text of PDF attachments go to one page feature extractor built without a URL; links (the
// ones the host found, those of PDF attachments, and the first anchors of the HTML parts)
// are gathered into a fixed block of link features beside it. The mail decision model judges
// the page features and that block; links the knowledge base lists as known phishing make
// the message phishing whatever the model says.
// One checker serves one session: its operations must not run concurrently.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "engine/checkers/cached_white_domains.h"
#include "engine/checkers/decision.h"
#include "engine/checkers/mail_checker_i.h"
#include "engine/features/html_features.h"
#include "engine/kb/web_checker_v3_data.h"
#include "engine/pdf/pdf_handler.h"

namespace easy3_impl {

// Text and HTML parts are read in pieces of this size.
inline constexpr std::size_t kMailPieceSize = 10000;
// URL feature values kept from AddUrl (eight links of ten values).
inline constexpr std::size_t kMaxUrlValues = 80;

class MailCheckerV3 final : public ap::easy2::MailCheckerI {
 public:
  explicit MailCheckerV3(std::shared_ptr<const WebCheckerV3Data> data,
                         FileTimeClock clock = SystemFileTime);
  ~MailCheckerV3() override;

  void GetVerdict(ap::easy2::EngineVerdict& out) override;
  void AddText(const char* data, std::size_t length) override;
  void AddText(std::shared_ptr<ap::ReadableFileI> stream) override;
  void SetSubject(const std::string& subject) override;
  bool AddUrl(const std::string& url) override;
  void SetParameter(const std::string& name, const std::string& value) override;
  void AddImage(std::shared_ptr<ap::logo::ImageDataProviderI> image) override;
  void AddAttachment(const std::string& name, const std::string& contentType, const char* data,
                     std::size_t length) override;
  void AddAttachment(const std::string& name, const std::string& contentType,
                     std::shared_ptr<ap::ReadableFileI> stream) override;
  void AddLogo(int value, std::shared_ptr<ap::logo::ImageDataProviderI> image) override;
  bool LastFeatures(std::vector<float>& vector) const override;
  // Tells `observer` every lexeme and phrase the message's text matches (see
  // HTMLFeatures::setLexemeObserver); for tools, not for the sessions.
  void SetLexemeObserver(html_features::LexemeObserverI* observer) {
    features_.setLexemeObserver(observer);
  }

  // The link callback of the feature extractor.
  class MailFeatures final : public ap::HTMLFeatures::TagAFeaturesI {
   public:
    bool operator()(const std::vector<float>& values) override;

    std::vector<float> bodyLinks{0.0f};  // [0]: the dangerous-attachment feature
    std::uint32_t bodyLinkCount = 0;
    std::vector<float> urls;
    bool nextIsUrl = false;
  };

  // Hands what a PDF attachment shows to the checker.
  class PdfProxyToThis final : public ap::PdfHandler {
   public:
    explicit PdfProxyToThis(MailCheckerV3& checker) : checker_(checker) {}
    void text(const std::string& s) override;
    void link(const std::string& u) override;

   private:
    MailCheckerV3& checker_;
  };

 private:
  void AddHtml(ap::ReadableFileI& stream);
  void AddPlainText(ap::ReadableFileI& stream);
  void CountText(std::size_t length);

  std::shared_ptr<const WebCheckerV3Data> data_;
  CachedWhiteDomains whiteDomains_;
  MailFeatures mailFeatures_;
  ap::HTMLFeatures features_;
  std::uint32_t bytes_ = 0;
  bool categorised_ = false;  // a link is a known phishing address
  FileTimeClock clock_;
  std::vector<float> lastFeatures_;
  bool judged_ = false;
};

// Whether an attachment's name marks an executable: ".exe", ".com", ".iso", ".msi" or ".dat"
// as its last four bytes, in any letter case.
bool IsDangerousAttachmentName(const std::string& name);

}  // namespace easy3_impl
