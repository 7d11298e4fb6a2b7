// Runs the built pelmix CLI the way a user does, for the CLI tests.
#pragma once

#include <sys/wait.h>

#include <cstdio>
#include <string>

namespace pelmix::testing {

struct CliRun {
  int status;       // exit code, -1 when the process did not exit normally
  std::string out;  // stdout (and stderr when asked)
};

// `args` is a shell fragment placed after the binary's path.
inline CliRun RunCli(const std::string& args, bool withStderr = false) {
  const std::string command =
      std::string(PELMIX_CLI_PATH) + " " + args + (withStderr ? " 2>&1" : " 2>/dev/null");
  CliRun run{-1, {}};
  FILE* pipe = popen(command.c_str(), "r");
  if (pipe == nullptr) return run;
  char buffer[4096];
  std::size_t n;
  while ((n = fread(buffer, 1, sizeof buffer, pipe)) > 0) run.out.append(buffer, n);
  const int status = pclose(pipe);
  run.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  return run;
}

}  // namespace pelmix::testing
