// The service pelmixd judges with, and its replacement on reload. A request takes the current
// service once and keeps it to the end, so a reload never changes the knowledge base under a
// request in flight; the old service goes away with its last request. A new knowledge base
// is swapped in only when the module loaded it and judged a probe page with it.
#pragma once

#include <chrono>
#include <cstdint>
#include <memory>
#include <mutex>
#include <string>

#include "framework/uvo/anti_phishing.h"
#include "tools/pelmix/module_host.h"

namespace pelmix::pelmixd {

struct LoadedService {
  uvo::Ptr<cf::services::anti_phishing::IAntiPhishingService> service;
  uvo::Ptr<cf::services::anti_phishing::IHttpSessionFactory> web;
  uvo::Ptr<cf::services::anti_phishing::IMailSessionFactory> mail;
  std::string kbPath;
  std::int64_t dbstamp = 0;
  std::chrono::system_clock::time_point loadedAt;
};

class ServiceHolder {
 public:
  ServiceHolder(cli::ModuleHost& host, std::string kbPath);

  // Loads the knowledge base file again. On success the new service becomes current and the
  // result is empty; otherwise the current one stays and the result says why.
  std::string Load();

  // Null until the first successful Load().
  std::shared_ptr<const LoadedService> Current() const;

 private:
  cli::ModuleHost& host_;
  const std::string kbPath_;
  std::mutex loading_;  // one load at a time
  mutable std::mutex mutex_;
  std::shared_ptr<const LoadedService> current_;
};

// The module and a service on the knowledge base, started as every long-running host starts
// them: an empty `module` or `kb` is first set to the one next to the binary. Logs what it
// loaded; returns an empty string, or why it could not start.
struct ServingHost {
  std::unique_ptr<cli::ModuleHost> host;
  std::unique_ptr<ServiceHolder> services;
};
std::string StartServing(std::string& module, std::string& kb, ServingHost& out);

}  // namespace pelmix::pelmixd
