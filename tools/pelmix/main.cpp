// pelmix: the command-line host of the anti-phishing module and its tools.
#include <unistd.h>

#include <algorithm>
#include <charconv>
#include <climits>
#include <cstdio>
#include <filesystem>
#include <iostream>

#include "tools/pelmix/command.h"
#include "tools/pelmix/module_host.h"

namespace pelmix::cli {
namespace {

std::vector<Command>& Registry() {
  static std::vector<Command> commands;
  return commands;
}

void PrintHelp(std::ostream& out) {
  out << "usage: pelmix [--module PATH] [--trace LEVEL] COMMAND [ARGS...]\n\n"
         "Global options:\n"
         "  --module PATH   the anti-phishing module to load (default: "
      << DefaultModulePath()
      << ")\n"
         "  --trace LEVEL   print the module's trace lines whose level is at or below LEVEL\n"
         "                  to stderr (300 failures, 600 service created, 700 messages)\n"
         "  --help          this text\n\nCommands:\n";
  std::vector<Command> commands = Commands();
  std::sort(commands.begin(), commands.end(),
            [](const Command& a, const Command& b) { return a.name < b.name; });
  for (const Command& command : commands) {
    std::string head = "  " + command.name + (command.usage.empty() ? "" : " " + command.usage);
    out << head << "\n      " << command.summary << "\n";
  }
}

bool ParseInt(const std::string& text, int* value) {
  const char* end = text.data() + text.size();
  auto [ptr, ec] = std::from_chars(text.data(), end, *value);
  return ec == std::errc() && ptr == end;
}

}  // namespace

bool RegisterCommand(Command command) {
  Registry().push_back(std::move(command));
  return true;
}

const std::vector<Command>& Commands() { return Registry(); }

int UsageError(const std::string& message) {
  std::cerr << "pelmix: " << message << "\n(see pelmix --help)\n";
  return kExitUsage;
}

}  // namespace pelmix::cli

int main(int argc, char** argv) {
  using namespace pelmix::cli;
  GlobalOptions options;
  options.modulePath = DefaultModulePath();
  int i = 1;
  for (; i < argc; ++i) {
    const std::string arg = argv[i];
    if (arg == "--help" || arg == "-h") {
      PrintHelp(std::cout);
      return kExitOk;
    }
    if (arg == "--module" || arg == "--trace") {
      if (i + 1 >= argc) return UsageError(arg + " needs a value");
      const std::string value = argv[++i];
      if (arg == "--module") {
        options.modulePath = value;
      } else {
        int level = 0;
        if (!ParseInt(value, &level)) return UsageError("--trace needs a whole number: " + value);
        options.traceLevel = level;
      }
      continue;
    }
    if (!arg.empty() && arg[0] == '-') return UsageError("unknown option " + arg);
    break;
  }
  if (i >= argc) {
    PrintHelp(std::cerr);
    return kExitUsage;
  }
  // A command's name may have several words ("kb pack", "dump tokens"): the longest
  // registered name that the next words spell wins.
  const Command* chosen = nullptr;
  std::size_t chosenWords = 0;
  for (const Command& command : Commands()) {
    std::string spelled;
    for (int w = i; w < argc; ++w) {
      if (w > i) spelled += ' ';
      spelled += argv[w];
      if (spelled == command.name && static_cast<std::size_t>(w - i + 1) > chosenWords) {
        chosen = &command;
        chosenWords = static_cast<std::size_t>(w - i + 1);
      }
      if (spelled.size() >= command.name.size()) break;
    }
  }
  const std::string name = argv[i];
  if (chosen != nullptr) {
    std::vector<std::string> args(argv + i + static_cast<int>(chosenWords), argv + argc);
    try {
      return chosen->run(args, options);
    } catch (const std::exception& e) {
      std::cerr << "pelmix " << chosen->name << ": " << e.what() << "\n";
      return kExitFailure;
    }
  }
  // A group word alone ("pelmix kb") lists the group's commands.
  bool group = false;
  for (const Command& command : Commands()) {
    if (command.name.rfind(name + " ", 0) == 0) {
      if (!group) std::cerr << "pelmix " << name << ": a subcommand is needed:\n";
      group = true;
      std::cerr << "  pelmix " << command.name << " " << command.usage << "\n";
    }
  }
  if (group) return kExitUsage;
  return UsageError("unknown command " + name);
}
