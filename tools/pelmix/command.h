// Subcommands of the pelmix CLI. Each lives in its own file and registers itself with
// PELMIX_COMMAND; main() only parses the global options and dispatches.
#pragma once

#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace pelmix::cli {

struct GlobalOptions {
  std::string modulePath;         // --module PATH
  std::optional<int> traceLevel;  // --trace LEVEL
};

// Exit codes shared by every subcommand.
inline constexpr int kExitOk = 0;
inline constexpr int kExitFailure = 1;  // the input or the question was bad
inline constexpr int kExitUsage = 64;   // the command line was bad
inline constexpr int kExitModule = 2;   // the module or the service could not be loaded

struct Command {
  std::string name;
  std::string usage;    // arguments after the name, for --help
  std::string summary;  // one line
  std::function<int(const std::vector<std::string>& args, const GlobalOptions& options)> run;
};

// Registers a command; returns true so that it can initialise a static.
bool RegisterCommand(Command command);
const std::vector<Command>& Commands();

// Prints "pelmix: " and the message to stderr; returns kExitUsage.
int UsageError(const std::string& message);

}  // namespace pelmix::cli

#define PELMIX_CLI_CONCAT_INNER(a, b) a##b
#define PELMIX_CLI_CONCAT(a, b) PELMIX_CLI_CONCAT_INNER(a, b)
#define PELMIX_COMMAND(...)                                              \
  namespace {                                                            \
  [[maybe_unused]] const bool PELMIX_CLI_CONCAT(registered_, __LINE__) = \
      ::pelmix::cli::RegisterCommand(__VA_ARGS__);                       \
  }
