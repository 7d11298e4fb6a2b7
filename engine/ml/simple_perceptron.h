// The fully connected feed-forward network behind the "neur" conversion: 1 to 20 layers of
// logistic units with a bias each, every weight in one contiguous array.
//
// Network file (space-separated tokens): N (layers), S (inputs + 1), N unit counts, then all
// weights layer by layer, unit by unit, each unit's bias first. The file is hostile input:
// a header or a weight list cut short, or sizes the rest of the file cannot hold, are refused
// before anything is allocated for them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "engine/ml/token_reader.h"

namespace ml {

// Layers a network file may declare.
inline constexpr std::uint32_t kMaxNetworkDepth = 20;
// Weights a network file may declare in all (64 MiB of floats), whatever the file's size.
inline constexpr std::uint64_t kMaxNetworkWeights = std::uint64_t{1} << 24;

class SimplePerceptron {
 public:
  struct Layer {
    std::size_t weights = 0;   // offset of this layer's block in the network's weights
    std::uint32_t stride = 0;  // weights per unit: the layer's inputs + 1 (the bias)
    std::uint32_t neurons = 0;
  };

  // One layer per neighbouring pair of `levels` (unit counts from the input side), with
  // zero weights. Fewer than two levels: std::runtime_error.
  explicit SimplePerceptron(const std::vector<std::uint32_t>& levels);

  // Replaces layers and weights with those of a network file. On a fault the network is
  // left as it was.
  void Load(TokenReader& reader);

  // The forward pass; `output` gets the last layer's units. Sums are kept as 32-bit floats
  // after each addition; each unit's sigmoid is taken in double and rounded once.
  void calc(const std::vector<float>& input, std::vector<float>& output) const;

  const std::vector<Layer>& layers() const { return layers_; }
  const std::vector<float>& weights() const { return weights_; }

 private:
  std::vector<float> weights_;
  std::vector<Layer> layers_;
};

}  // namespace ml
