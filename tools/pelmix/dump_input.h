// Shared plumbing of the streaming dump commands: "[--chunk N] FILE|-" and nothing else.
#pragma once

#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace pelmix::cli {

// Parses the arguments, feeds the input chunk by chunk to `sink`, then calls `finish`.
// Returns kExitOk, kExitUsage for bad arguments, or kExitFailure (with a message on stderr)
// when the input cannot be read.
int RunDumpOverInput(const std::string& command, const std::vector<std::string>& args,
                     const std::function<void(std::string_view)>& sink,
                     const std::function<void()>& finish);

}  // namespace pelmix::cli
