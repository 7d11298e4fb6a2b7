// One calc of the deep solver on a network of the web model's shape: 214 features, one
// hidden layer of 32 units, two outputs; and the same behind a rules encoding and a boost.
#include <benchmark/benchmark.h>

#include <map>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "engine/kb/readable_buffer.h"
#include "engine/ml/deep_solver.h"

namespace {

constexpr int kFeatures = 214;
constexpr int kHidden = 32;

class StringFiles final : public ap::FileSystemI {
 public:
  explicit StringFiles(std::map<std::string, std::string> files) : files_(std::move(files)) {}
  std::shared_ptr<ap::ReadableFileI> open(const std::string& name) override {
    const auto it = files_.find(name);
    if (it == files_.end()) return nullptr;
    return std::make_shared<util::ReadableBuffer>(it->second.data(),
                                                  static_cast<std::uint32_t>(it->second.size()));
  }
  void enumerate(const std::function<void(const std::string&, std::uint64_t)>&) override {}

 private:
  std::map<std::string, std::string> files_;
};

std::string Network(int inputs, std::mt19937& random) {
  std::uniform_real_distribution<float> weight(-1.0f, 1.0f);
  std::string text = "2 " + std::to_string(inputs + 1) + " " + std::to_string(kHidden) + " 2";
  const int count = kHidden * (inputs + 1) + 2 * (kHidden + 1);
  for (int i = 0; i < count; ++i) text += " " + std::to_string(weight(random));
  return text;
}

std::vector<float> Features(std::mt19937& random) {
  std::uniform_real_distribution<float> value(0.0f, 3.0f);
  std::vector<float> features(kFeatures);
  for (float& f : features) f = value(random);
  return features;
}

void RunSolver(benchmark::State& state, const ml::DeepSolver& solver,
               const std::vector<float>& features) {
  std::vector<float> output;
  for (auto _ : state) {
    solver.calc(features, output);
    benchmark::DoNotOptimize(output.data());
  }
}

void BM_DeepSolverNetwork214x32(benchmark::State& state) {
  std::mt19937 random(7);
  auto files = std::make_shared<StringFiles>(
      std::map<std::string, std::string>{{"n.net", Network(kFeatures, random)}});
  const ml::DeepSolver solver(R"({"convs":{"n":{"type":"neur","src":"n.net"}},)"
                              R"("flow":[{"name":"net","input":[[0,214]],"conv":"n"}]})",
                              files);
  RunSolver(state, solver, Features(random));
}
BENCHMARK(BM_DeepSolverNetwork214x32);

void BM_DeepSolverRulesNetworkBoost(benchmark::State& state) {
  std::mt19937 random(7);
  // Every feature encoded against three levels: 642 network inputs.
  std::string rules;
  for (int i = 0; i < kFeatures; ++i) rules += (i ? " " : "") + std::string("3 0.5 1 2");
  auto files = std::make_shared<StringFiles>(std::map<std::string, std::string>{
      {"n.net", Network(3 * kFeatures, random)}, {"r.rules", rules}});
  const ml::DeepSolver solver(
      R"({"convs":{"n":{"type":"neur","src":"n.net"},"r":{"type":"rules","src":"r.rules"},)"
      R"("s":{"type":"sqrtboost"}},"flow":[{"name":"enc","input":[[0,214]],"conv":"r"},)"
      R"({"name":"net","input":["enc"],"conv":"n"},{"name":"out","input":["net"],"conv":"s"}]})",
      files);
  RunSolver(state, solver, Features(random));
}
BENCHMARK(BM_DeepSolverRulesNetworkBoost);

}  // namespace
