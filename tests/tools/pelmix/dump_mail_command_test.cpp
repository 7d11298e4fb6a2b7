#include <gtest/gtest.h>

#include "tests/tools/mail/mail_test_support.h"
#include "tests/tools/pelmix/cli_runner.h"

namespace {

using pelmix::mail_test::CorpusPath;
using pelmix::testing::CliRun;
using pelmix::testing::RunCli;

TEST(DumpMailCommand, OneMessageAsJsonLines) {
  const CliRun run = RunCli("dump mail " + CorpusPath("rfc2231.eml"));
  EXPECT_EQ(run.status, 0) << run.err;
  EXPECT_EQ(run.out,
            "{\"ev\":\"message\",\"index\":1,\"bytes\":384}\n"
            "{\"ev\":\"subject\",\"depth\":0,\"data\":\"Invoice\"}\n"
            "{\"ev\":\"text\",\"type\":\"text/plain\",\"depth\":1,\"length\":19,"
            "\"head\":\"See the attachment.\"}\n"
            "{\"ev\":\"attachment\",\"name\":\"Rechnung f\\u00c3\\u00bcr M\\u00c3\\u00a4rz.exe\","
            "\"type\":\"application/octet-stream\",\"depth\":1,\"size\":32}\n"
            "{\"ev\":\"end\",\"parts\":3,\"links\":0,\"limits\":[],\"warnings\":[]}\n");
}

TEST(DumpMailCommand, MboxFromStdinGivesEveryMessage) {
  const CliRun run = RunCli("dump mail - < " + CorpusPath("three.mbox"));
  EXPECT_EQ(run.status, 0) << run.err;
  const std::string expected[] = {
      "{\"ev\":\"message\",\"index\":1,\"bytes\":97}\n",
      "{\"ev\":\"url\",\"data\":\"http://first.example/\"}\n",
      "{\"ev\":\"message\",\"index\":2,\"bytes\":112}\n",
      "{\"ev\":\"text\",\"type\":\"text/plain\",\"depth\":0,\"length\":41,"
      "\"head\":\"Second body with http://second.example/\\u000d\\u000a\"}\n",
      "{\"ev\":\"message\",\"index\":3,\"bytes\":77}\n",
      "{\"ev\":\"subject\",\"depth\":0,\"data\":\"Third\"}\n",
  };
  std::size_t at = 0;
  for (const std::string& line : expected) {
    const std::size_t found = run.out.find(line, at);
    ASSERT_NE(found, std::string::npos) << line << "\nin\n" << run.out;
    at = found + line.size();
  }
}

TEST(DumpMailCommand, LimitsWarningsAndHeads) {
  const CliRun truncated = RunCli("dump mail " + CorpusPath("truncated.eml"));
  EXPECT_EQ(truncated.status, 0);
  EXPECT_NE(truncated.out.find("\"limits\":[],\"warnings\":[\"truncated message\"]}\n"),
            std::string::npos);
  // A long text part shows its length and only its first 64 bytes.
  const CliRun html = RunCli("dump mail " + CorpusPath("latin1-html.eml"));
  EXPECT_NE(html.out.find("\"charset\":\"ISO-8859-1\",\"converted\":true,\"length\":150,\"head\":"
                          "\"<html><head><title>Caf\\u00c3\\u00a9</title></head><body><p>Bienvenue "
                          "\\u00c3\\u00a0 la \"}"),
            std::string::npos)
      << html.out;
}

class DumpMailFailures : public pelmix::testing::CliTest {};

TEST_F(DumpMailFailures, UnreadableMessagesAndBadInput) {
  // The unreadable message is reported and the others still go through; the exit says so.
  const std::string mbox = Write("m.mbox",
                                 "From a\nSubject: one\n\nx\n\nFrom b\n\x01\x02\x03\n\n"
                                 "From c\nSubject: three\n\ny\n");
  const CliRun run = RunCli("dump mail " + mbox);
  EXPECT_EQ(run.status, 1);
  EXPECT_NE(run.out.find("{\"ev\":\"error\",\"reason\":\"no message header found\""),
            std::string::npos);
  EXPECT_NE(run.out.find("{\"ev\":\"subject\",\"depth\":0,\"data\":\"three\"}"), std::string::npos);

  const CliRun garbage = RunCli("dump mail " + CorpusPath("garbage.bin"));
  EXPECT_EQ(garbage.status, 1);
  EXPECT_NE(garbage.out.find("\"ev\":\"error\""), std::string::npos);

  const CliRun directory = RunCli("dump mail " + dir_.string());
  EXPECT_EQ(directory.status, 1);
  EXPECT_EQ(directory.out, "");
  EXPECT_NE(directory.err.find("Is a directory"), std::string::npos);

  EXPECT_EQ(RunCli("dump mail /nonexistent/m.eml").status, 1);
  EXPECT_EQ(RunCli("dump mail").status, 64);
  EXPECT_EQ(RunCli("dump mail --bogus x").status, 64);
  EXPECT_EQ(RunCli("dump mail a b").status, 64);
}

}  // namespace
