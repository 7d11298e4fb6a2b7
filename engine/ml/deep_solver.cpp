#include "engine/ml/deep_solver.h"

#include <algorithm>
#include <unordered_map>

#include "engine/ml/json_value.h"

namespace ml {
namespace {

using CfgError = DeepSolver::CfgError;

std::unique_ptr<ConversionI> MakeConversion(const std::string& name, const std::string& type,
                                            std::shared_ptr<ap::ReadableFileI> source) {
  if (type == "sqrtboost") return std::make_unique<flow::SqrtBoost>();
  if (type != "rules" && type != "neur") throw std::runtime_error("Unknown conversion " + type);
  if (source == nullptr) throw CfgError("absent src of conv " + name);
  if (type == "rules") return std::make_unique<flow::RulesConv>(std::move(source));
  return std::make_unique<flow::NeuroConv>(std::move(source));
}

}  // namespace

DeepSolver::DeepSolver(const std::string& text, std::shared_ptr<ap::FileSystemI> files) {
  const JsonValue tree = ParseJson(text);
  const auto& root = boost::get<JsonObject>(tree);
  if (root.size() != 2) throw CfgError("Exact 2 elements expected in hash");
  const JsonObject* convs = nullptr;
  const JsonArray* flowList = nullptr;
  for (const auto& [key, value] : root) {
    if (key == "convs") {
      convs = &boost::get<JsonObject>(value);
    } else if (key == "flow") {
      flowList = &boost::get<JsonArray>(value);
    } else {
      throw CfgError("Invalid item in hash: " + key);
    }
  }

  // Built in ascending name order, so the names can be searched by halves.
  std::vector<std::string> names;
  for (const auto& [name, value] : *convs) {
    const auto& description = boost::get<JsonObject>(value);
    if (description.size() > 2) throw CfgError("conv description cannot has more than 2 elements");
    const std::string* type = nullptr;
    const std::string* src = nullptr;
    for (const auto& [key, member] : description) {
      if (key == "type") {
        type = &boost::get<std::string>(member);
      } else if (key == "src") {
        src = &boost::get<std::string>(member);
      } else {
        throw CfgError("Wrong parameter in conv " + key);
      }
    }
    if (type == nullptr) throw CfgError("absent type of conv");
    std::shared_ptr<ap::ReadableFileI> source;
    if (src != nullptr) {
      if (files != nullptr) source = files->open(*src);
      if (source == nullptr) throw CfgError("Absent conversion source " + *src);
    }
    conversions_.push_back(MakeConversion(name, *type, std::move(source)));
    names.push_back(name);
  }

  // References point into flows_: its capacity is fixed before the first flow is added.
  flows_.reserve(flowList->size());
  std::unordered_map<std::string, const Flow*> latest;  // the newest flow of each name
  for (const JsonValue& element : *flowList) {
    const auto& description = boost::get<JsonObject>(element);
    if (description.size() != 3) throw CfgError("Wrong number of parameters in flow");
    const std::string* name = nullptr;
    const JsonArray* inputs = nullptr;
    const std::string* convName = nullptr;
    for (const auto& [key, member] : description) {
      if (key == "name") {
        name = &boost::get<std::string>(member);
      } else if (key == "input") {
        inputs = &boost::get<JsonArray>(member);
      } else if (key == "conv") {
        convName = &boost::get<std::string>(member);
      } else {
        throw CfgError("Unknown parameter in flow " + key);
      }
    }
    const auto found = std::lower_bound(names.begin(), names.end(), *convName);
    if (found == names.end() || *found != *convName) throw CfgError("Absent conv " + *convName);

    Flow& flow = flows_.emplace_back();
    flow.name = *name;
    flow.conversion = conversions_[found - names.begin()].get();
    flow.inputs.reserve(inputs->size());
    for (const JsonValue& input : *inputs) {
      FlowInput& in = flow.inputs.emplace_back();
      if (const auto* ref = boost::get<std::string>(&input)) {
        if (*ref == flow.name) throw std::runtime_error("Flow ref to itself: " + flow.name);
        const auto it = latest.find(*ref);
        if (it == latest.end()) throw CfgError("Can't find flow " + *ref);
        in.tag = FlowInput::Tag::kFlow;
        in.flow = it->second;
        flow.depth = std::max(flow.depth, it->second->depth + 1);
      } else if (const auto* range = boost::get<JsonArray>(&input)) {
        if (range->size() < 2) throw std::out_of_range("invalid vector<T> subscript");
        in.to = static_cast<std::uint32_t>(boost::get<std::int64_t>((*range)[1]));
        in.from = static_cast<std::uint32_t>(boost::get<std::int64_t>((*range)[0]));
        // Would read backwards through the features.
        if (in.from > in.to) {
          throw CfgError("Reversed range [" + std::to_string(in.from) + ", " +
                         std::to_string(in.to) + "] in flow " + flow.name);
        }
      } else {
        throw CfgError("Wrong type of input");
      }
    }
    latest[flow.name] = &flow;
  }

  std::vector<Flow*> order;
  order.reserve(flows_.size());
  for (Flow& flow : flows_) order.push_back(&flow);
  std::stable_sort(order.begin(), order.end(),
                   [](const Flow* a, const Flow* b) { return a->depth < b->depth; });
  for (std::size_t i = 0; i < order.size(); ++i) order[i]->slot = static_cast<std::uint32_t>(i);
  order_.assign(order.begin(), order.end());
}

namespace {

[[noreturn]] void ThrowRangePastInput(const DeepSolver::Flow& flow, const DeepSolver::FlowInput& in,
                                      std::size_t size) {
  throw std::runtime_error("Deep solver flow " + flow.name + " reads features [" +
                           std::to_string(in.from) + ", " + std::to_string(in.to) +
                           ") of an input of " + std::to_string(size));
}

}  // namespace

void DeepSolver::CheckInputSize(std::size_t size) const {
  for (const Flow& flow : flows_) {
    for (const FlowInput& in : flow.inputs) {
      if (in.tag == FlowInput::Tag::kRange && in.to > size) ThrowRangePastInput(flow, in, size);
    }
  }
}

void DeepSolver::calc(const std::vector<float>& input, std::vector<float>& output) const {
  if (order_.empty()) {
    output.clear();
    return;
  }
  std::vector<std::vector<float>> results(flows_.size());
  std::vector<float> gathered;
  for (const Flow* flow : order_) {
    gathered.clear();
    for (const FlowInput& in : flow->inputs) {
      const float* first;
      std::size_t count;
      if (in.tag == FlowInput::Tag::kRange) {
        if (in.to > input.size()) ThrowRangePastInput(*flow, in, input.size());
        first = input.data() + in.from;
        count = in.to - in.from;
      } else {
        const std::vector<float>& result = results[in.flow->slot];
        first = result.data();
        count = result.size();
      }
      if (count > kMaxFlowInputSize - gathered.size()) {
        throw std::runtime_error("Deep solver flow " + flow->name + " gathers more than " +
                                 std::to_string(kMaxFlowInputSize) + " values");
      }
      gathered.insert(gathered.end(), first, first + count);
    }
    flow->conversion->calc(gathered, results[flow->slot]);
  }
  output = std::move(results[order_.back()->slot]);
}

}  // namespace ml
