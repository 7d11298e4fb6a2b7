#include "engine/kb/simple_solver.h"

#include <cmath>

#include "engine/common/error.h"
#include "engine/ml/deep_solver.h"

namespace loaders_misc {
namespace {

std::string ReadFlowFile(const std::string& entry, ap::FileSystemI& files) {
  const std::shared_ptr<ap::ReadableFileI> file = files.open(entry);
  if (file == nullptr) ap::ThrowError("Absent flow file " + entry);
  std::string text;
  char chunk[16 * 1024];
  for (;;) {
    const std::int64_t got = file->file_read(chunk, sizeof chunk);
    if (got < 0) ap::ThrowError("Failed to read flow file " + entry);
    if (got == 0) break;
    if (static_cast<std::uint64_t>(got) > kMaxFlowFileSize - text.size()) {
      ap::ThrowError("Flow file " + entry + " is larger than " + std::to_string(kMaxFlowFileSize) +
                     " bytes");
    }
    text.append(chunk, static_cast<std::size_t>(got));
  }
  return text;
}

std::unique_ptr<ml::DeepSolver> LoadModel(const std::string& entry,
                                          std::shared_ptr<ap::FileSystemI> files) {
  if (files == nullptr) ap::ThrowError("Absent flow file " + entry);
  const std::string text = ReadFlowFile(entry, *files);
  return std::make_unique<ml::DeepSolver>(text, std::move(files));
}

}  // namespace

SimpleSolver::SimpleSolver(const std::string& entry, std::shared_ptr<ap::FileSystemI> files)
    : model_(LoadModel(entry, std::move(files))) {}

SimpleSolver::SimpleSolver(const std::string& entry, std::shared_ptr<ap::FileSystemI> files,
                           std::size_t inputSize) {
  std::unique_ptr<ml::DeepSolver> model = LoadModel(entry, std::move(files));
  model->CheckInputSize(inputSize);
  model_ = std::move(model);
}

SimpleSolver::SimpleSolver(std::unique_ptr<WebCheckerV3Data::AbstractNetI> model)
    : model_(std::move(model)) {}

WebCheckerV3Data::Decision SimpleSolver::Solve(const std::vector<float>& features,
                                               const ap::ChannelConfig& thresholds) const {
  std::vector<float> outputs;
  model_->calc(features, outputs);
  WebCheckerV3Data::Decision decision;
  if (outputs.size() < 2) return decision;
  const float o0 = outputs[0];
  const float o1 = outputs[1];
  decision.detected = o0 > 0.5f;
  decision.weight = o0;
  // Distance to the corner the decision leans to, in single precision.
  const float a = decision.detected ? 1.0f - o0 : o0;
  const float b = decision.detected ? 1.0f - o1 : o1;
  const float distance = std::sqrt(a * a + b * b);
  if (distance > thresholds.threshold) {
    decision.detected = false;
  } else if (decision.detected) {
    decision.outside_loud = distance > thresholds.threshold_loud;
  }
  for (std::size_t i = 0; i < outputs.size(); ++i) {
    if (i != 0) decision.annotation += ' ';
    decision.annotation += RenderOutput(outputs[i]);
  }
  return decision;
}

std::string RenderOutput(float value) {
  const double v = value;
  if (std::isnan(v)) return "nan";
  if (v >= 0.99) return "1";
  if (v < 0.001) return "0";
  if (v < 0.01) return ".0";
  // Here 0.01 <= v < 0.99, so both digits are 0 to 9.
  const int tenths = static_cast<int>(v * 10);
  const int hundredths = static_cast<int>(v * 100) % 10;
  std::string text{'.', static_cast<char>('0' + tenths)};
  if (hundredths != 0) text += static_cast<char>('0' + hundredths);
  return text;
}

}  // namespace loaders_misc
