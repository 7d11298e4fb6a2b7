// pelmixd's own log lines, to stderr (journald adds the time): one line per call, whole even
// when threads write at once.
#pragma once

#include <string>

namespace pelmix::pelmixd {

void Log(const std::string& line);

}  // namespace pelmix::pelmixd
