#include "engine/ml/simple_perceptron.h"

#include <cmath>
#include <stdexcept>
#include <string>

#include "engine/common/error.h"

namespace ml {
namespace {

void Place(std::vector<SimplePerceptron::Layer>& layers) {
  std::size_t offset = 0;
  for (auto& layer : layers) {
    layer.weights = offset;
    offset += std::size_t{layer.neurons} * layer.stride;
  }
}

float Sigmoid(float sum) {
  return static_cast<float>(1.0 / (1.0 + std::exp(-static_cast<double>(sum))));
}

}  // namespace

SimplePerceptron::SimplePerceptron(const std::vector<std::uint32_t>& levels) {
  if (levels.size() < 2) throw std::runtime_error("At least two values should be in levels vector");
  std::size_t total = 0;
  for (std::size_t i = 1; i < levels.size(); ++i) {
    Layer layer;
    layer.stride = levels[i - 1] + 1;
    layer.neurons = levels[i];
    total += std::size_t{layer.neurons} * layer.stride;
    layers_.push_back(layer);
  }
  Place(layers_);
  weights_.assign(total, 0.0f);
}

void SimplePerceptron::Load(TokenReader& reader) {
  std::uint32_t depth = 0;
  std::uint32_t stride = 0;
  if (!reader.ReadUnsigned(depth)) ap::ThrowError("neural network file ends inside its header");
  if (depth < 1 || depth > kMaxNetworkDepth) {
    ap::ThrowError("invalid neural network depth" + std::to_string(depth));
  }
  if (!reader.ReadUnsigned(stride)) ap::ThrowError("neural network file ends inside its header");

  std::vector<Layer> layers(depth);
  std::uint64_t total = 0;
  for (auto& layer : layers) {
    layer.stride = stride;
    if (!reader.ReadUnsigned(layer.neurons)) {
      ap::ThrowError("neural network file ends inside its header");
    }
    // Checked per layer: one layer's product fits 64 bits, a sum of twenty might not.
    total += std::uint64_t{layer.neurons} * layer.stride;
    if (total > kMaxNetworkWeights) {
      ap::ThrowError("neural network too large: more than " + std::to_string(kMaxNetworkWeights) +
                     " weights");
    }
    stride = layer.neurons + 1;  // wraps as the stored 32-bit stride does
  }
  // Every weight is a token of at least one byte, and tokens are separated by spaces.
  if (const auto remaining = reader.RemainingBytes();
      remaining && total > 0 && 2 * total - 1 > *remaining) {
    ap::ThrowError("neural network file too short for " + std::to_string(total) + " weights");
  }

  std::vector<float> weights(static_cast<std::size_t>(total));
  for (std::size_t i = 0; i < weights.size(); ++i) {
    if (!reader.ReadFloat(weights[i])) {
      ap::ThrowError("neural network file ends after " + std::to_string(i) + " of " +
                     std::to_string(total) + " weights");
    }
  }
  Place(layers);
  layers_ = std::move(layers);
  weights_ = std::move(weights);
}

void SimplePerceptron::calc(const std::vector<float>& input, std::vector<float>& output) const {
  if (layers_.empty()) ap::ThrowError("Trying to calc empty net");
  // A stored first stride of 0 declares -1 inputs: no input can match it.
  const std::uint32_t expected = layers_.front().stride - 1;
  if (layers_.front().stride == 0 || input.size() != expected) {
    ap::ThrowError(
        "SimplePerceptron::calc input size different from upper layer neuron input size: " +
        std::to_string(input.size()) + " != " + std::to_string(expected));
  }
  std::vector<float> buffers[2];
  const float* x = input.data();
  std::size_t which = 0;
  for (const Layer& layer : layers_) {
    std::vector<float>& out = buffers[which];
    out.resize(layer.neurons);
    const float* unit = weights_.data() + layer.weights;
    const std::uint32_t inputs = layer.stride - 1;
    const std::size_t stride = layer.stride;
    std::uint32_t j = 0;
    // Four units at a time: each sum still adds its terms in input order, but the four
    // chains of dependent additions overlap.
    for (; j + 4 <= layer.neurons; j += 4, unit += 4 * stride) {
      const float* w0 = unit;
      const float* w1 = unit + stride;
      const float* w2 = unit + 2 * stride;
      const float* w3 = unit + 3 * stride;
      float s0 = w0[0], s1 = w1[0], s2 = w2[0], s3 = w3[0];
      for (std::uint32_t k = 0; k < inputs; ++k) {
        const float xk = x[k];
        s0 += xk * w0[k + 1];
        s1 += xk * w1[k + 1];
        s2 += xk * w2[k + 1];
        s3 += xk * w3[k + 1];
      }
      out[j] = Sigmoid(s0);
      out[j + 1] = Sigmoid(s1);
      out[j + 2] = Sigmoid(s2);
      out[j + 3] = Sigmoid(s3);
    }
    for (; j < layer.neurons; ++j, unit += stride) {
      float sum = unit[0];
      for (std::uint32_t k = 0; k < inputs; ++k) sum += x[k] * unit[k + 1];
      out[j] = Sigmoid(sum);
    }
    x = out.data();
    which ^= 1;
  }
  output.swap(buffers[which ^ 1]);
}

}  // namespace ml
