// The configurable decision model: a graph of named flows read from a flow file. Each flow
// gathers slices of the feature vector and the outputs of earlier flows, runs one conversion
// on them and keeps the result for later flows; the output flow's result is the answer.
//
// Flow file (the JSON of json_value.h):
//   {"convs": {NAME: {"type": "sqrtboost" | "rules" | "neur", "src": FILE}, ...},
//    "flow": [{"name": NAME, "input": [[FROM, TO] | FLOW_NAME, ...], "conv": NAME}, ...]}
// "rules" and "neur" read their "src" from the file system given at construction. A flow may
// only reference flows defined before it, so the graph is acyclic by construction.
//
// Flows run by ascending depth (0 for a flow fed by the features only, else one more than
// its deepest reference), in definition order within a depth; the last one gives the output.
// The solver is immutable once built: calc keeps its working vectors local and may run on
// any number of threads at once.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "engine/common/file_interfaces.h"
#include "engine/kb/web_checker_v3_data.h"
#include "engine/ml/conversions.h"

namespace ml {

// Values one flow may gather in a calc. Flows that feed a flow's output to a later one
// several times can double the data per level; this bounds what a hostile file can ask for.
inline constexpr std::size_t kMaxFlowInputSize = std::size_t{1} << 20;

class DeepSolver final : public WebCheckerV3Data::AbstractNetI {
 public:
  // Every configuration fault of the flow file: "Deep solver config error: " + the detail.
  class CfgError : public std::runtime_error {
   public:
    explicit CfgError(const std::string& detail)
        : std::runtime_error("Deep solver config error: " + detail) {}
  };

  struct Flow;
  struct FlowInput {
    enum class Tag : std::uint8_t { kRange = 0, kFlow = 1 };
    Tag tag = Tag::kRange;
    std::uint32_t from = 0;  // kRange: features [from, to)
    std::uint32_t to = 0;
    const Flow* flow = nullptr;  // kFlow: that flow's whole output
  };
  struct Flow {
    std::string name;
    std::vector<FlowInput> inputs;
    const ConversionI* conversion = nullptr;  // owned by the solver, possibly shared
    std::uint32_t depth = 0;
    std::uint32_t slot = 0;  // position in the evaluation order
  };

  // `text` is the whole flow file; `files` is used only while constructing, to open the
  // conversions' sources. Faults throw (CfgError, the parser's and the loaders' errors);
  // nothing half-built survives.
  DeepSolver(const std::string& text, std::shared_ptr<ap::FileSystemI> files);
  DeepSolver(const DeepSolver&) = delete;
  DeepSolver& operator=(const DeepSolver&) = delete;

  // Replaces `output` with the output flow's result (empty when the file defines no flow).
  // A range reaching past the input throws std::runtime_error; conversion faults propagate.
  void calc(const std::vector<float>& input, std::vector<float>& output) const override;

  // Raises the error calc would raise on an input of `size` features when a flow reads a
  // range past it, so that a model that does not fit its channel's vector is refused when it
  // loads rather than at every decision.
  void CheckInputSize(std::size_t size) const;

  const std::vector<std::unique_ptr<ConversionI>>& conversions() const { return conversions_; }
  const std::vector<Flow>& flows() const { return flows_; }  // in definition order
  const std::vector<const Flow*>& order() const { return order_; }

 private:
  std::vector<std::unique_ptr<ConversionI>> conversions_;
  std::vector<Flow> flows_;
  std::vector<const Flow*> order_;
};

}  // namespace ml
