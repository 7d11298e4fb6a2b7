#include "engine/ml/conversions.h"

#include <cmath>
#include <stdexcept>
#include <string>

#include "engine/common/error.h"
#include "engine/kb/float_parser.h"
#include "engine/kb/readable_stream.h"

namespace ml {
namespace {

double ReadLevel(std::istream& in) {
  std::string item;
  // A count promises that many levels: a file cut short must not pass for zeros.
  if (!(in >> item)) ap::ThrowError("VectorRules: missing level");
  return ap::FloatParser::Parse(item);
}

}  // namespace

VectorRules::VectorRules(std::shared_ptr<ap::ReadableFileI> source) {
  if (source == nullptr) ap::ThrowError("VectorRules: no rules file");
  ap::EntryTextStream in(std::move(source));
  std::uint32_t start = 0;
  // The file ends right after its last level: trailing white space reads as a missing count.
  while (!in.eof()) {
    std::uint32_t count = 0;
    if (!(in >> count) || count == 0) ap::ThrowError("VectorRules: invalid size of rule");
    const double first = ReadLevel(in);
    if (count == 1 && first == 0.0) {
      rules_.emplace_back(start, start);
      continue;
    }
    if (!std::isfinite(first) || first <= 0.0) {
      ap::ThrowError("VectorRules: levels must be finite, above 0 and ascending");
    }
    levels_.push_back(first);
    for (std::uint32_t i = 1; i < count; ++i) {
      const double level = ReadLevel(in);
      if (!std::isfinite(level) || level <= levels_.back()) {
        ap::ThrowError("VectorRules: levels must be finite, above 0 and ascending");
      }
      levels_.push_back(level);
    }
    outputSize_ += count;
    const auto end = static_cast<std::uint32_t>(levels_.size());
    rules_.emplace_back(start, end);
    start = end;
  }
}

void VectorRules::calc(const std::vector<float>& input, std::vector<float>& output) const {
  if (input.size() != rules_.size()) throw std::runtime_error("Input size for rules != rules size");
  output.assign(outputSize_, 0.0f);
  float* out = output.data();
  for (std::size_t i = 0; i < input.size(); ++i) {
    const auto [begin, end] = rules_[i];
    const std::uint32_t n = end - begin;
    if (n == 0) continue;
    const double* l = levels_.data() + begin;
    const double x = input[i];
    // The first step whose interval [previous level, level] holds x; ties go to the lower
    // step. Nothing holds x above the last level, below 0 or NaN: the top position is set.
    std::uint32_t k = 0;
    double previous = 0.0;
    while (k < n && !(previous <= x && x <= l[k])) previous = l[k++];
    if (k == n) {
      out[n - 1] = 1.0f;
    } else if (k == 0) {
      out[0] = static_cast<float>(x / l[0]);
    } else {
      const double low = (l[k] - x) / (l[k] - l[k - 1]);
      out[k - 1] = static_cast<float>(low);
      out[k] = static_cast<float>(1.0 - low);
    }
    out += n;
  }
}

namespace flow {

void SqrtBoost::calc(const std::vector<float>& input, std::vector<float>& output) const {
  output.resize(input.size());
  for (std::size_t i = 0; i < input.size(); ++i) {
    const float x = input[i];
    output[i] = x > 0.5f ? static_cast<float>(std::sqrt(static_cast<double>(x))) : x * x;
  }
}

NeuroConv::NeuroConv(std::shared_ptr<ap::ReadableFileI> source) : network_({1, 1}) {
  if (source == nullptr) ap::ThrowError("NeuroConv: no network file");
  TokenReader reader(std::move(source));
  network_.Load(reader);
}

void NeuroConv::calc(const std::vector<float>& input, std::vector<float>& output) const {
  std::vector<float> result;
  network_.calc(input, result);
  output.swap(result);
}

}  // namespace flow
}  // namespace ml
