// The conversions a flow can run: each maps the concatenated inputs of one flow to an output
// vector that it sizes itself. All are immutable once built, so calc may run on many threads.
#pragma once

#include <cstdint>
#include <memory>
#include <utility>
#include <vector>

#include "engine/common/file_interfaces.h"
#include "engine/ml/simple_perceptron.h"

namespace ml {

class ConversionI {
 public:
  virtual void calc(const std::vector<float>& input, std::vector<float>& output) const = 0;
  virtual ~ConversionI() = default;
};

// Soft one-hot encoding of each input element against its own ascending levels.
//
// Rules file: whitespace-separated items; per rule a count n, then n levels read with the
// float reader. "1 0" is an empty rule (that input element is dropped). The file must end
// right after its last level. Levels must be finite, the first above 0 and each above the
// one before: anything else would divide by zero when encoding.
class VectorRules {
 public:
  // Reads a rules file; faults raise ap::Error (float reader faults as that reader raises
  // them). A null source is refused too.
  explicit VectorRules(std::shared_ptr<ap::ReadableFileI> source);

  // Needs one input element per rule; `output` gets output_size() elements.
  void calc(const std::vector<float>& input, std::vector<float>& output) const;

  std::uint32_t output_size() const { return outputSize_; }
  std::size_t rule_count() const { return rules_.size(); }

 private:
  std::vector<double> levels_;
  std::vector<std::pair<std::uint32_t, std::uint32_t>> rules_;  // [begin, end) in levels_
  std::uint32_t outputSize_ = 0;
};

namespace flow {

// Values above one half move towards 1 (square root), the others towards 0 (square).
class SqrtBoost final : public ConversionI {
 public:
  void calc(const std::vector<float>& input, std::vector<float>& output) const override;
};

class RulesConv final : public ConversionI {
 public:
  explicit RulesConv(std::shared_ptr<ap::ReadableFileI> source) : rules_(std::move(source)) {}
  void calc(const std::vector<float>& input, std::vector<float>& output) const override {
    rules_.calc(input, output);
  }

 private:
  VectorRules rules_;
};

class NeuroConv final : public ConversionI {
 public:
  // Reads a network file (simple_perceptron.h). A null source is refused.
  explicit NeuroConv(std::shared_ptr<ap::ReadableFileI> source);
  void calc(const std::vector<float>& input, std::vector<float>& output) const override;

  const SimplePerceptron& network() const { return network_; }

 private:
  SimplePerceptron network_;
};

}  // namespace flow
}  // namespace ml
