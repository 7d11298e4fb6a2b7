// pelmix model run, on a model in a directory and the same model packed in a container.
#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <sstream>
#include <string>
#include <utility>

#include "engine/kb/simple_solver.h"
#include "engine/ml/deep_solver.h"
#include "tests/engine/ml/model_test_files.h"
#include "tests/tools/pelmix/cli_runner.h"
#include "tools/kbtools/container_writer.h"

namespace {

using pelmix::testing::CliRun;
using pelmix::testing::RunCli;

const std::map<std::string, std::string> kModel = {
    {"web.flow",
     R"({"convs":{"n":{"type":"neur","src":"models/n.net"},"r":{"type":"rules","src":"r.rules"},)"
     R"("s":{"type":"sqrtboost"}},"flow":[{"name":"enc","input":[[0,3]],"conv":"r"},)"
     R"({"name":"net","input":["enc"],"conv":"n"},{"name":"out","input":["net"],"conv":"s"}]})"},
    {"r.rules", "2 1 2 1 0 3 1 2 3"},
    {"models/n.net", "1 6 2 0 1 1 1 1 1 0 1 1 1 1 1"},
    {"boost.flow",
     R"({"convs":{"s":{"type":"sqrtboost"}},"flow":[{"name":"a","input":[[0,2]],"conv":"s"}]})"},
};

class ModelRun : public pelmix::testing::CliTest {
 protected:
  void SetUp() override {
    CliTest::SetUp();
    pelmix::kbtools::ContainerWriter writer;
    for (const auto& [name, bytes] : kModel) {
      Write("model/" + name, bytes);
      writer.Add(name, bytes);
    }
    Write("model.kb", writer.Build());
  }

  CliRun Run(const std::string& args, const std::string& input, bool withStderr = false) {
    return RunCli("model run " + args + " < " + Write("input.txt", input), withStderr);
  }

  std::string Dir() const { return "--dir " + Path("model"); }
  std::string Kb() const { return "--kb " + Path("model.kb"); }
};

TEST_F(ModelRun, PrintsOutputsAndDecision) {
  const CliRun run = Run(Dir() + " boost.flow", "0.25 0.81\n0.9999\t0.99999\n");
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.out,
            "0.0625 0.899999976\t0\t0\t0.0625\t.06 .89\n"
            "0.999949992 0.999994993\t1\t1\t0.999949992\t1 1\n");
  // A wider radius for loud reports keeps the detection quiet.
  EXPECT_EQ(Run(Dir() + " boost.flow --threshold-loud 0.5", "0.9999 0.99999").out,
            "0.999949992 0.999994993\t1\t0\t0.999949992\t1 1\n");
  EXPECT_EQ(Run(Dir() + " boost.flow --threshold 0", "0.9999 0.99999").out,
            "0.999949992 0.999994993\t0\t0\t0.999949992\t1 1\n");
}

TEST_F(ModelRun, DirectoryAndContainerAgreeWithTheEngine) {
  const std::string input = "1.5 7 2.5\n0 0 0\n3 1 0.5\nnan inf -inf\n";
  const CliRun fromDir = Run(Dir() + " web.flow", input);
  const CliRun fromKb = Run(Kb() + " web.flow", input);
  EXPECT_EQ(fromDir.status, 0);
  EXPECT_EQ(fromDir.out, fromKb.out);

  // The same lines, made in process from the same files.
  const loaders_misc::SimpleSolver solver(
      "web.flow", std::make_shared<pelmix::testing::PieceFileSystem>(kModel));
  const ap::ChannelConfig thresholds;  // 0.01 and 0
  std::istringstream lines(input);
  std::string expected, line;
  while (std::getline(lines, line)) {
    std::istringstream numbers(line);
    std::vector<float> features;
    for (std::string token; numbers >> token;) features.push_back(std::stof(token));
    std::vector<float> outputs;
    solver.model().calc(features, outputs);
    ASSERT_EQ(outputs.size(), 2u);
    const auto decision = solver.Solve(features, thresholds);
    char text[128];
    std::snprintf(text, sizeof text, "%.9g %.9g\t%d\t%d\t%.9g\t", outputs[0], outputs[1],
                  decision.detected, decision.outside_loud, decision.weight);
    expected += text + decision.annotation + "\n";
  }
  EXPECT_EQ(fromDir.out, expected);
}

TEST_F(ModelRun, LineErrorsAreReportedInPlace) {
  const CliRun run = Run(Dir() + " web.flow", "1 2\n1 x 3\n0.5 7 0\n");
  EXPECT_EQ(run.status, 1);
  std::istringstream lines(run.out);
  std::string line;
  ASSERT_TRUE(std::getline(lines, line));
  EXPECT_EQ(line, "error\tDeep solver flow enc reads features [0, 3) of an input of 2");
  ASSERT_TRUE(std::getline(lines, line));
  EXPECT_EQ(line, "error\tnot a number: x");
  ASSERT_TRUE(std::getline(lines, line));
  // The run went on: the third line is answered (two outputs, four decision fields).
  EXPECT_NE(line.rfind("error", 0), 0u) << line;
  EXPECT_EQ(std::count(line.begin(), line.end(), '\t'), 4) << line;
  EXPECT_FALSE(std::getline(lines, line));

  const CliRun longLine = Run(Dir() + " boost.flow", std::string(1 << 21, ' ') + "\n0.5 0.5\n");
  EXPECT_EQ(longLine.out,
            "error\tfeature line longer than 1048576 bytes\n0.25 0.25\t0\t0\t0.25\t.25 .25\n");
}

// Feature values read as the knowledge bases' numbers do: every spelling on the left gives
// the same answer as the plain one on the right; the words the models must cope with too.
TEST_F(ModelRun, NumbersReadAsTheEngineReadsThem) {
  const std::pair<const char*, const char*> same[] = {
      {"+0.25 +0.81", "0.25 0.81"},
      {"+.25 0.81e0", "0.25 0.81"},
      {"25e-2 81E-2", "0.25 0.81"},
      {"-0.5 +1", "-0.5 1"},
      {"NaN +Inf", "nan inf"},
      {"-INFINITY 0", "-inf 0"},
      {"- .", "0 0"},
      {"5e 2.", "5 2"},
      {"0.25\t\t0.81\r", "0.25 0.81"},
  };
  std::string spelled, plain;
  for (const auto& [a, b] : same) {
    spelled += std::string(a) + "\n";
    plain += std::string(b) + "\n";
  }
  const CliRun run = Run(Dir() + " boost.flow", spelled);
  EXPECT_EQ(run.status, 0) << run.out;
  EXPECT_EQ(run.out, Run(Dir() + " boost.flow", plain).out);
  EXPECT_EQ(run.out.find("error"), std::string::npos) << run.out;

  for (const char* bad : {"++1", "0x10", "1,5", "1e5.", "--1", "nanx", "1 2 three"}) {
    const CliRun refused = Run(Dir() + " boost.flow", std::string(bad) + "\n");
    EXPECT_EQ(refused.status, 1) << bad;
    EXPECT_EQ(refused.out.rfind("error\tnot a number: ", 0), 0u) << bad << ": " << refused.out;
  }
}

TEST_F(ModelRun, ConstructionErrorsStopTheRun) {
  CliRun run = Run(Dir() + " mail.flow", "1\n", true);
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.out, "pelmix: model run: Absent flow file mail.flow\n");
  Write("model/bad.flow", R"({"convs":{},"flow":[{"name":"a"}]})");
  run = Run(Dir() + " bad.flow", "1\n", true);
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.out,
            "pelmix: model run: Deep solver config error: Wrong number of parameters in flow\n");
  // Sources outside the directory are not reachable.
  Write("model/escape.flow",
        R"({"convs":{"r":{"type":"rules","src":"../model/r.rules"}},"flow":[]})");
  run = Run(Dir() + " escape.flow", "", true);
  EXPECT_EQ(run.out,
            "pelmix: model run: Deep solver config error: Absent conversion source "
            "../model/r.rules\n");
}

TEST_F(ModelRun, BadCommandLines) {
  for (const std::string& args :
       {std::string("web.flow"), Dir() + " " + Kb() + " web.flow", Dir(),
        Dir() + " web.flow --threshold", Dir() + " web.flow --threshold abc",
        Dir() + " web.flow --frob", Dir() + " web.flow boost.flow"}) {
    EXPECT_EQ(Run(args, "").status, 64) << args;
  }
  EXPECT_EQ(Run("--kb /nonexistent.kb web.flow", "").status, 1);
}

}  // namespace
