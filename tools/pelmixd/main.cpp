// pelmixd: the anti-phishing module served over HTTP/JSON. It loads libpelmix.so, creates one
// service on the knowledge base, and judges each request in a session of its own.
#include <pthread.h>
#include <signal.h>

#include <chrono>
#include <iostream>
#include <thread>

#include "tools/pelmix/command.h"
#include "tools/pelmix/module_host.h"
#include "tools/pelmixd/log.h"
#include "tools/pelmixd/metrics.h"
#include "tools/pelmixd/options.h"
#include "tools/pelmixd/server.h"
#include "tools/pelmixd/service_holder.h"

namespace pelmix::pelmixd {
namespace {

constexpr int kExitUsage = 64;
constexpr int kExitStartup = 2;

double Seconds(std::chrono::system_clock::time_point when) {
  return std::chrono::duration<double>(when.time_since_epoch()).count();
}

void Published(const ServiceHolder& services, Metrics& metrics) {
  const auto current = services.Current();
  metrics.SetKnowledgeBase(current->dbstamp, Seconds(current->loadedAt));
}

int Run(int argc, char** argv) {
  Options options;
  const std::string error = ParseOptions({argv + 1, argv + argc}, options);
  if (!error.empty()) {
    std::cerr << "pelmixd: " << error << "\n" << Usage();
    return kExitUsage;
  }
  if (options.help) {
    std::cout << Usage();
    return 0;
  }
  // Signals are taken by one thread with sigwait; every other thread, the HTTP workers
  // included, inherits this mask. A peer that hangs up must not kill the process.
  sigset_t handled;
  sigemptyset(&handled);
  for (const int signal : {SIGHUP, SIGTERM, SIGINT}) sigaddset(&handled, signal);
  pthread_sigmask(SIG_BLOCK, &handled, nullptr);
  ::signal(SIGPIPE, SIG_IGN);

  ServingHost serving;
  if (const std::string startError = StartServing(options.module, options.kb, serving);
      !startError.empty()) {
    Log(startError);
    return kExitStartup;
  }
  cli::ModuleHost* host = serving.host.get();
  ServiceHolder& services = *serving.services;
  Metrics metrics;
  Published(services, metrics);

  Server server(options, services, metrics);
  std::string bindError;
  if (!server.Bind(&bindError)) {
    Log(bindError);
    return kExitStartup;
  }
  Log("listening on " + options.host + ":" + std::to_string(server.Port()));

  std::thread signals([&] {
    for (;;) {
      int signal = 0;
      if (sigwait(&handled, &signal) != 0) continue;
      if (signal == SIGHUP) {
        const std::string reloadError = services.Load();
        metrics.CountReload(reloadError.empty());
        // Lines the module traced outside any request (an old service going away).
        host->Host().tracer->Clear();
        if (reloadError.empty()) {
          Published(services, metrics);
          Log("reloaded " + options.kb + ", stamp " + std::to_string(services.Current()->dbstamp));
        } else {
          Log("reload failed, still serving the previous knowledge base: " + reloadError);
        }
        continue;
      }
      Log("stopping: finishing the requests in flight");
      server.Stop();
      return;
    }
  });
  const bool served = server.Run();
  // The listener can also end by itself (its socket failed); the signal thread then still
  // waits for a signal, so it is sent one.
  pthread_kill(signals.native_handle(), SIGTERM);
  signals.join();
  Log("stopped");
  return served ? 0 : 1;
}

}  // namespace
}  // namespace pelmix::pelmixd

int main(int argc, char** argv) { return pelmix::pelmixd::Run(argc, argv); }
