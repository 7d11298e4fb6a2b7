// pelmix white: a host round trip through the module's exports.
#include <gtest/gtest.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <string>

#include "tests/support/example_kb.h"
#include "tests/tools/pelmix/cli_runner.h"

namespace {

using pelmix::testing::CliRun;
using pelmix::testing::CliTest;
using pelmix::testing::RunCli;
using pelmix::testing::RunCommand;

TEST(WhiteCommand, AnswersFromTheExampleKnowledgeBase) {
  const CliRun run = RunCli(std::string("white --kb ") + PELMIX_EXAMPLE_KB +
                            " paypal.com www.paypal.co.uk paypal.fr login.examplebank.com");
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.out,
            "paypal.com\twhite\nwww.paypal.co.uk\twhite\npaypal.fr\tnot white\n"
            "login.examplebank.com\tnot white\n");
}

TEST(WhiteCommand, TraceShowsTheServiceBeingCreated) {
  const CliRun run =
      RunCli(std::string("--trace 600 white --kb ") + PELMIX_EXAMPLE_KB + " examplebank.com", true);
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

// Which knowledge base a command uses without --kb. paypal.fr tells them apart: the default
// knowledge base lists it, the example one does not.
class DefaultKnowledgeBase : public CliTest {
 protected:
  // The CLI run from the test's own folder, with PELMIX_KB unset unless `kb` names one.
  CliRun White(const std::string& args, const std::string& kb = "",
               const std::string& binary = PELMIX_CLI_PATH) {
    const std::string env = kb.empty() ? "env -u PELMIX_KB " : "env PELMIX_KB='" + kb + "' ";
    return RunCommand("cd '" + dir_.string() + "' && " + env + binary + " white " + args, true);
  }
};

TEST_F(DefaultKnowledgeBase, BesideTheBuildTreeAndNeverFromTheCurrentDirectory) {
  Write("default.kb", "not a knowledge base");
  Write("example.kb", "not a knowledge base");
  const CliRun run = White("paypal.fr paypa1.com");
  EXPECT_EQ(run.status, 0) << run.out;
  EXPECT_EQ(run.out, "paypal.fr\twhite\npaypa1.com\tnot white\n");
}

TEST_F(DefaultKnowledgeBase, EnvironmentAndOptionOverrideIt) {
  EXPECT_EQ(White("paypal.fr", PELMIX_EXAMPLE_KB).out, "paypal.fr\tnot white\n");
  // --kb wins over the environment.
  EXPECT_EQ(White(std::string("--kb ") + PELMIX_DEFAULT_KB + " paypal.fr", PELMIX_EXAMPLE_KB).out,
            "paypal.fr\twhite\n");
  const CliRun missing = White("paypal.fr", Path("absent.kb"));
  EXPECT_EQ(missing.status, 1);
  EXPECT_NE(missing.out.find("absent.kb"), std::string::npos) << missing.out;
}

// An installed tree: PREFIX/bin/pelmix finds PREFIX/lib/libpelmix.so and
// PREFIX/share/pelmix/default.kb whatever the current directory.
TEST_F(DefaultKnowledgeBase, InstalledBesideTheBinary) {
  namespace fs = std::filesystem;
  const fs::path prefix = dir_ / "prefix";
  fs::create_directories(prefix / "bin");
  fs::create_directories(prefix / "lib");
  fs::copy_file(PELMIX_CLI_PATH, prefix / "bin" / "pelmix");
  fs::copy_file(PELMIX_MODULE_PATH, prefix / "lib" / "libpelmix.so");
  const std::string binary = (prefix / "bin" / "pelmix").string();

  // Nothing installed yet: a clear failure that says how to name one.
  const CliRun none = White("paypal.fr", "", binary);
  EXPECT_EQ(none.status, 1);
  EXPECT_NE(none.out.find("use --kb FILE or set PELMIX_KB"), std::string::npos) << none.out;

  fs::create_directories(prefix / "share" / "pelmix");
  fs::copy_file(PELMIX_EXAMPLE_KB, prefix / "share" / "pelmix" / "default.kb");
  const CliRun installed = White("paypal.fr paypal.com", "", binary);
  EXPECT_EQ(installed.status, 0) << installed.out;
  EXPECT_EQ(installed.out, "paypal.fr\tnot white\npaypal.com\twhite\n");
}

}  // namespace
