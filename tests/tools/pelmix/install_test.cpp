// cmake --install into a fresh prefix, then the installed tree used as a user would: the CLI
// finds its module and knowledge base without options, even after the tree is moved, and a
// host compiles against the installed headers with the flags pkg-config gives.
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <string>
#include <utility>

namespace {

namespace fs = std::filesystem;

struct ShellRun {
  int status;
  std::string out;  // stdout and stderr
};

ShellRun Shell(const std::string& command) {
  ShellRun run{-1, {}};
  if (FILE* pipe = popen((command + " 2>&1").c_str(), "r")) {
    char buffer[4096];
    std::size_t n;
    while ((n = fread(buffer, 1, sizeof buffer, pipe)) > 0) run.out.append(buffer, n);
    const int status = pclose(pipe);
    run.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }
  return run;
}

std::string Quoted(const fs::path& path) { return "'" + path.string() + "'"; }

class Install : public ::testing::Test {
 protected:
  void SetUp() override {
    char pattern[] = "/tmp/pelmix-install-XXXXXX";
    ASSERT_NE(::mkdtemp(pattern), nullptr);
    root_ = pattern;
    const ShellRun installed = Shell(std::string(PELMIX_CMAKE_COMMAND) + " --install " +
                                     PELMIX_BINARY_DIR + " --prefix " + Quoted(root_ / "a"));
    ASSERT_EQ(installed.status, 0) << installed.out;
  }
  void TearDown() override { fs::remove_all(root_); }

  fs::path root_;
};

TEST_F(Install, InstalledCliFindsItsModuleAndKnowledgeBase) {
  const fs::path prefix = root_ / "a";
  for (const char* file :
       {"bin/pelmix", "lib/libpelmix.so", "share/pelmix/default.kb",
        "include/pelmix/framework/uvo/anti_phishing.h", "include/pelmix/framework/uvo/interfaces.h",
        "lib/pkgconfig/pelmix.pc", "share/pelmix/CREDITS.md"}) {
    EXPECT_TRUE(fs::is_regular_file(prefix / file)) << file;
  }
  // Nothing of the build tree is needed: the moved tree answers the same.
  for (const fs::path& where : {prefix, root_ / "moved"}) {
    if (where != prefix) fs::rename(prefix, where);
    const std::string cli = Quoted(where / "bin" / "pelmix");
    const ShellRun help = Shell(cli + " --help");
    EXPECT_EQ(help.status, 0) << help.out;
    EXPECT_NE(help.out.find((where / "lib" / "libpelmix.so").string()), std::string::npos)
        << help.out;
    const ShellRun version = Shell(cli + " version");
    EXPECT_EQ(version.status, 0) << version.out;
    // The default knowledge base lists PayPal's country domains; the lookalike stays out.
    const ShellRun white =
        Shell("env -u PELMIX_KB " + cli + " white paypal.com paypal.fr paypa1.com");
    EXPECT_EQ(white.status, 0) << white.out;
    EXPECT_EQ(white.out, "paypal.com\twhite\npaypal.fr\twhite\npaypa1.com\tnot white\n");
    const ShellRun verify = Shell(cli + " kb verify " + Quoted(where / "share/pelmix/default.kb"));
    EXPECT_EQ(verify.status, 0) << verify.out;
  }
}

TEST_F(Install, PkgConfigPointsIntoThePrefixAndTheHeadersStandAlone) {
  const fs::path prefix = root_ / "a";
  const std::string pkg =
      "PKG_CONFIG_PATH=" + Quoted(prefix / "lib" / "pkgconfig") + " pkg-config ";
  for (const auto& [variable, file] :
       {std::pair<std::string, std::string>{"module", "lib/libpelmix.so"},
        {"knowledgebase", "share/pelmix/default.kb"}}) {
    const ShellRun value = Shell(pkg + "--variable=" + variable + " pelmix");
    ASSERT_EQ(value.status, 0) << value.out;
    EXPECT_TRUE(fs::equivalent(value.out.substr(0, value.out.find('\n')), prefix / file))
        << variable << ": " << value.out;
  }
  const ShellRun cflags = Shell(pkg + "--cflags pelmix");
  ASSERT_EQ(cflags.status, 0) << cflags.out;
  // Each installed header compiles on its own with only those flags.
  for (const auto& entry : fs::directory_iterator(prefix / "include/pelmix/framework/uvo")) {
    const std::string header = entry.path().filename().string();
    const ShellRun compiled = Shell("echo '#include \"framework/uvo/" + header + "\"' | " +
                                    PELMIX_CXX_COMPILER + " -std=c++20 -fsyntax-only " +
                                    cflags.out.substr(0, cflags.out.find('\n')) + " -x c++ -");
    EXPECT_EQ(compiled.status, 0) << header << ": " << compiled.out;
  }
}

}  // namespace
