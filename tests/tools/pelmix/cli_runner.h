// Runs the built pelmix CLI the way a user does, for the CLI tests.
#pragma once

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>

namespace pelmix::testing {

struct CliRun {
  int status;       // exit code, -1 when the process did not exit normally
  std::string out;  // stdout (and stderr when asked)
  std::string err;  // stderr, when it was not merged into out
};

inline std::string SlurpFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::ostringstream bytes;
  bytes << in.rdbuf();
  return bytes.str();
}

// Runs a whole shell command line. Without `withStderr` the standard error is kept apart
// in `err`.
inline CliRun RunCommand(const std::string& commandLine, bool withStderr = false) {
  char err_path[] = "/tmp/pelmix-cli-err-XXXXXX";
  const int err_fd = withStderr ? -1 : ::mkstemp(err_path);
  const std::string redirect = withStderr   ? " 2>&1"
                               : err_fd < 0 ? " 2>/dev/null"
                                            : std::string(" 2>") + err_path;
  const std::string command = "{ " + commandLine + "; }" + redirect;
  CliRun run{-1, {}, {}};
  if (FILE* pipe = popen(command.c_str(), "r")) {
    char buffer[4096];
    std::size_t n;
    while ((n = fread(buffer, 1, sizeof buffer, pipe)) > 0) run.out.append(buffer, n);
    const int status = pclose(pipe);
    run.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }
  if (err_fd >= 0) {
    run.err = SlurpFile(err_path);
    ::close(err_fd);
    ::unlink(err_path);
  }
  return run;
}

// `args` is a shell fragment placed after the binary's path.
inline CliRun RunCli(const std::string& args, bool withStderr = false) {
  return RunCommand(std::string(PELMIX_CLI_PATH) + " " + args, withStderr);
}

// A fixture with a fresh directory of its own for the files a CLI test writes.
class CliTest : public ::testing::Test {
 protected:
  void SetUp() override {
    char pattern[] = "/tmp/pelmix-cli-XXXXXX";
    ASSERT_NE(::mkdtemp(pattern), nullptr);
    dir_ = pattern;
  }
  void TearDown() override { std::filesystem::remove_all(dir_); }

  std::string Path(const std::string& name) const { return (dir_ / name).string(); }

  // Writes `bytes` to `name` under the directory and returns its path.
  std::string Write(const std::string& name, const std::string& bytes) const {
    std::filesystem::create_directories(std::filesystem::path(Path(name)).parent_path());
    std::ofstream(Path(name), std::ios::binary) << bytes;
    return Path(name);
  }

  std::string Slurp(const std::string& name) const { return SlurpFile(Path(name)); }

  std::filesystem::path dir_;
};

}  // namespace pelmix::testing
