// Signals in pelmix-milter. libmilter runs a thread of its own that sigwait()s for SIGHUP,
// SIGTERM and SIGINT and stops the milter on any of them; here SIGHUP means "load the
// knowledge base again" instead. The binary is linked with --wrap=sigwait against a static
// libmilter, and the wrapper takes SIGHUP out of every set libmilter waits for, so its thread
// never receives one. With SIGHUP blocked in every thread, the only taker of a SIGHUP sent
// to the process is the reload thread's sigwaitinfo: which thread gets it does not depend on
// the kernel's choice among threads.
#pragma once

#include <signal.h>

#include <atomic>
#include <functional>
#include <thread>

namespace pelmix::milter {

// Blocks SIGHUP, SIGTERM and SIGINT in the calling thread; call it before any thread starts,
// so that all of them inherit the mask. A peer that hangs up must not kill the process, so
// SIGPIPE is ignored.
void BlockSignals();

// A thread that runs `reload` for every SIGHUP until Stop().
class ReloadThread {
 public:
  explicit ReloadThread(std::function<void()> reload);
  ~ReloadThread();
  ReloadThread(const ReloadThread&) = delete;
  ReloadThread& operator=(const ReloadThread&) = delete;

  void Stop();

 private:
  std::function<void()> reload_;
  std::thread thread_;
  std::atomic<bool> stopping_{false};
};

}  // namespace pelmix::milter
