// pelmixd's settings: each bound, the listen address forms, the config file and the order in
// which the file and the command line apply.
#include "tools/pelmixd/options.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <fstream>
#include <iterator>
#include <string>
#include <vector>

namespace {

using namespace pelmix::pelmixd;

TEST(PelmixdOptions, SettingsTheirBoundsAndErrors) {
  struct Case {
    std::string name, value;
    bool ok;
  };
  const std::vector<Case> cases = {
      {"threads", "1", true},
      {"threads", "256", true},
      {"threads", "0", false},
      {"threads", "257", false},
      {"threads", "4x", false},
      {"threads", "-1", false},
      {"max-body", "1", true},
      {"max-body", "1073741824", true},
      {"max-body", "0", false},
      {"max-body", "1073741825", false},
      {"read-timeout", "1", true},
      {"read-timeout", "3600", true},
      {"read-timeout", "0", false},
      {"write-timeout", "3601", false},
      {"keep-alive-timeout", "5", true},
      {"keep-alive-requests", "0", false},
      {"level", "3", true},
      {"level", "4", false},
      {"kb", "", false},
      {"kb", "/x.kb", true},
      {"listen", "127.0.0.1:0", true},
      {"listen", "[::1]:8639", true},
      {"listen", "127.0.0.1:65536", false},
      {"listen", "::1:80", false},
      {"listen", "8639", false},
      {"listen", ":80", false},
      {"color", "blue", false},
  };
  for (const Case& c : cases) {
    Options options;
    EXPECT_EQ(ApplySetting(c.name, c.value, options).empty(), c.ok) << c.name << "=" << c.value;
  }
  Options options;
  ASSERT_EQ(ApplySetting("listen", "[::1]:9000", options), "");
  EXPECT_EQ(options.host, "::1");
  EXPECT_EQ(options.port, 9000);
}

TEST(PelmixdOptions, DefaultsListenOnLoopback) {
  Options options;
  ASSERT_EQ(ParseOptions({}, options), "");
  EXPECT_EQ(options.host, "127.0.0.1");
  EXPECT_EQ(options.port, 8639);
}

TEST(PelmixdOptions, ConfigTextCommentsBlanksAndLineNumbers) {
  Options options;
  EXPECT_EQ(ApplyConfigText("# pelmixd\n\n  threads = 4   # workers\r\nmax-body=2048\n"
                            "listen = 127.0.0.1:9001\n",
                            options),
            "");
  EXPECT_EQ(options.threads, 4u);
  EXPECT_EQ(options.maxBody, 2048u);
  EXPECT_EQ(options.port, 9001);
  EXPECT_EQ(ApplyConfigText("threads = 4\njust words\n", options), "line 2: expected name = value");
  EXPECT_EQ(ApplyConfigText("\n\nthreads = 0\n", options).rfind("line 3: threads needs", 0), 0u);
}

TEST(PelmixdOptions, CommandLineOverridesTheConfigFile) {
  char path[] = "/tmp/pelmixd-conf-XXXXXX";
  const int fd = ::mkstemp(path);
  ASSERT_GE(fd, 0);
  ::close(fd);
  std::ofstream(path) << "threads = 3\nmax-body = 500\n";
  Options options;
  // --config comes after --threads on the command line, and still the command line wins.
  EXPECT_EQ(ParseOptions({"--threads", "5", "--config", path}, options), "");
  EXPECT_EQ(options.threads, 5u);
  EXPECT_EQ(options.maxBody, 500u);

  std::ofstream(path) << std::string(kMaxConfigBytes + 1, '#');
  Options big;
  EXPECT_NE(ParseOptions({"--config", path}, big).find("larger than"), std::string::npos);
  ::unlink(path);

  Options missing;
  EXPECT_NE(ParseOptions({"--config", "/nonexistent/pelmixd.conf"}, missing), "");
}

TEST(PelmixdOptions, BadCommandLines) {
  for (const std::vector<std::string>& args : std::vector<std::vector<std::string>>{
           {"--threads"}, {"--bogus", "1"}, {"stray"}, {"--config"}, {"--listen", "nowhere"}}) {
    Options options;
    EXPECT_NE(ParseOptions(args, options), "") << args[0];
  }
  Options options;
  EXPECT_EQ(ParseOptions({"--help"}, options), "");
  EXPECT_TRUE(options.help);
}

}  // namespace

namespace {

// The sample configuration shipped beside the unit file is one the daemon accepts.
TEST(PelmixdOptions, ShippedSampleConfigParses) {
  std::ifstream in(std::string(PELMIX_SOURCE_DIR) + "/tools/pelmixd/systemd/pelmixd.conf");
  ASSERT_TRUE(in);
  const std::string text((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  pelmix::pelmixd::Options options;
  EXPECT_EQ(pelmix::pelmixd::ApplyConfigText(text, options), "");
  EXPECT_EQ(options.host, "127.0.0.1");
  EXPECT_EQ(options.port, 8639);
}

}  // namespace
