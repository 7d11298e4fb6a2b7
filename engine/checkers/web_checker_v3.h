// The web checker: one page, fed in chunks. Unless the page URL is trusted, every chunk runs
// through the decrunch pipeline into the page feature extractor; the verdict comes from the
// web decision model, the JSON rule and the loud draw, except for pages the knowledge base
// lists as known phishing (categorised), which are phishing whatever the model says.
// One checker serves one session: its operations must not run concurrently.
#pragma once

#include <cstddef>
#include <memory>
#include <string>

#include "engine/checkers/cached_white_domains.h"
#include "engine/checkers/decision.h"
#include "engine/checkers/web_checker_i.h"
#include "engine/features/html_features.h"
#include "engine/html/decrunch.h"
#include "engine/kb/web_checker_v3_data.h"

namespace easy3_impl {

// AppendStream reads the stream in pieces of this size.
inline constexpr std::size_t kStreamPieceSize = 10000;

class WebCheckerV3 final : public ap::easy2::WebCheckerI {
 public:
  WebCheckerV3(std::shared_ptr<const WebCheckerV3Data> data, const std::string& url,
               FileTimeClock clock = SystemFileTime);
  ~WebCheckerV3() override;

  void GetVerdict(ap::easy2::EngineVerdict& out) override;
  void SetParameter(const std::string& name, const std::string& value) override;
  void AppendData(const char* data, std::size_t length) override;
  void AppendStream(std::shared_ptr<ap::ReadableFileI> stream) override;
  // Accepted and never called: this checker asks for no external data.
  void SetExtHandler(ExtHandlerI* handler) override;
  bool LastFeatures(std::vector<float>& vector) const override;

 private:
  void GetFeatures(std::string& target, std::vector<float>& vector);

  // Destroyed in reverse: the pipeline first, then the extractor, then the cache.
  std::shared_ptr<const WebCheckerV3Data> data_;
  CachedWhiteDomains whiteDomains_;
  ap::HTMLFeatures features_;
  html::Decrunch pipeline_;
  FileTimeClock clock_;
  std::vector<float> lastFeatures_;
  bool judged_ = false;
};

}  // namespace easy3_impl
