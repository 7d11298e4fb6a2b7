// The decision step: runs a decision model on a feature vector and reduces its first two
// outputs to a detection against two radii, rendering every output as a short annotation.
#pragma once

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

#include "engine/common/file_interfaces.h"
#include "engine/kb/web_checker_v3_data.h"

namespace loaders_misc {

// A flow file is read whole into memory; real ones are a few kilobytes.
inline constexpr std::size_t kMaxFlowFileSize = std::size_t{1} << 20;

class SimpleSolver final : public WebCheckerV3Data::Solver {
 public:
  // Builds the deep solver from the flow file `entry` of `files`; the conversions' sources
  // are opened from `files` too. A missing, empty, unreadable or oversized entry raises
  // ap::Error; the solver's own faults propagate. With `inputSize`, a flow that reads
  // features past it is refused now, with the message its calc would give.
  SimpleSolver(const std::string& entry, std::shared_ptr<ap::FileSystemI> files);
  SimpleSolver(const std::string& entry, std::shared_ptr<ap::FileSystemI> files,
               std::size_t inputSize);
  // Decides with a model built elsewhere.
  explicit SimpleSolver(std::unique_ptr<WebCheckerV3Data::AbstractNetI> model);

  // detected: o0 > 0.5 and (o0, o1) within `threshold` of (1, 1); outside_loud: detected and
  // farther than `threshold_loud` from it. Fewer than two outputs decide nothing.
  WebCheckerV3Data::Decision Solve(const std::vector<float>& features,
                                   const ap::ChannelConfig& thresholds) const override;

  const WebCheckerV3Data::AbstractNetI& model() const { return *model_; }

 private:
  std::unique_ptr<WebCheckerV3Data::AbstractNetI> model_;
};

// One output as the annotation shows it: "1" from 0.99 up, "0" below 0.001, ".0" below 0.01,
// else "." and the first one or two decimals (truncated; a second 0 is left out). NaN shows
// as "nan".
std::string RenderOutput(float value);

}  // namespace loaders_misc
