#include "engine/checkers/web_checker_v3.h"

#include <vector>

#include "engine/features/feature_layout.h"
#include "engine/kb/kb_loader.h"

namespace easy3_impl {

// The loader refuses models that read past these; they must be what the extractor makes.
static_assert(loaders_misc::kWebVectorSize == html_features::kWebVectorSize);
static_assert(loaders_misc::kMailVectorSize == html_features::kMailVectorSize);

WebCheckerV3::WebCheckerV3(std::shared_ptr<const WebCheckerV3Data> data, const std::string& url,
                           FileTimeClock clock)
    : data_(std::move(data)),
      whiteDomains_(*data_->whiteDomains, data_->shareLinks, data_->categorisedHosts),
      features_(url, whiteDomains_, data_->lexemes),
      pipeline_(features_, false),
      clock_(clock) {}

WebCheckerV3::~WebCheckerV3() = default;

void WebCheckerV3::SetParameter(const std::string&, const std::string&) {}

void WebCheckerV3::AppendData(const char* data, std::size_t length) {
  if (features_.trusted()) return;
  pipeline_.feed(data, length);
}

void WebCheckerV3::AppendStream(std::shared_ptr<ap::ReadableFileI> stream) {
  std::vector<char> piece(kStreamPieceSize);
  for (;;) {
    const std::int64_t got = stream->file_read(piece.data(), piece.size());
    if (got <= 0) break;
    AppendData(piece.data(), static_cast<std::size_t>(got));
  }
  stream.reset();
}

void WebCheckerV3::SetExtHandler(ExtHandlerI*) {}

bool WebCheckerV3::LastFeatures(std::vector<float>& vector) const {
  vector = lastFeatures_;
  return judged_;
}

void WebCheckerV3::GetFeatures(std::string& target, std::vector<float>& vector) {
  features_.GetVector(target, vector, pipeline_.byteCount());
  lastFeatures_ = vector;
  judged_ = true;
}

void WebCheckerV3::GetVerdict(ap::easy2::EngineVerdict& out) {
  const ap::EngineConfig& config = data_->config;
  judged_ = false;
  const FeatureSource source = [this](std::string& target, std::vector<float>& vector) {
    GetFeatures(target, vector);
  };

  // Pages the knowledge base lists as known phishing are blocked whatever the model says,
  // even on a white domain.
  if (features_.pageCategorised()) {
    ap::easy2::EngineVerdict verdict;
    verdict.stampWords = {0, config.dbstamp, 0, 0};
    if (!features_.trusted()) {
      std::vector<float> vector;
      GetFeatures(verdict.target, vector);
    }
    verdict.quiet = false;
    verdict.phishing = true;
    verdict.weight = 1.0f;
    verdict.target += "|c";
    out = std::move(verdict);
    return;
  }

  ap::easy2::EngineVerdict verdict = Decide({.channel = config.web,
                                             .solver = data_->webSolver.get(),
                                             .dbstamp = config.dbstamp,
                                             .trusted = features_.trusted(),
                                             .features = source});
  if (!features_.trusted()) {
    if (pipeline_.jsonAccepted()) {
      verdict.quiet = true;
      verdict.target += "|j";
    } else if (LoudDrawSaysQuiet(config.web, pipeline_.byteCount(), clock_)) {
      verdict.quiet = true;
    }
  }
  out = std::move(verdict);
}

}  // namespace easy3_impl
