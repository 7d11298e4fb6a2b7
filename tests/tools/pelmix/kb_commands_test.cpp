// The `pelmix kb` tools, run as a maintainer would run them.
#include <gtest/gtest.h>

#include "tests/support/kb_test_support.h"
#include "tests/tools/pelmix/cli_runner.h"

namespace {

using pelmix::testing::CliRun;
using pelmix::testing::RunCli;
using KbCommands = pelmix::testing::CliTest;

TEST_F(KbCommands, PackListCatVerifyAndConfigOfADirectory) {
  const std::string big(70000, 'b');
  const std::string cfg = "dbstamp=\"77\"\nweb_threshold = 0.05;\nmail_loud=1;\n";
  Write("kb/v3.cfg", cfg);
  Write("kb/models/web.flow", "{}");
  Write("kb/big", big);
  Write("kb/empty", "");
  const std::string kb = Path("out.kb");

  const CliRun pack = RunCli("kb pack " + kb + " " + Path("kb"));
  ASSERT_EQ(pack.status, 0) << pack.err;
  const CliRun list = RunCli("kb list " + kb);
  EXPECT_EQ(list.status, 0);
  EXPECT_EQ(list.out, "big\t70000\nempty\t0\nmodels/web.flow\t2\nv3.cfg\t" +
                          std::to_string(cfg.size()) + "\n");
  EXPECT_EQ(RunCli("kb verify " + kb).out, "ok 4\n");
  EXPECT_EQ(RunCli("kb cat " + kb + " big").out, big);
  const CliRun empty = RunCli("kb cat " + kb + " empty");
  EXPECT_EQ(empty.status, 0);
  EXPECT_EQ(empty.out, "");
  const CliRun missing = RunCli("kb cat " + kb + " Big");
  EXPECT_EQ(missing.status, 1);
  EXPECT_EQ(missing.out, "");
  EXPECT_NE(missing.err.find("no entry Big"), std::string::npos) << missing.err;

  const CliRun config = RunCli("kb config " + kb);
  EXPECT_EQ(config.status, 0) << config.err;
  EXPECT_EQ(config.out,
            "dbstamp=77\n"
            "web_loud=0\nweb_loud_probability=0\nweb_threshold=0.0500000007\n"
            "web_threshold_loud=0\n"
            "mail_loud=1\nmail_loud_probability=0\nmail_threshold=0.00999999978\n"
            "mail_threshold_loud=0\n");
}

TEST_F(KbCommands, PackNamedFilesAndRefuseBadArguments) {
  const std::string a = Write("a.txt", "alpha");
  const std::string b = Write("b.txt", "beta");
  const CliRun pack = RunCli("kb pack " + Path("named.kb") + " first=" + a + " 'with space'=" + b);
  ASSERT_EQ(pack.status, 0) << pack.err;
  EXPECT_EQ(RunCli("kb list " + Path("named.kb")).out, "first\t5\nwith space\t4\n");
  EXPECT_EQ(RunCli("kb cat " + Path("named.kb") + " 'with space'").out, "beta");

  const std::pair<std::string, int> refused[] = {
      {" a=" + a + " a=" + b, 1}, {" a=" + Path("nothing.txt"), 1}, {" " + a, 64}, {"", 64}};
  for (const auto& [sources, status] : refused) {
    EXPECT_EQ(RunCli("kb pack " + Path("x.kb") + sources).status, status) << sources;
  }
  EXPECT_EQ(RunCli("kb list").status, 64);
}

TEST_F(KbCommands, VerifyReportsTheEnginesMessage) {
  ASSERT_EQ(RunCli("kb pack " + Path("good.kb") + " a=" + Write("a", "first entry") +
                   " b=" + Write("b", "second entry"))
                .status,
            0);
  const std::string good = Slurp("good.kb");

  std::string body = good;
  body.back() ^= 1;
  CliRun verify = RunCli("kb verify " + Write("body.kb", body));
  EXPECT_EQ(verify.status, 1);
  EXPECT_EQ(verify.out, "Control summ is invalid\n");
  EXPECT_EQ(RunCli("kb list " + Path("body.kb")).status, 1);

  std::string entry = good;
  entry.back() ^= 1;  // the last byte of "b"
  pelmix::testing::Reseal(entry);
  verify = RunCli("kb verify " + Write("entry.kb", entry));
  EXPECT_EQ(verify.status, 1);
  EXPECT_EQ(verify.out, "b: Failed to create ReadableFile crc error\n");
  EXPECT_EQ(RunCli("kb list " + Path("entry.kb")).status, 0) << "listing does not open entries";
  EXPECT_EQ(RunCli("kb cat " + Path("entry.kb") + " a").out, "first entry");
  EXPECT_EQ(RunCli("kb cat " + Path("entry.kb") + " b").status, 1);

  verify = RunCli("kb verify " + Path("absent.kb"));
  EXPECT_EQ(verify.status, 1);
  EXPECT_NE(verify.out.find("absent.kb"), std::string::npos) << verify.out;

  verify = RunCli("kb verify " + Write("short.kb", good.substr(0, 20)));
  EXPECT_EQ(verify.status, 1);
  EXPECT_EQ(verify.out.rfind("CheckFailedException at antiphishing_io_adapter.cpp:", 0), 0u)
      << verify.out;
}

TEST_F(KbCommands, ConfigFailures) {
  const std::string cfg = Write("cfg", "dbstamp=1;\nweb_threshold=0.05 ;\n");
  const std::pair<std::string, std::string> cases[] = {
      {"v3.cfg", "FloatParser: wrong fraction symbol"}, {"other", "v3.cfg not found"}};
  for (const auto& [entry, message] : cases) {
    ASSERT_EQ(RunCli("kb pack " + Path("bad.kb") + " " + entry + "=" + cfg).status, 0);
    const CliRun config = RunCli("kb config " + Path("bad.kb"));
    EXPECT_EQ(config.status, 1);
    EXPECT_EQ(config.out, "");
    EXPECT_NE(config.err.find(message), std::string::npos) << config.err;
  }
}

}  // namespace
