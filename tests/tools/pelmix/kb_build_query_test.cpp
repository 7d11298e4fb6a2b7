// `pelmix kb build` and `pelmix kb query`, run as a maintainer runs them, on the example
// knowledge base and on sources written for the test.
#include <gtest/gtest.h>

#include "tests/tools/pelmix/cli_runner.h"

namespace {

namespace fs = std::filesystem;
using pelmix::testing::CliRun;
using pelmix::testing::RunCli;

class KbBuildQuery : public pelmix::testing::CliTest {
 protected:
  // Builds `source` into out.kb; the build must succeed.
  std::string Build(const std::string& source) const {
    const CliRun build = RunCli("kb build " + source + " " + Path("out.kb"));
    EXPECT_EQ(build.status, 0) << build.err;
    return Path("out.kb");
  }

  std::string Query(const std::string& kb, const std::string& question) const {
    const CliRun query = RunCli("kb query " + kb + " " + question);
    EXPECT_EQ(query.status, 0) << question << ": " << query.err;
    return query.out;
  }
};

TEST_F(KbBuildQuery, ExampleKnowledgeBase) {
  const std::string kb = Build(std::string(PELMIX_SOURCE_DIR) + "/examples/kb");
  const std::string list = RunCli("kb list " + kb).out;
  for (const char* entry :
       {"lexdb.txt\t", "orgs\t", "sb.db\t", "share_links.txt\t", "v3.cfg\t", "wdb\t"}) {
    EXPECT_NE(list.find(entry), std::string::npos) << entry;
  }
  EXPECT_EQ(list.find("white_domains.txt"), std::string::npos);
  EXPECT_EQ(list.find("categorised_hosts.txt"), std::string::npos);

  const std::pair<std::string, std::string> answers[] = {
      {"white paypal.com", "key=101 partial=0 other_suffix=0 white=1 category=1\n"},
      {"white www.PayPal.co.uk", "key=101 partial=0 other_suffix=0 white=1 category=1\n"},
      {"white paypal.fr", "key=101 partial=0 other_suffix=1 white=0 category=1\n"},
      {"white www.examplebank.com", "key=102 partial=1 other_suffix=0 white=0 category=2\n"},
      {"white evil.example", "key=0 partial=0 other_suffix=0 white=0 category=6\n"},
      {"org 103", "found=1 category=3\n"},
      {"org 5", "found=0 category=6\n"},
      {"categorised phish.example /login/form", "found=1 category=4 mask=5 no_paths=0\n"},
      {"categorised malware.example /", "found=1 category=7 mask=0 no_paths=1\n"},
      {"categorised unknown.example /", "found=0 category=0 mask=0 no_paths=0\n"},
      {"sharelink docs.example.com /share", "found=1\n"},
      {"sharelink docs.example.com /share/", "found=0\n"},
      {"lexeme PayPal", "paypal term=1 first=50 second=101 third=0\n"},
      {"lexeme \xD0\x9F\xD0\x90\xD0\xA0\xD0\x9E\xD0\x9B\xD0\xAC",
       "\xD0\xBF\xD0\xB0\xD1\x80\xD0\xBE\xD0\xBB\xD1\x8C term=3 first=30 second=0 third=1\n"},
      {"lexeme verify", "verify term=8388608 first=0 second=0 third=0\n"},
      {"lexeme nothing", "nothing found=0\n"},
  };
  for (const auto& [question, answer] : answers) EXPECT_EQ(Query(kb, question), answer);
}

// Empty text bases are packed as one line feed and load as empty sets; the container is
// not packed into itself when written inside the source directory.
TEST_F(KbBuildQuery, EmptyBasesLoadEmpty) {
  Write("src/white_domains.txt", "");
  Write("src/categorised_hosts.txt", "# none yet\n");
  Write("src/orgs", "");
  Write("src/lexdb.txt", "");
  Write("src/share_links.txt", "");
  Write("src/models/web.flow", "{}");
  const std::string kb = Path("src/out.kb");
  ASSERT_EQ(RunCli("kb build " + Path("src") + " " + kb).status, 0);
  const CliRun again = RunCli("kb build " + Path("src") + " " + kb);
  ASSERT_EQ(again.status, 0) << again.err;
  EXPECT_EQ(RunCli("kb list " + kb).out,
            "lexdb.txt\t1\nmodels/web.flow\t2\norgs\t1\nsb.db\t0\nshare_links.txt\t1\nwdb\t1\n");
  EXPECT_EQ(Query(kb, "white a.com"), "key=0 partial=0 other_suffix=0 white=0 category=6\n");
  EXPECT_EQ(Query(kb, "org 1"), "found=0 category=6\n");
  EXPECT_EQ(Query(kb, "sharelink a.com /"), "found=0\n");
  EXPECT_EQ(Query(kb, "lexeme a"), "a found=0\n");
  EXPECT_EQ(Query(kb, "categorised a.com /"), "found=0 category=0 mask=0 no_paths=0\n");
}

TEST_F(KbBuildQuery, BuildErrorsNameFileAndLine) {
  struct Case {
    std::string file, text, message;
  };
  const Case cases[] = {
      {"a/white_domains.txt", "1 good.com\n\n7 bad_domain.com\n",
       ":3: domain bad_domain.com has a character outside a-z 0-9 - .\n"},
      {"b/categorised_hosts.txt", "x.com/p 1\n",
       ":1: path for host x.com, which no earlier line names\n"},
      {"c/lexdb.txt", "word 1 1\nnoblank\n", ": invalid lexdb string 'noblank'\n"},
  };
  for (const Case& c : cases) {
    const std::string file = Write(c.file, c.text);
    const std::string source = fs::path(file).parent_path().string();
    const CliRun r = RunCli("kb build " + source + " " + source + ".kb");
    EXPECT_EQ(r.status, 1) << c.file;
    EXPECT_EQ(r.err, "pelmix: kb build: " + file + c.message);
    EXPECT_FALSE(fs::exists(source + ".kb"));
  }

  Write("d/white_domains.txt", "1 a.com\n");
  Write("d/wdb", "x");
  const CliRun r = RunCli("kb build " + Path("d") + " " + Path("d.kb"));
  EXPECT_EQ(r.status, 1);
  EXPECT_NE(r.err.find("entry wdb is given twice"), std::string::npos) << r.err;

  EXPECT_EQ(RunCli("kb build " + Path("missing") + " " + Path("e.kb")).status, 1);
  EXPECT_EQ(RunCli("kb build " + Path("a")).status, 64);
}

TEST_F(KbBuildQuery, QueryFailures) {
  Write("src/orgs", "1 1\nOne\n");
  const std::string kb = Build(Path("src"));
  // No "wdb": the white-domain object cannot be built, as the engine's load would fail.
  CliRun r = RunCli("kb query " + kb + " white a.com");
  EXPECT_EQ(r.status, 1);
  EXPECT_EQ(r.err, "pelmix: kb query: null pointer to readable in WhiteDomains\n");
  r = RunCli("kb query " + kb + " sharelink a.com /");
  EXPECT_EQ(r.err, "pelmix: kb query: null readable for tell\n");
  for (const char* bad : {"colour a", "org", "org x1", "categorised a.com"}) {
    EXPECT_EQ(RunCli("kb query " + kb + " " + bad).status, 64) << bad;
  }
}

}  // namespace
