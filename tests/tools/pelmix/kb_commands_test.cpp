// The `pelmix kb` tools, run as a maintainer would run them.
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "tests/support/kb_test_support.h"

namespace {

namespace fs = std::filesystem;

struct Result {
  int status = -1;
  std::string out;
  std::string err;
};

class KbCommands : public ::testing::Test {
 protected:
  void SetUp() override {
    char pattern[] = "/tmp/pelmix-kb-XXXXXX";
    ASSERT_NE(::mkdtemp(pattern), nullptr);
    dir_ = pattern;
  }
  void TearDown() override { fs::remove_all(dir_); }

  std::string Path(const std::string& name) const { return (dir_ / name).string(); }

  void Write(const std::string& name, const std::string& bytes) const {
    fs::create_directories(fs::path(Path(name)).parent_path());
    std::ofstream(Path(name), std::ios::binary) << bytes;
  }

  std::string Slurp(const std::string& name) const {
    std::ifstream in(Path(name), std::ios::binary);
    std::ostringstream bytes;
    bytes << in.rdbuf();
    return bytes.str();
  }

  // Runs `pelmix ARGS` with stdout and stderr captured apart.
  Result Run(const std::string& args) const {
    const std::string err = Path("stderr.txt");
    const std::string command = std::string(PELMIX_CLI_PATH) + " " + args + " 2>" + err;
    Result result;
    FILE* pipe = ::popen(command.c_str(), "r");
    if (pipe == nullptr) return result;
    char buffer[4096];
    std::size_t n;
    while ((n = std::fread(buffer, 1, sizeof buffer, pipe)) > 0) result.out.append(buffer, n);
    const int status = ::pclose(pipe);
    result.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    result.err = Slurp("stderr.txt");
    return result;
  }

  fs::path dir_;
};

TEST_F(KbCommands, PackListCatVerifyAndConfigOfADirectory) {
  const std::string big(70000, 'b');
  const std::string cfg = "dbstamp=\"77\"\nweb_threshold = 0.05;\nmail_loud=1;\n";
  Write("kb/v3.cfg", cfg);
  Write("kb/models/web.flow", "{}");
  Write("kb/big", big);
  Write("kb/empty", "");

  const Result pack = Run("kb pack " + Path("out.kb") + " " + Path("kb"));
  ASSERT_EQ(pack.status, 0) << pack.err;

  const Result list = Run("kb list " + Path("out.kb"));
  EXPECT_EQ(list.status, 0);
  EXPECT_EQ(list.out, "big\t70000\nempty\t0\nmodels/web.flow\t2\nv3.cfg\t" +
                          std::to_string(cfg.size()) + "\n");

  EXPECT_EQ(Run("kb verify " + Path("out.kb")).out, "ok 4\n");
  EXPECT_EQ(Run("kb cat " + Path("out.kb") + " big").out, big);
  EXPECT_EQ(Run("kb cat " + Path("out.kb") + " models/web.flow").out, "{}");
  const Result empty = Run("kb cat " + Path("out.kb") + " empty");
  EXPECT_EQ(empty.status, 0);
  EXPECT_EQ(empty.out, "");
  const Result missing = Run("kb cat " + Path("out.kb") + " Big");
  EXPECT_EQ(missing.status, 1);
  EXPECT_EQ(missing.out, "");
  EXPECT_NE(missing.err.find("no entry Big"), std::string::npos) << missing.err;

  const Result config = Run("kb config " + Path("out.kb"));
  EXPECT_EQ(config.status, 0) << config.err;
  EXPECT_EQ(config.out,
            "dbstamp=77\n"
            "web_loud=0\nweb_loud_probability=0\nweb_threshold=0.0500000007\n"
            "web_threshold_loud=0\n"
            "mail_loud=1\nmail_loud_probability=0\nmail_threshold=0.00999999978\n"
            "mail_threshold_loud=0\n");
}

TEST_F(KbCommands, PackNamedFilesAndRefuseBadArguments) {
  Write("a.txt", "alpha");
  Write("b.txt", "beta");
  const Result pack = Run("kb pack " + Path("named.kb") + " first=" + Path("a.txt") +
                          " 'with space'=" + Path("b.txt"));
  ASSERT_EQ(pack.status, 0) << pack.err;
  EXPECT_EQ(Run("kb list " + Path("named.kb")).out, "first\t5\nwith space\t4\n");
  EXPECT_EQ(Run("kb cat " + Path("named.kb") + " 'with space'").out, "beta");

  EXPECT_EQ(Run("kb pack " + Path("x.kb") + " a=" + Path("a.txt") + " a=" + Path("b.txt")).status,
            1);
  EXPECT_EQ(Run("kb pack " + Path("x.kb") + " a=" + Path("nothing.txt")).status, 1);
  EXPECT_EQ(Run("kb pack " + Path("x.kb") + " " + Path("a.txt")).status, 64);
  EXPECT_EQ(Run("kb pack " + Path("x.kb")).status, 64);
  EXPECT_EQ(Run("kb list").status, 64);
}

TEST_F(KbCommands, VerifyReportsTheEnginesMessage) {
  Write("a", "first entry");
  Write("b", "second entry");
  ASSERT_EQ(Run("kb pack " + Path("good.kb") + " a=" + Path("a") + " b=" + Path("b")).status, 0);
  const std::string good = Slurp("good.kb");

  std::string body = good;
  body.back() ^= 1;
  Write("body.kb", body);
  Result verify = Run("kb verify " + Path("body.kb"));
  EXPECT_EQ(verify.status, 1);
  EXPECT_EQ(verify.out, "Control summ is invalid\n");
  EXPECT_EQ(Run("kb list " + Path("body.kb")).status, 1);

  std::string entry = good;
  entry.back() ^= 1;  // the last byte of "b"
  pelmix::testing::Reseal(entry);
  Write("entry.kb", entry);
  verify = Run("kb verify " + Path("entry.kb"));
  EXPECT_EQ(verify.status, 1);
  EXPECT_EQ(verify.out, "b: Failed to create ReadableFile crc error\n");
  EXPECT_EQ(Run("kb list " + Path("entry.kb")).status, 0) << "listing does not open entries";
  EXPECT_EQ(Run("kb cat " + Path("entry.kb") + " a").out, "first entry");
  EXPECT_EQ(Run("kb cat " + Path("entry.kb") + " b").status, 1);

  verify = Run("kb verify " + Path("absent.kb"));
  EXPECT_EQ(verify.status, 1);
  EXPECT_NE(verify.out.find("absent.kb"), std::string::npos) << verify.out;

  Write("short.kb", good.substr(0, 20));
  verify = Run("kb verify " + Path("short.kb"));
  EXPECT_EQ(verify.status, 1);
  EXPECT_EQ(verify.out.rfind("CheckFailedException at antiphishing_io_adapter.cpp:", 0), 0u)
      << verify.out;
}

TEST_F(KbCommands, ConfigFailures) {
  Write("cfg", "dbstamp=1;\nweb_threshold=0.05 ;\n");
  ASSERT_EQ(Run("kb pack " + Path("bad.kb") + " v3.cfg=" + Path("cfg")).status, 0);
  Result config = Run("kb config " + Path("bad.kb"));
  EXPECT_EQ(config.status, 1);
  EXPECT_EQ(config.out, "");
  EXPECT_NE(config.err.find("FloatParser: wrong fraction symbol"), std::string::npos) << config.err;

  ASSERT_EQ(Run("kb pack " + Path("none.kb") + " other=" + Path("cfg")).status, 0);
  config = Run("kb config " + Path("none.kb"));
  EXPECT_EQ(config.status, 1);
  EXPECT_NE(config.err.find("v3.cfg not found"), std::string::npos) << config.err;
}

}  // namespace
