// The log lines of a long-running host (pelmixd, pelmix-milter), to stderr (journald adds the
// time): one line per call, "PROGRAM: LINE", whole even when threads write at once.
#pragma once

#include <string>

namespace pelmix::pelmixd {

// The program name the lines start with; "pelmixd" unless set (before any thread logs).
void SetLogName(std::string name);

void Log(const std::string& line);

}  // namespace pelmix::pelmixd
