// pelmix mail: messages, directories and mbox files judged through the module's mail
// sessions, with the exit statuses a mail administrator scripts against.
#include <gtest/gtest.h>

#include <algorithm>

#include "engine/features/feature_layout.h"
#include "tests/tools/pelmix/cli_runner.h"

namespace {

using pelmix::testing::RunCli;

class MailCommand : public pelmix::testing::CliTest {
 protected:
  static std::string Corpus() { return std::string(PELMIX_SOURCE_DIR) + "/tests/data/mail"; }
  static std::string Kb() { return std::string(" --kb ") + PELMIX_EXAMPLE_KB + " "; }
};

TEST_F(MailCommand, JudgesEveryMessageInOrderWhateverTheJobs) {
  const auto one = RunCli("mail" + Kb() + Corpus());
  const auto two = RunCli("mail --jobs 2" + Kb() + Corpus());
  EXPECT_EQ(one.out, two.out);
  EXPECT_EQ(one.status, 1) << one.err;  // the garbage file cannot be read as a message
  EXPECT_NE(one.out.find("/garbage.bin: error unreadable message"), std::string::npos);
  EXPECT_NE(one.out.find("/three.mbox#3: "), std::string::npos);
  EXPECT_NE(one.out.find("/alternative.eml: clean\n"), std::string::npos);
  // The forwarded message links to a host the knowledge base lists as phishing.
  EXPECT_NE(one.out.find("/forwarded.eml: PHISHING weight=1.000000 target="), std::string::npos);
  EXPECT_EQ(std::count(one.out.begin(), one.out.end(), '\n'), 13);
}

TEST_F(MailCommand, ExitStatusesAndJson) {
  const std::string clean = Corpus() + "/alternative.eml";
  EXPECT_EQ(RunCli("mail" + Kb() + clean).status, 0);
  EXPECT_EQ(RunCli("mail" + Kb() + Corpus() + "/forwarded.eml").status, 3);
  EXPECT_EQ(RunCli("mail" + Kb() + clean + " /nonexistent.eml").status, 1);
  EXPECT_EQ(RunCli("mail --kb /nonexistent.kb " + clean).status, 2);
  EXPECT_EQ(RunCli("mail").status, 64);
  EXPECT_EQ(RunCli("mail --level 4 " + clean).status, 64);
  EXPECT_EQ(RunCli("mail --features " + clean).status, 64);
  const auto json = RunCli("mail --json --features" + Kb() + "- < " + clean);
  ASSERT_EQ(json.status, 0) << json.err;
  EXPECT_EQ(json.out.rfind("{\"file\":\"-\",\"phishing\":false,\"quiet\":", 0), 0u) << json.out;
  const std::size_t open = json.out.find("\"features\":[");
  ASSERT_NE(open, std::string::npos);
  const std::string array = json.out.substr(open, json.out.find(']', open) - open);
  EXPECT_EQ(std::count(array.begin(), array.end(), ',') + 1,
            static_cast<long>(html_features::kMailVectorSize));
}

TEST_F(MailCommand, AnExecutableAttachmentReachesTheEngine) {
  const std::string message = Write(
      "exe.eml",
      "From: a@b.example\r\nTo: c@d.example\r\nSubject: Invoice\r\nMIME-Version: 1.0\r\n"
      "Content-Type: multipart/mixed; boundary=X\r\n\r\n--X\r\nContent-Type: text/plain\r\n\r\n"
      "See the attachment.\r\n--X\r\nContent-Type: application/octet-stream\r\n"
      "Content-Disposition: attachment; filename=\"INVOICE.EXE\"\r\n"
      "Content-Transfer-Encoding: base64\r\n\r\nTVqQAAMAAAAEAAAA\r\n--X--\r\n");
  const auto run = RunCli("mail --json --features" + Kb() + message);
  ASSERT_EQ(run.status, 0) << run.err;
  const std::size_t open = run.out.find("\"features\":[");
  ASSERT_NE(open, std::string::npos);
  // The first value of the link block: the dangerous-attachment feature.
  std::size_t at = open + 12;
  for (std::size_t i = 0; i < html_features::kMailPageVectorSize; ++i)
    at = run.out.find(',', at) + 1;
  EXPECT_EQ(run.out.substr(at, 2), "1,") << run.out.substr(at, 20);
}

}  // namespace
