// The dump commands, run as the built CLI on files and on stdin.
#include <gtest/gtest.h>

#include "tests/tools/pelmix/cli_runner.h"

namespace {

using pelmix::testing::CliRun;
using pelmix::testing::RunCli;

class DumpCommands : public pelmix::testing::CliTest {
 protected:
  std::string File(const std::string& name, const std::string& content) {
    return Write(name, content);
  }
};

TEST_F(DumpCommands, TokensOnAFileWithEveryEventKind) {
  const std::string page = "x<P Class=\"a\\\"b\">\xE9<!-- c --><script>s(1)</script><br/></p><";
  const std::string path = File("page.html", page);
  const CliRun outcome = RunCli("dump tokens " + path);
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out,
            "{\"ev\":\"text\",\"data\":\"x\"}\n"
            "{\"ev\":\"open\",\"name\":\"p\"}\n"
            "{\"ev\":\"attr\",\"name\":\"class\"}\n"
            "{\"ev\":\"value\",\"data\":\"a\\\\\"}\n"
            "{\"ev\":\"attr\",\"name\":\"b\\\"\"}\n"
            "{\"ev\":\"tagend\"}\n"
            "{\"ev\":\"text\",\"data\":\"\\u00e9\"}\n"
            "{\"ev\":\"comment\",\"data\":\" c --\"}\n"
            "{\"ev\":\"comment_end\"}\n"
            "{\"ev\":\"open\",\"name\":\"script\"}\n"
            "{\"ev\":\"tagend\"}\n"
            "{\"ev\":\"script\",\"data\":\"s(1)\"}\n"
            "{\"ev\":\"close\",\"name\":\"script\"}\n"
            "{\"ev\":\"open\",\"name\":\"br\"}\n"
            "{\"ev\":\"tagend\"}\n"
            "{\"ev\":\"close\",\"name\":\"br\"}\n"
            "{\"ev\":\"close\",\"name\":\"p\"}\n");
  // The same events from stdin and whatever the chunk size.
  EXPECT_EQ(RunCli("dump tokens --chunk 1 - < " + path).out, outcome.out);
  EXPECT_EQ(RunCli("dump tokens --chunk 7 " + path).out, outcome.out);
}

TEST_F(DumpCommands, StringsJsonDataUrlAndEntity) {
  EXPECT_EQ(RunCli("dump strings " + File("s.js", "a = 'x\\ty' + b / 2; c = \"open")).out,
            "{\"ev\":\"text\",\"data\":\"x\"}\n"
            "{\"ev\":\"text\",\"data\":\"\\u0009\"}\n"
            "{\"ev\":\"text\",\"data\":\"y'\"}\n"
            "{\"ev\":\"text\",\"data\":\"open\"}\n");
  EXPECT_EQ(RunCli("dump json " + File("ok.json", "{\"a\": [1, true]}\n")).out,
            "{\"accepted\":true}\n");
  EXPECT_EQ(RunCli("dump json --chunk 2 " + File("bad.json", "[1 2]")).out,
            "{\"accepted\":false}\n");
  EXPECT_EQ(RunCli("dump dataurl - < " + File("u.txt", "'data:text/html;base64,PGI+aGk8L2I+'")).out,
            "{\"media_type\":\"text/html\",\"data\":\"<b>hi</b>\"}\n");
  EXPECT_EQ(RunCli("dump entity lt").out, "{\"ok\":true,\"data\":\"<\"}\n");
  EXPECT_EQ(RunCli("dump entity Lt").out, "{\"ok\":false}\n");
  EXPECT_EQ(RunCli("dump entity '#233'").out, "{\"ok\":true,\"data\":\"\\u00c3\\u00a9\"}\n");
}

TEST_F(DumpCommands, BadArgumentsAndInputs) {
  for (const char* bad :
       {"dump tokens", "dump tokens a b", "dump json --chunk 0 -", "dump entity"}) {
    EXPECT_EQ(RunCli(bad).status, 64) << bad;
  }
  EXPECT_EQ(RunCli("dump strings " + Path("missing.js")).status, 1);
}

}  // namespace
