// pelmix white: a host round trip through the module's exports.
#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <string>

#include "tests/support/example_kb.h"
#include "tests/tools/pelmix/cli_runner.h"

namespace {

using pelmix::testing::CliRun;
using pelmix::testing::RunCli;

TEST(WhiteCommand, AnswersFromTheExampleKnowledgeBase) {
  const CliRun run = RunCli("white paypal.com www.paypal.co.uk paypal.fr login.examplebank.com");
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.out,
            "paypal.com\twhite\nwww.paypal.co.uk\twhite\npaypal.fr\tnot white\n"
            "login.examplebank.com\tnot white\n");
}

TEST(WhiteCommand, TraceShowsTheServiceBeingCreated) {
  const CliRun run = RunCli(std::string("--trace 600 white --kb ") + PELMIX_EXAMPLE_KB +
                                " examplebank.com",
                            true);
  EXPECT_EQ(run.status, 0);
  EXPECT_NE(run.out.find("anti_phishing_service\tcf::services::anti_phishing::heuristic::"
                         "AntiPhishingFactory::CreateAntiPhishingService anti-phishing service "
                         "instance created\n"),
            std::string::npos)
      << run.out;
  EXPECT_EQ(run.out.find("creating heuristic checker factory"), std::string::npos);  // 700
}

TEST(WhiteCommand, ServiceThatFailsToLoad) {
  const std::string path = ::testing::TempDir() + "white_no_v3cfg.kb";
  {
    std::ofstream out(path, std::ios::binary);
    out << service_test::Without("v3.cfg");
  }
  const CliRun run = RunCli("white --kb " + path + " paypal.com", true);
  std::remove(path.c_str());
  EXPECT_EQ(run.status, 2);
  EXPECT_NE(run.out.find("0x8000004b (Unspecified error)"), std::string::npos) << run.out;
  EXPECT_NE(run.out.find("anti_phishing_service\tcf::services::anti_phishing::heuristic::"
                         "AntiPhishingFactory::CreateAntiPhishingService: Configuration entry "
                         "v3.cfg not found"),
            std::string::npos)
      << run.out;
}

TEST(WhiteCommand, BadInput) {
  EXPECT_EQ(RunCli("white").status, 64);
  EXPECT_EQ(RunCli("white --kb").status, 64);
  EXPECT_EQ(RunCli("white --kb /nonexistent.kb paypal.com").status, 1);
}

}  // namespace
