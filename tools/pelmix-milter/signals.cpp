#include "tools/pelmix-milter/signals.h"

#include <pthread.h>

extern "C" int __real_sigwait(const sigset_t* set, int* sig);

// libmilter's signal thread (and nothing else linked statically) calls this for sigwait.
extern "C" int __wrap_sigwait(const sigset_t* set, int* sig) {
  sigset_t without = *set;
  sigdelset(&without, SIGHUP);
  return __real_sigwait(&without, sig);
}

namespace pelmix::milter {

void BlockSignals() {
  sigset_t set;
  sigemptyset(&set);
  for (const int signal : {SIGHUP, SIGTERM, SIGINT}) sigaddset(&set, signal);
  pthread_sigmask(SIG_BLOCK, &set, nullptr);
  ::signal(SIGPIPE, SIG_IGN);
}

ReloadThread::ReloadThread(std::function<void()> reload) : reload_(std::move(reload)) {
  thread_ = std::thread([this] {
    sigset_t hup;
    sigemptyset(&hup);
    sigaddset(&hup, SIGHUP);
    for (;;) {
      if (sigwaitinfo(&hup, nullptr) < 0) continue;  // EINTR
      if (stopping_) return;
      reload_();
    }
  });
}

void ReloadThread::Stop() {
  if (!thread_.joinable()) return;
  stopping_ = true;
  pthread_kill(thread_.native_handle(), SIGHUP);  // to this thread only
  thread_.join();
}

ReloadThread::~ReloadThread() { Stop(); }

}  // namespace pelmix::milter
