// The loaded knowledge of one check factory. Only the decision interfaces live here so far:
// a checker hands its feature vector to a Solver, which runs an AbstractNetI model on it.
#pragma once

#include <string>
#include <vector>

class WebCheckerV3Data {
 public:
  // A decision model: a feature vector in, an output vector out. Implementations are
  // immutable once built, so calc may run on several threads at once.
  class AbstractNetI {
   public:
    virtual void calc(const std::vector<float>& input, std::vector<float>& output) const = 0;
    virtual ~AbstractNetI() = default;
  };

  // What a Solver makes of a model's outputs.
  struct Decision {
    bool detected = false;      // the outputs say phishing
    bool outside_loud = false;  // detected, and farther than threshold_loud from (1, 1)
    float weight = 0.0f;        // the first output (0 when there were fewer than two)
    std::string annotation;     // every output rendered, separated by single blanks
  };

  class Solver {
   public:
    // `thresholds` points at two floats: the detection radius `threshold`, then
    // `threshold_loud`. Model faults propagate.
    virtual Decision Solve(const std::vector<float>& features, const float* thresholds) const = 0;
    virtual ~Solver() = default;
  };
};
