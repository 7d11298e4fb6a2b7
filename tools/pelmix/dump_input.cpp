#include "tools/pelmix/dump_input.h"

#include <iostream>

#include "tools/pelmix/chunked_input.h"
#include "tools/pelmix/command.h"

namespace pelmix::cli {

int RunDumpOverInput(const std::string& command, const std::vector<std::string>& args,
                     const std::function<void(std::string_view)>& sink,
                     const std::function<void()>& finish) {
  ChunkedInputOptions options;
  std::vector<std::string> rest;
  std::string error;
  if (!ParseChunkedInput(args, &options, &rest, &error)) return UsageError(command + ": " + error);
  if (!rest.empty()) return UsageError(command + ": unexpected argument " + rest.front());
  const bool ok = ReadChunks(options, sink, &error);
  finish();
  std::cout.flush();
  if (!ok) {
    std::cerr << "pelmix: " << command << ": " << error << "\n";
    return kExitFailure;
  }
  return kExitOk;
}

}  // namespace pelmix::cli
