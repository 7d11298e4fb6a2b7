// The model loaders on arbitrary bytes: a flow file, a rules file and a network file,
// separated by NUL bytes. Building may fail with any documented error; it must not crash,
// and a model that builds must calc or fail cleanly.
#include <cstddef>
#include <cstdint>
#include <exception>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "engine/kb/readable_buffer.h"
#include "engine/ml/deep_solver.h"

namespace {

class Files final : public ap::FileSystemI {
 public:
  std::map<std::string, std::string> files;
  std::shared_ptr<ap::ReadableFileI> open(const std::string& name) override {
    const auto it = files.find(name);
    if (it == files.end()) return nullptr;
    return std::make_shared<util::ReadableBuffer>(it->second.data(),
                                                  static_cast<std::uint32_t>(it->second.size()));
  }
  void enumerate(const std::function<void(const std::string&, std::uint64_t)>&) override {}
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string bytes(reinterpret_cast<const char*>(data), size);
  std::vector<std::string> parts(3);
  std::size_t part = 0;
  for (const char c : bytes) {
    if (c == '\0' && part < 2) {
      ++part;
    } else {
      parts[part] += c;
    }
  }
  auto files = std::make_shared<Files>();
  files->files["r"] = parts[1];
  files->files["n"] = parts[2];
  try {
    const ml::DeepSolver solver(parts[0], files);
    std::vector<float> input(64, 0.5f), output;
    solver.calc(input, output);
  } catch (const std::exception&) {
  }
  return 0;
}
