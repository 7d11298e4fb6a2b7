// The milter itself: libmilter's callbacks over one connection after another, each message
// collected, judged at its end on the service current when it ended, and answered.
#pragma once

#include <string>

#include "tools/pelmix-milter/options.h"
#include "tools/pelmixd/service_holder.h"

namespace pelmix::milter {

// Registers the callbacks and opens the socket (an old unix socket file is replaced). Returns
// an empty string or why it failed. `services` and `options` must outlive Serve().
std::string Prepare(const Options& options, const pelmixd::ServiceHolder& services);

// libmilter's loop: returns when it is stopped (SIGTERM: true) or failed (false).
bool Serve();

}  // namespace pelmix::milter
