#include "tools/pelmix/chunked_input.h"

#include <cerrno>
#include <charconv>
#include <cstdio>
#include <cstring>
#include <memory>

namespace pelmix::cli {

bool ParseChunkedInput(const std::vector<std::string>& args, ChunkedInputOptions* options,
                       std::vector<std::string>* rest, std::string* error) {
  std::vector<std::string> positional;
  for (std::size_t i = 0; i < args.size(); ++i) {
    if (args[i] == "--chunk") {
      if (i + 1 >= args.size()) {
        *error = "--chunk needs a size";
        return false;
      }
      const std::string& value = args[++i];
      std::size_t size = 0;
      auto [ptr, ec] = std::from_chars(value.data(), value.data() + value.size(), size);
      if (ec != std::errc() || ptr != value.data() + value.size() || size == 0 ||
          size > kMaxChunk) {
        *error = "--chunk needs a size from 1 to " + std::to_string(kMaxChunk) + ": " + value;
        return false;
      }
      options->chunk = size;
    } else if (args[i].size() > 1 && args[i][0] == '-') {
      rest->push_back(args[i]);
    } else {
      positional.push_back(args[i]);
    }
  }
  if (positional.empty()) {
    *error = "an input file (or - for stdin) is needed";
    return false;
  }
  options->path = positional.back();
  positional.pop_back();
  rest->insert(rest->end(), positional.begin(), positional.end());
  return true;
}

bool ReadChunks(const ChunkedInputOptions& options,
                const std::function<void(std::string_view)>& sink, std::string* error) {
  const bool useStdin = options.path == "-";
  std::FILE* file = useStdin ? stdin : std::fopen(options.path.c_str(), "rb");
  if (file == nullptr) {
    *error = options.path + ": " + std::strerror(errno);
    return false;
  }
  std::unique_ptr<char[]> buffer(new char[options.chunk]);
  bool ok = true;
  for (;;) {
    const std::size_t n = std::fread(buffer.get(), 1, options.chunk, file);
    if (n > 0) sink(std::string_view(buffer.get(), n));
    if (n < options.chunk) {
      if (std::ferror(file)) {
        *error = options.path + ": read error";
        ok = false;
      }
      break;
    }
  }
  if (!useStdin) std::fclose(file);
  return ok;
}

}  // namespace pelmix::cli
