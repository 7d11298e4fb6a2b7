// pelmix features and pelmix dump url: the page analysis as a user sees it.
#include <gtest/gtest.h>

#include <sstream>

#include "engine/features/feature_layout.h"
#include "tests/tools/pelmix/cli_runner.h"

namespace {

using pelmix::testing::RunCli;

class FeaturesCommand : public pelmix::testing::CliTest {};

std::vector<float> VectorOf(const std::string& json) {
  std::vector<float> values;
  const std::size_t open = json.find("\"vector\":[");
  if (open == std::string::npos) return values;
  std::istringstream in(json.substr(open + 10));
  float v;
  char sep = ',';
  while (sep == ',' && in >> v) {
    values.push_back(v);
    in >> sep;
  }
  return values;
}

TEST_F(FeaturesCommand, WebAndMailVectorsWhateverTheChunking) {
  const std::string page =
      Write("page.html",
            "<title>PayPal</title><p>Verify your account</p><br>"
            "<a href=\"https://www.paypal.com/\">www.paypal.com</a><br><input type=password>");
  const auto whole = RunCli(
      "features --kb " PELMIX_EXAMPLE_KB " --url https://paypal-login.example/signin " + page);
  ASSERT_EQ(whole.status, 0) << whole.err;
  EXPECT_NE(whole.out.find("\"target\":\"PayPal\",\"trusted\":false"), std::string::npos);
  const std::vector<float> web = VectorOf(whole.out);
  ASSERT_EQ(web.size(), html_features::kWebVectorSize);
  EXPECT_EQ(web[html_features::kTitleNamesOrg], 1.0f);
  const auto bytes = RunCli("features --kb " PELMIX_EXAMPLE_KB
                            " --chunk 1 --url https://paypal-login.example/signin " +
                            page);
  EXPECT_EQ(bytes.out, whole.out);

  const auto mail = RunCli("features --kb " PELMIX_EXAMPLE_KB " --mail " + page);
  ASSERT_EQ(mail.status, 0) << mail.err;
  EXPECT_EQ(VectorOf(mail.out).size(), html_features::kMailVectorSize);

  const auto named = RunCli("features --kb " PELMIX_EXAMPLE_KB
                            " --names --url "
                            "https://www.paypal.com/ " +
                            page);
  EXPECT_NE(named.out.find("157\ttitle_names_org\t1\n"), std::string::npos);
  EXPECT_NE(named.out.find("213\thost.class_change.9\t0\n"), std::string::npos);
  const auto trusted =
      RunCli("features --kb " PELMIX_EXAMPLE_KB " --url https://www.paypal.com/ " + page);
  EXPECT_NE(trusted.out.find("\"trusted\":true"), std::string::npos);
}

TEST_F(FeaturesCommand, BadInput) {
  EXPECT_EQ(RunCli("features --url").status, 64);
  EXPECT_EQ(RunCli("features --mail --url http://a/ x").status, 64);
  EXPECT_EQ(RunCli("features --kb /nonexistent.kb " + Write("p.html", "x")).status, 2);
  EXPECT_EQ(RunCli("features --kb " PELMIX_EXAMPLE_KB " /nonexistent.html").status, 1);
}

TEST_F(FeaturesCommand, DumpUrl) {
  const auto run = RunCli(
      "dump url --page https://www.paypal.com/ 'HTTPS://u:p@WWW.PayPal.COM:8443/a\\b?q' "
      "'//cdn.paypal.com/x' /rel 'javascript:alert(1)' 'http://192.168.0.1/'");
  ASSERT_EQ(run.status, 0) << run.err;
  EXPECT_EQ(run.out,
            "{\"url\":\"HTTPS://u:p@WWW.PayPal.COM:8443/a\\\\b?q\",\"host\":\"www.paypal.com\","
            "\"path\":\"/a/b?q\",\"class\":1,\"ip\":false,\"special_ip\":false,"
            "\"registrable\":\"paypal.com\",\"own_site\":true}\n"
            "{\"url\":\"//cdn.paypal.com/x\",\"host\":\"cdn.paypal.com\",\"path\":\"/x\","
            "\"class\":2,\"ip\":false,\"special_ip\":false,\"registrable\":\"paypal.com\","
            "\"own_site\":true}\n"
            "{\"url\":\"/rel\",\"host\":null,\"path\":null,\"class\":0,\"ip\":false,"
            "\"special_ip\":false,\"registrable\":null,\"own_site\":true}\n"
            "{\"url\":\"javascript:alert(1)\",\"host\":null,\"path\":null,\"class\":0,"
            "\"ip\":false,\"special_ip\":false,\"registrable\":null,\"own_site\":false}\n"
            "{\"url\":\"http://192.168.0.1/\",\"host\":\"192.168.0.1\",\"path\":\"/\","
            "\"class\":1,\"ip\":true,\"special_ip\":true,\"registrable\":\"192.168.0.1\","
            "\"own_site\":false}\n");
  EXPECT_EQ(RunCli("dump url").status, 64);
}

}  // namespace
