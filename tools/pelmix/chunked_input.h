// Input of the dump tools: a file or "-" for stdin, handed over in chunks of a chosen size
// (4096 bytes unless --chunk says otherwise), so that streaming scanners can be watched
// under any chunking.
#pragma once

#include <cstddef>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace pelmix::cli {

inline constexpr std::size_t kDefaultChunk = 4096;
// Larger chunks buy nothing and would let a typo allocate gigabytes.
inline constexpr std::size_t kMaxChunk = 64 * 1024 * 1024;

struct ChunkedInputOptions {
  std::size_t chunk = kDefaultChunk;
  std::string path;  // "-" for stdin
};

// Parses "[--chunk N] FILE|-" out of args, leaving other arguments in `rest`. Returns false
// and fills `error` when the arguments are bad.
bool ParseChunkedInput(const std::vector<std::string>& args, ChunkedInputOptions* options,
                       std::vector<std::string>* rest, std::string* error);

// Reads the input and calls `sink` for each chunk. Returns false and fills `error` when the
// input cannot be read.
bool ReadChunks(const ChunkedInputOptions& options,
                const std::function<void(std::string_view)>& sink, std::string* error);

}  // namespace pelmix::cli
