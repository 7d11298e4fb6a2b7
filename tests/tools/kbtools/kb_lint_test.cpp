// The lint of knowledge-base sources: each fault it exists for, on a small clean set, and the
// committed sources of the default and the example knowledge base (this is the CI lint).
#include "tools/kbtools/kb_lint.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <map>
#include <string>

#include "tests/tools/pelmix/cli_runner.h"

namespace {

namespace fs = std::filesystem;
using pelmix::kbtools::LintKnowledgeBaseSources;
using pelmix::kbtools::LintReport;

using Sources = std::map<std::string, std::string>;

Sources Clean() {
  return {{"orgs", "1 0\nBank One\n2 1\nMail Two\n"},
          {"white_domains.txt", "# id domain\n1 bankone.com\n2 mailtwo.com exact\n"},
          {"lexdb.txt", "#2 1 1 1 20\nsign(1)in 20 0 0\nbankone 50 1 0\npassword 30 0 1\n"},
          {"share_links.txt", "docs.mailtwo.com /forms\n"},
          {"categorised_hosts.txt", "phish.example 1 0x1\nsub.mailtwo.com 1\n"}};
}

class KbLint : public pelmix::testing::CliTest {
 protected:
  LintReport Lint(const Sources& sources) {
    fs::remove_all(dir_);
    fs::create_directories(dir_);
    for (const auto& [name, text] : sources) Write(name, text);
    return LintKnowledgeBaseSources(dir_);
  }

  static std::string Joined(const LintReport& report) {
    std::string all;
    for (const std::string& problem : report.problems) all += problem + "\n";
    return all;
  }
};

TEST_F(KbLint, CleanSourcesPass) {
  const LintReport report = Lint(Clean());
  EXPECT_TRUE(report.ok()) << Joined(report);
  EXPECT_EQ(report.organisations, 2u);
  EXPECT_EQ(report.white_domains, 2u);
  EXPECT_EQ(report.lexemes, 3u);
  EXPECT_EQ(report.share_links, 1u);
  EXPECT_EQ(report.categorised_hosts, 2u);  // a subdomain of an exact domain is not white
}

TEST_F(KbLint, EachFaultIsNamedWithItsLine) {
  const struct {
    const char* file;
    const char* text;  // nullptr: the file is left out
    const char* problem;
  } cases[] = {
      {"orgs", "2 0\nB\n1 1\nA\n", "orgs:3: id 1 is not above the one before it (2)"},
      {"orgs", "1 0\nA\n1 1\nB\n", "orgs:3: id 1 is not above the one before it (1)"},
      {"orgs", "1 12\nA\n2 1\nB\n", "orgs:1: the category of 1 is not 0 to 9"},
      {"orgs", "1 0\nA\n2 1\n", "orgs:3: organisation 2 has no name line"},
      {"orgs", "1 0\n\n2 1\nB\n", "orgs:2: organisation 1 has no name"},
      {"orgs", "1 0\nA\n2 1\nB\nx y\nC\n", "orgs:5: expected an organisation id"},
      {"orgs",
       "1 0\nA\n2 1\n"
       "BBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBBB\n",
       "orgs:4: the name of 2 is longer than 64 bytes"},
      {"white_domains.txt", "1 bankone.com\n3 other.com\n",
       "white_domains.txt:2: organisation 3 is not in orgs"},
      {"white_domains.txt", "1 bankone.com\n2 BankOne.com.\n",
       "white_domains.txt:2: domain bankone.com is listed twice (first on line 1)"},
      {"white_domains.txt", "1 bank_one.com\n", "the white domains do not compile"},
      {"lexdb.txt", "bankone 50 9 0\n", "lexdb.txt:1: bankone is bound to organisation 9"},
      {"lexdb.txt", "password 30 0 1\nPASSWORD 10 0 0\n",
       "lexdb.txt:2: password is listed twice (first on line 1)"},
      {"lexdb.txt", "password 30 0 1\nsign(1)in 20 0 0\n",
       "lexdb.txt:2: phrase sign(1)in comes after the first lexeme"},
      {"lexdb.txt", "password 30 0 1\n\nbankone 50 1 0\n", "lexdb.txt:2: an empty line"},
      {"lexdb.txt", "password\n", "lexdb.txt:1: a lexeme needs a blank"},
      {"share_links.txt", "docs.mailtwo.com /forms extra\n",
       "share_links.txt:1: a line holds one host and one path"},
      {"share_links.txt", "# shared\n", "share_links.txt:1: share links have no comments"},
      {"share_links.txt", "docs.mailtwo.com forms\n", "share_links.txt:1: path forms must start"},
      {"share_links.txt", "a.com /x\na.com /x\n", "share_links.txt:2: listed twice"},
      {"share_links.txt", nullptr, "share_links.txt: missing"},
      {"categorised_hosts.txt", "www.bankone.com 1\n",
       "categorised_hosts.txt:1: host www.bankone.com is white (organisation 1)"},
      {"categorised_hosts.txt", "mailtwo.com 1\n", "host mailtwo.com is white (organisation 2)"},
      {"categorised_hosts.txt", "a.example 1\nA.example 2\na.example/p/ 3\n",
       "categorised_hosts.txt:2: host a.example is listed twice"},
  };
  for (const auto& c : cases) {
    Sources sources = Clean();
    if (c.text == nullptr) {
      sources.erase(c.file);
    } else {
      sources[c.file] = c.text;
    }
    const LintReport report = Lint(sources);
    EXPECT_FALSE(report.ok()) << c.problem;
    EXPECT_NE(Joined(report).find(c.problem), std::string::npos)
        << "wanted: " << c.problem << "\ngot:\n"
        << Joined(report);
  }
}

TEST_F(KbLint, ProblemsBeyondTheLimitAreCountedNotKept) {
  Sources sources = Clean();
  std::string orgs = "100000 0\nFirst\n";
  for (int i = 1; i <= 300; ++i) orgs += std::to_string(i) + " 0\nName\n";
  sources["orgs"] = orgs;
  const LintReport report = Lint(sources);
  EXPECT_EQ(report.problems.size(), pelmix::kbtools::kMaxLintProblems);
  EXPECT_GT(report.problem_count, pelmix::kbtools::kMaxLintProblems);
}

TEST_F(KbLint, CommandPrintsProblemsAndFails) {
  Sources sources = Clean();
  sources["lexdb.txt"] = "bankone 50 9 0\n";
  Lint(sources);
  const auto failed = pelmix::testing::RunCli("kb lint " + dir_.string());
  EXPECT_EQ(failed.status, 1);
  EXPECT_EQ(failed.out,
            "lexdb.txt:1: bankone is bound to organisation 9, not in orgs\n1 problem\n");
  Lint(Clean());
  const auto clean = pelmix::testing::RunCli("kb lint " + dir_.string());
  EXPECT_EQ(clean.status, 0);
  EXPECT_EQ(clean.out,
            "ok: 2 organisations, 2 white domains, 3 lexemes and phrases, 1 share links, 2 "
            "categorised hosts\n");
  EXPECT_EQ(pelmix::testing::RunCli("kb lint").status, 64);
  EXPECT_EQ(pelmix::testing::RunCli("kb lint " + Path("none")).status, 1);
}

// The committed sources: what CI lints on every run.
TEST(KbLintSources, DefaultAndExampleKnowledgeBasesAreClean) {
  for (const char* dir : {"kb", "examples/kb"}) {
    const LintReport report = LintKnowledgeBaseSources(fs::path(PELMIX_SOURCE_DIR) / dir);
    std::string all;
    for (const std::string& problem : report.problems) all += problem + "\n";
    EXPECT_TRUE(report.ok()) << dir << ":\n" << all;
  }
}

}  // namespace
