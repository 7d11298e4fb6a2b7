#include "tools/pelmixd/log.h"

#include <cstdio>
#include <mutex>

namespace pelmix::pelmixd {

void Log(const std::string& line) {
  static std::mutex mutex;
  std::lock_guard<std::mutex> lock(mutex);
  std::fprintf(stderr, "pelmixd: %s\n", line.c_str());
  std::fflush(stderr);
}

}  // namespace pelmix::pelmixd
