// pelmix dump page: every call the decrunch pipeline makes on its receiver and on the sinks
// the receiver hands out, whatever the chunk size.
#include <gtest/gtest.h>

#include "tests/tools/pelmix/cli_runner.h"

namespace {

using pelmix::testing::RunCli;

class DumpPageCommand : public pelmix::testing::CliTest {
 protected:
  std::string File(const std::string& content) { return Write("page.html", content); }
};

TEST_F(DumpPageCommand, EveryKindOfEventWhateverTheChunkSize) {
  const std::string path = File(
      "<title>T&amp;t</title><!--c--><meta name=description content=D><img src=i.png>"
      "<select><option>O</select><a href=/a>A</a><input type=text value=\"\xE9\">"
      "<script src=s.js>x=\"http://u.test/p\"</script>"
      "<meta content=\"0;url=data:,%3Cbr%3E\">");
  const pelmix::testing::CliRun run = RunCli("dump page " + path);
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.out,
            "{\"ev\":\"sink\",\"sink\":\"title\"}\n"
            "{\"ev\":\"text\",\"sink\":\"title\",\"data\":\"T&t\"}\n"
            "{\"ev\":\"end\",\"sink\":\"title\"}\n"
            "{\"ev\":\"sink\",\"sink\":\"comment\"}\n"
            "{\"ev\":\"text\",\"sink\":\"comment\",\"data\":\"c--\"}\n"
            "{\"ev\":\"end\",\"sink\":\"comment\"}\n"
            "{\"ev\":\"sink\",\"sink\":\"description\"}\n"
            "{\"ev\":\"text\",\"sink\":\"description\",\"data\":\"D\"}\n"
            "{\"ev\":\"end\",\"sink\":\"description\"}\n"
            "{\"ev\":\"url\",\"kind\":1,\"url\":\"i.png\"}\n"
            "{\"ev\":\"break\"}\n"
            "{\"ev\":\"break\"}\n"
            "{\"ev\":\"sink\",\"sink\":\"select\"}\n"
            "{\"ev\":\"break\",\"sink\":\"select\"}\n"
            "{\"ev\":\"text\",\"data\":\"O\"}\n"
            "{\"ev\":\"text\",\"sink\":\"select\",\"data\":\"O\"}\n"
            "{\"ev\":\"end\",\"sink\":\"select\"}\n"
            "{\"ev\":\"sink\",\"sink\":\"anchor\",\"href\":\"/a\"}\n"
            "{\"ev\":\"text\",\"data\":\"A\"}\n"
            "{\"ev\":\"text\",\"sink\":\"anchor\",\"data\":\"A\"}\n"
            "{\"ev\":\"end\",\"sink\":\"anchor\"}\n"
            "{\"ev\":\"input\",\"type\":\"text\",\"src\":\"\",\"value\":\"\\u00e9\"}\n"
            "{\"ev\":\"sink\",\"sink\":\"script\",\"href\":\"s.js\"}\n"
            "{\"ev\":\"text\",\"sink\":\"script\",\"data\":\"http://u.test/p\\\"\"}\n"
            "{\"ev\":\"script_url\",\"url\":\"u.test/p\"}\n"
            "{\"ev\":\"end\",\"sink\":\"script\"}\n"
            "{\"ev\":\"begin_nested\"}\n"
            "{\"ev\":\"break\"}\n"
            "{\"ev\":\"end_nested\"}\n"
            "{\"ev\":\"json\",\"accepted\":false}\n");
  EXPECT_EQ(RunCli("dump page --chunk 1 - < " + path).out, run.out);
  EXPECT_EQ(RunCli("dump page --chunk 5 " + path).out, run.out);
}

TEST_F(DumpPageCommand, JsonVerdictAndBadArguments) {
  EXPECT_EQ(RunCli("dump page " + File(" {\"a\": \"<b>x</b>\"} ")).out,
            "{\"ev\":\"json\",\"accepted\":true}\n");
  EXPECT_EQ(RunCli("dump page").status, 64);
  EXPECT_EQ(RunCli("dump page --chunk 0 " + Path("page.html")).status, 64);
  EXPECT_EQ(RunCli("dump page /nonexistent/page.html").status, 1);
}

}  // namespace
