#include "tools/pelmixd/log.h"

#include <cstdio>
#include <mutex>

namespace pelmix::pelmixd {
namespace {

std::string& Name() {
  static std::string name = "pelmixd";
  return name;
}

}  // namespace

void SetLogName(std::string name) { Name() = std::move(name); }

void Log(const std::string& line) {
  static std::mutex mutex;
  std::lock_guard<std::mutex> lock(mutex);
  std::fprintf(stderr, "%s: %s\n", Name().c_str(), line.c_str());
  std::fflush(stderr);
}

}  // namespace pelmix::pelmixd
