#include "engine/ml/deep_solver.h"

#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <stdexcept>
#include <string>
#include <thread>
#include <typeinfo>
#include <vector>

#include "engine/common/error.h"
#include "engine/ml/json_value.h"
#include "tests/engine/ml/model_test_files.h"

namespace ml {
namespace {

using pelmix::testing::PieceFileSystem;

// Rules over three features and a network of 2 + 1 + 3 encoded inputs to two outputs.
std::shared_ptr<PieceFileSystem> ModelFiles() {
  return std::make_shared<PieceFileSystem>(std::map<std::string, std::string>{
      {"r.rules", "2 1 2 1 0 3 1 2 3"},
      {"n.net", "1 6 2 0 1 1 1 1 1 0 -1 -1 -1 -1 -1"},
      {"junk", "not a model"},
  });
}

std::unique_ptr<DeepSolver> Build(const std::string& text) {
  return std::make_unique<DeepSolver>(text, ModelFiles());
}

// The exception's dynamic type name and message, for the error table.
struct Failure {
  std::string message;
  bool cfg = false;
  bool outOfRange = false;
  bool badGet = false;
};

Failure BuildFailure(const std::string& text) {
  Failure failure;
  try {
    Build(text);
    failure.message = "(built)";
  } catch (const DeepSolver::CfgError& e) {
    failure = {e.what(), true};
  } catch (const std::out_of_range& e) {
    failure = {e.what(), false, true};
  } catch (const boost::bad_get& e) {
    failure = {e.what(), false, false, true};
  } catch (const std::exception& e) {
    failure.message = e.what();
  }
  return failure;
}

float Boost(float x) {
  return x > 0.5f ? static_cast<float>(std::sqrt(static_cast<double>(x))) : x * x;
}

std::string Cfg(const std::string& detail) { return "Deep solver config error: " + detail; }

const std::string kSqrt = R"({"convs":{"s":{"type":"sqrtboost"}},"flow":[)";

std::vector<float> Calc(const DeepSolver& solver, const std::vector<float>& input) {
  std::vector<float> output(11, -1.0f);
  solver.calc(input, output);
  return output;
}

TEST(DeepSolver, ConfigErrorsOfTheRootAndTheConversions) {
  const struct {
    std::string text;
    std::string message;
  } cases[] = {
      {R"({"convs":{}})", Cfg("Exact 2 elements expected in hash")},
      {R"({"convs":{},"flow":[],"x":1})", Cfg("Exact 2 elements expected in hash")},
      {R"({"convs":{},"flows":[]})", Cfg("Invalid item in hash: flows")},
      {R"({"a":{},"convs":{}})", Cfg("Invalid item in hash: a")},
      {R"({"convs":{"a":{"type":"sqrtboost","src":"junk","z":1}},"flow":[]})",
       Cfg("conv description cannot has more than 2 elements")},
      {R"({"convs":{"a":{"kind":"sqrtboost"}},"flow":[]})", Cfg("Wrong parameter in conv kind")},
      {R"({"convs":{"a":{}},"flow":[]})", Cfg("absent type of conv")},
      {R"({"convs":{"a":{"src":"nothing"}},"flow":[]})", Cfg("absent type of conv")},
      {R"({"convs":{"a":{"type":"rules","src":"nothing"}},"flow":[]})",
       Cfg("Absent conversion source nothing")},
      {R"({"convs":{"a":{"type":"rules"}},"flow":[]})", Cfg("absent src of conv a")},
      {R"({"convs":{"b":{"type":"neur"}},"flow":[]})", Cfg("absent src of conv b")},
  };
  for (const auto& c : cases) {
    const Failure failure = BuildFailure(c.text);
    EXPECT_EQ(failure.message, c.message) << c.text;
    EXPECT_TRUE(failure.cfg) << c.text;
  }
  // Not configuration errors in the narrow sense: no prefix, plain runtime errors.
  const Failure unknown = BuildFailure(R"({"convs":{"a":{"type":"Rules"}},"flow":[]})");
  EXPECT_EQ(unknown.message, "Unknown conversion Rules");
  EXPECT_FALSE(unknown.cfg);
  // Loader faults pass unchanged.
  EXPECT_EQ(BuildFailure(R"({"convs":{"a":{"type":"rules","src":"junk"}},"flow":[]})").message,
            "VectorRules: invalid size of rule");
  EXPECT_EQ(BuildFailure(R"({"convs":{"a":{"type":"neur","src":"junk"}},"flow":[]})").message,
            "invalid neural network depth0");
}

TEST(DeepSolver, ConfigErrorsOfTheFlows) {
  const struct {
    std::string flows;
    std::string message;
  } cases[] = {
      {R"({"name":"a","input":[]})", Cfg("Wrong number of parameters in flow")},
      {R"({"name":"a","input":[],"conv":"s","x":1})", Cfg("Wrong number of parameters in flow")},
      {R"({"name":"a","input":[],"cnv":"s"})", Cfg("Unknown parameter in flow cnv")},
      {R"({"name":"a","input":[],"conv":"t"})", Cfg("Absent conv t")},
      {R"({"name":"a","input":["b"],"conv":"s"},{"name":"b","input":[],"conv":"s"})",
       Cfg("Can't find flow b")},
      {R"({"name":"a","input":[5],"conv":"s"})", Cfg("Wrong type of input")},
      {R"({"name":"a","input":[null],"conv":"s"})", Cfg("Wrong type of input")},
      {R"({"name":"a","input":[1.5],"conv":"s"})", Cfg("Wrong type of input")},
      {R"({"name":"a","input":[true],"conv":"s"})", Cfg("Wrong type of input")},
      {R"({"name":"a","input":[{}],"conv":"s"})", Cfg("Wrong type of input")},
      {R"({"name":"a","input":[[5,2]],"conv":"s"})", Cfg("Reversed range [5, 2] in flow a")},
      {R"({"name":"a","input":[[-1,2]],"conv":"s"})",
       Cfg("Reversed range [4294967295, 2] in flow a")},
  };
  for (const auto& c : cases) {
    const Failure failure = BuildFailure(kSqrt + c.flows + "]}");
    EXPECT_EQ(failure.message, c.message) << c.flows;
    EXPECT_TRUE(failure.cfg) << c.flows;
  }

  for (const std::string flows :
       {R"({"name":"a","input":["a"],"conv":"s"})",
        R"({"name":"a","input":[],"conv":"s"},{"name":"a","input":["a"],"conv":"s"})"}) {
    const Failure self = BuildFailure(kSqrt + flows + "]}");
    EXPECT_EQ(self.message, "Flow ref to itself: a");
    EXPECT_FALSE(self.cfg);
  }
  for (const std::string range : {"[]", "[1]"}) {
    const Failure failure =
        BuildFailure(kSqrt + R"({"name":"a","input":[)" + range + R"(],"conv":"s"}]})");
    EXPECT_TRUE(failure.outOfRange) << range;
    EXPECT_EQ(failure.message, "invalid vector<T> subscript");
  }
}

TEST(DeepSolver, WrongKindsAndSyntax) {
  for (const std::string& text : std::vector<std::string>{
           R"([])",
           R"({"convs":[],"flow":[]})",
           R"({"convs":{},"flow":{}})",
           R"({"convs":{"a":"sqrtboost"},"flow":[]})",
           R"({"convs":{"a":{"type":5}},"flow":[]})",
           R"({"convs":{"a":{"src":5,"type":"sqrtboost"}},"flow":[]})",
           R"({"convs":{},"flow":[5]})",
           kSqrt + R"({"name":5,"input":[],"conv":"s"}]})",
           kSqrt + R"({"name":"a","input":"b","conv":"s"}]})",
           kSqrt + R"({"name":"a","input":[["0",1]],"conv":"s"}]})",
           kSqrt + R"({"name":"a","input":[[0,1.0]],"conv":"s"}]})",
           kSqrt + R"({"name":"a","input":[[0,4294967296]],"conv":"s"}]})",
       }) {
    const Failure failure = BuildFailure(text);
    EXPECT_TRUE(failure.badGet) << text;
    EXPECT_EQ(failure.message, "boost::bad_get: failed value get using boost::get") << text;
  }
  const std::string broken = R"({"convs":{},"flow":[] })";
  EXPECT_EQ(BuildFailure(broken).message, "JSON: parsing error " + broken);
}

TEST(DeepSolver, BuildsEveryConversionOnceAndSharesIt) {
  const auto files = ModelFiles();
  const DeepSolver solver(
      R"({"convs":{"unused":{"type":"rules","src":"r.rules"},"s":{"type":"sqrtboost","src":"junk"}},)"
      R"("flow":[{"name":"a","input":[[0,1]],"conv":"s"},{"name":"b","input":["a"],"conv":"s"}]})",
      files);
  ASSERT_EQ(solver.conversions().size(), 2u);
  EXPECT_EQ(files->opens, 2);  // each source opened once, the unused one too
  // Conversions are kept in name order: "s" then "unused".
  EXPECT_NE(dynamic_cast<const flow::SqrtBoost*>(solver.conversions()[0].get()), nullptr);
  EXPECT_EQ(solver.flows()[0].conversion, solver.flows()[1].conversion);
  EXPECT_EQ(solver.flows()[0].conversion, solver.conversions()[0].get());
  // A sqrtboost source must exist even though it is not read.
  EXPECT_EQ(BuildFailure(R"({"convs":{"s":{"type":"sqrtboost","src":"x"}},"flow":[]})").message,
            Cfg("Absent conversion source x"));
}

TEST(DeepSolver, EvaluationOrderAndOutputFlow) {
  // a (features), b (refs a), c (features): a, c, b; b gives the output.
  const auto solver = Build(kSqrt + R"({"name":"a","input":[[0,1]],"conv":"s"},)"
                                    R"({"name":"b","input":["a",[1,2]],"conv":"s"},)"
                                    R"({"name":"c","input":[[2,3]],"conv":"s"}]})");
  ASSERT_EQ(solver->order().size(), 3u);
  EXPECT_EQ(solver->order()[0]->name, "a");
  EXPECT_EQ(solver->order()[1]->name, "c");
  EXPECT_EQ(solver->order()[2]->name, "b");
  EXPECT_EQ(solver->order()[2]->depth, 1u);
  EXPECT_EQ(solver->flows()[1].slot, 2u);
  // b = sqrtboost(sqrtboost(0.9), 0.8)
  EXPECT_EQ(Calc(*solver, {0.9f, 0.8f, 0.1f}),
            (std::vector<float>{Boost(Boost(0.9f)), Boost(0.8f)}));

  // Two flows of the greatest depth: the later one answers.
  const auto tie = Build(kSqrt + R"({"name":"x","input":[[0,1]],"conv":"s"},)"
                                 R"({"name":"y","input":["x"],"conv":"s"},)"
                                 R"({"name":"z","input":["x",[1,3]],"conv":"s"}]})");
  EXPECT_EQ(tie->order().back()->name, "z");
  EXPECT_EQ(Calc(*tie, {0.25f, 0.5f, 0.25f}).size(), 3u);
}

TEST(DeepSolver, LaterFlowsShadowEarlierNames) {
  const auto solver = Build(kSqrt + R"({"name":"a","input":[[0,1]],"conv":"s"},)"
                                    R"({"name":"a","input":[[1,3]],"conv":"s"},)"
                                    R"({"name":"b","input":["a"],"conv":"s"}]})");
  EXPECT_EQ(solver->flows()[2].inputs[0].flow, &solver->flows()[1]);
  EXPECT_EQ(Calc(*solver, {0.1f, 0.2f, 0.3f}).size(), 2u);
}

TEST(DeepSolver, RangesGatherTheirSlice) {
  const auto solver = Build(kSqrt + R"({"name":"a","input":[[3,7],[2,2],[0,1]],"conv":"s"}]})");
  std::vector<float> sixteenths;
  for (int k = 0; k < 8; ++k) sixteenths.push_back(k / 16.0f);
  EXPECT_EQ(Calc(*solver, sixteenths),
            (std::vector<float>{9 / 256.0f, 16 / 256.0f, 25 / 256.0f, 36 / 256.0f, 0}));
  const auto nothing = Build(kSqrt + R"({"name":"a","input":[[1,1]],"conv":"s"}]})");
  EXPECT_TRUE(Calc(*nothing, {0.75f}).empty());
  EXPECT_THROW(Calc(*nothing, {}), std::runtime_error);  // bounds past the input
}

TEST(DeepSolver, RangePastTheInputFailsTheCalcOnly) {
  const auto solver = Build(kSqrt + R"({"name":"a","input":[[1,4]],"conv":"s"}]})");
  try {
    Calc(*solver, {1, 2, 3});
    FAIL();
  } catch (const std::runtime_error& e) {
    EXPECT_STREQ(e.what(), "Deep solver flow a reads features [1, 4) of an input of 3");
  }
  EXPECT_EQ(Calc(*solver, {0.25f, 0.125f, 0.25f, 0.5f}),
            (std::vector<float>{1 / 64.0f, 1 / 16.0f, 0.25f}));
  const auto far = Build(kSqrt + R"({"name":"a","input":[[0,-1]],"conv":"s"}]})");
  EXPECT_THROW(Calc(*far, {1, 2}), std::runtime_error);
}

TEST(DeepSolver, EmptyFlowListGivesAnEmptyOutput) {
  const auto solver = Build(R"({"convs":{"s":{"type":"sqrtboost"}},"flow":[]})");
  EXPECT_TRUE(Calc(*solver, {1, 2}).empty());
}

TEST(DeepSolver, RulesNetworkAndBoostTogether) {
  const auto solver = Build(
      R"({"convs":{"n":{"type":"neur","src":"n.net"},"r":{"type":"rules","src":"r.rules"},)"
      R"("s":{"type":"sqrtboost"}},"flow":[{"name":"enc","input":[[0,3]],"conv":"r"},)"
      R"({"name":"net","input":["enc"],"conv":"n"},{"name":"out","input":["net"],"conv":"s"}]})");
  // Rules: 1.5 -> [0.5, 0.5]; the second feature is dropped; 2.5 -> [0, 0.5, 0.5].
  // Unit 0 sums to 2, unit 1 to -2.
  const auto sigmoid = [](float s) {
    return static_cast<float>(1.0 / (1.0 + std::exp(-static_cast<double>(s))));
  };
  const float high = sigmoid(2.0f), low = sigmoid(-2.0f);
  EXPECT_EQ(Calc(*solver, {1.5f, 7.0f, 2.5f}), (std::vector<float>{Boost(high), Boost(low)}));
  EXPECT_GT(high, 0.5f);
  EXPECT_LT(low, 0.5f);
  // A wrong feature count reaches the rules and fails there.
  EXPECT_THROW(Calc(*solver, {1, 2}), std::runtime_error);
}

TEST(DeepSolver, ConcurrentCalcsMatchOneThread) {
  const auto solver = Build(
      R"({"convs":{"n":{"type":"neur","src":"n.net"},"r":{"type":"rules","src":"r.rules"},)"
      R"("s":{"type":"sqrtboost"}},"flow":[{"name":"enc","input":[[0,3]],"conv":"r"},)"
      R"({"name":"net","input":["enc"],"conv":"n"},{"name":"out","input":["net",[0,3]],"conv":"s"}]})");
  std::vector<std::vector<float>> inputs;
  for (int i = 0; i < 200; ++i) {
    inputs.push_back({static_cast<float>(i % 7) * 0.4f, static_cast<float>(i % 3) * 0.3f,
                      static_cast<float>(i % 11) * 0.35f});
  }
  std::vector<std::vector<float>> expected;
  for (const auto& input : inputs) expected.push_back(Calc(*solver, input));

  std::vector<int> mismatches(4, 0);
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&, t] {
      for (int round = 0; round < 50; ++round) {
        for (std::size_t i = 0; i < inputs.size(); ++i) {
          if (Calc(*solver, inputs[i]) != expected[i]) ++mismatches[t];
        }
      }
    });
  }
  for (auto& thread : threads) thread.join();
  EXPECT_EQ(mismatches, std::vector<int>(4, 0));
}

TEST(DeepSolver, HostileFlowFiles) {
  // Deep nesting is refused by the parser before it can exhaust the stack.
  EXPECT_EQ(BuildFailure(std::string(10 << 20, '[')).message,
            "JSON: nesting deeper than 64 levels");
  // Each flow doubles its predecessor's output; the gathered data is bounded.
  std::string text = kSqrt + R"({"name":"f0","input":[[0,1]],"conv":"s"})";
  for (int i = 1; i <= 24; ++i) {
    const std::string previous = "\"f" + std::to_string(i - 1) + "\"";
    text += ",{\"name\":\"f" + std::to_string(i) + "\",\"input\":[" + previous + "," + previous +
            "],\"conv\":\"s\"}";
  }
  const auto doubling = Build(text + "]}");
  try {
    Calc(*doubling, {0.5f});
    FAIL();
  } catch (const std::runtime_error& e) {
    EXPECT_STREQ(e.what(), "Deep solver flow f21 gathers more than 1048576 values");
  }
  // NaN and infinity pass through as values, not as faults.
  const auto boosted = Build(kSqrt + R"({"name":"a","input":[[0,3]],"conv":"s"}]})");
  const std::vector<float> out = Calc(*boosted, {NAN, INFINITY, -INFINITY});
  EXPECT_TRUE(std::isnan(out[0]));
  EXPECT_EQ(out[1], INFINITY);
  EXPECT_EQ(out[2], INFINITY);
}

}  // namespace
}  // namespace ml
