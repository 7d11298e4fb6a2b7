// pelmix-milter: the anti-phishing module as a mail filter for Postfix and Sendmail. It loads
// libpelmix.so, creates one service on the knowledge base, and judges each message the MTA
// hands over in a mail session of its own, as `pelmix mail` judges a file.
#include <iostream>

#include "tools/pelmix-milter/milter.h"
#include "tools/pelmix-milter/options.h"
#include "tools/pelmix-milter/signals.h"
#include "tools/pelmix/module_host.h"
#include "tools/pelmixd/log.h"
#include "tools/pelmixd/service_holder.h"

namespace pelmix::milter {
namespace {

using pelmixd::Log;

constexpr int kExitUsage = 64;
constexpr int kExitStartup = 2;

int Run(int argc, char** argv) {
  pelmixd::SetLogName("pelmix-milter");
  Options options;
  const std::string usageError = ParseOptions({argv + 1, argv + argc}, options);
  if (!usageError.empty() || options.help) {
    if (!usageError.empty()) std::cerr << "pelmix-milter: " << usageError << "\n";
    (usageError.empty() ? std::cout : std::cerr) << Usage();
    return usageError.empty() ? 0 : kExitUsage;
  }

  BlockSignals();  // before any thread: every thread inherits the mask
  pelmixd::ServingHost serving;
  if (const std::string error = StartServing(options.module, options.kb, serving); !error.empty()) {
    Log(error);
    return kExitStartup;
  }
  pelmixd::ServiceHolder& services = *serving.services;
  if (const std::string error = Prepare(options, services); !error.empty()) {
    Log(error);
    return kExitStartup;
  }
  Log("listening on " + options.socket);

  ReloadThread reloads([&] {
    if (const std::string error = services.Load(); !error.empty()) {
      Log("reload failed, still serving the previous knowledge base: " + error);
    } else {
      Log("reloaded " + options.kb + ", stamp " + std::to_string(services.Current()->dbstamp));
    }
    // Lines the module traced outside any message (an old service going away).
    serving.host->Host().tracer->Clear();
  });
  const bool stopped = Serve();
  reloads.Stop();
  Log(stopped ? "stopped" : "stopped after a failure");
  return stopped ? 0 : 1;
}

}  // namespace
}  // namespace pelmix::milter

int main(int argc, char** argv) { return pelmix::milter::Run(argc, argv); }
