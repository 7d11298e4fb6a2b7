// The pelmix CLI as a user runs it.
#include <gtest/gtest.h>

#include <string>

#include "tests/tools/pelmix/cli_runner.h"

namespace {

using pelmix::testing::CliRun;
using pelmix::testing::RunCli;

TEST(PelmixCli, VersionLoadsTheModuleNextToTheBinary) {
  const CliRun run = RunCli("version");
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.out.rfind("pelmix ", 0), 0u) << run.out;
  EXPECT_NE(run.out.find("libpelmix.so: ok"), std::string::npos) << run.out;
}

TEST(PelmixCli, MissingModuleIsReported) {
  const CliRun run = RunCli("--module /nonexistent/libpelmix.so version");
  EXPECT_EQ(run.status, 2);
  EXPECT_NE(run.out.find("/nonexistent/libpelmix.so"), std::string::npos) << run.out;
}

TEST(PelmixCli, HelpListsTheCommands) {
  const CliRun run = RunCli("--help");
  EXPECT_EQ(run.status, 0);
  EXPECT_NE(run.out.find("--trace LEVEL"), std::string::npos);
  EXPECT_NE(run.out.find("  version"), std::string::npos);
}

TEST(PelmixCli, BadCommandLines) {
  EXPECT_EQ(RunCli("").status, 64);
  EXPECT_EQ(RunCli("frobnicate").status, 64);
  EXPECT_EQ(RunCli("--trace").status, 64);
  EXPECT_EQ(RunCli("--trace high version").status, 64);
  EXPECT_EQ(RunCli("--bogus version").status, 64);
  EXPECT_EQ(RunCli("version extra").status, 64);
  const CliRun run = RunCli("frobnicate", true);
  EXPECT_NE(run.out.find("unknown command frobnicate"), std::string::npos) << run.out;
}

}  // namespace
