// pelmixd's HTTP front: the routes, each request judged through a session of the service
// current when the request began, JSON answers and JSON errors, limits and timeouts.
#pragma once

#include <httplib.h>

#include <functional>
#include <memory>
#include <string>
#include <string_view>

#include "tools/pelmix/judging.h"
#include "tools/pelmixd/metrics.h"
#include "tools/pelmixd/options.h"
#include "tools/pelmixd/service_holder.h"

namespace pelmix::pelmixd {

// Accepted connections that may wait for a worker, per worker thread.
inline constexpr std::size_t kQueuedConnectionsPerThread = 64;

// Connections the kernel may hold for us before they are accepted.
inline constexpr int kListenBacklog = 1024;

class Server {
 public:
  Server(const Options& options, ServiceHolder& services, Metrics& metrics);

  // Binds the listening socket; returns false and fills `error` when it cannot.
  bool Bind(std::string* error);
  int Port() const { return port_; }
  // Serves until Stop(); requests already accepted are answered before it returns.
  bool Run();
  void Stop();

 private:
  void Web(const httplib::Request& request, httplib::Response& response,
           const httplib::ContentReader& reader);
  void Mail(const httplib::Request& request, httplib::Response& response,
            const httplib::ContentReader& reader);
  bool ReadBody(const httplib::ContentReader& reader, httplib::Response& response,
                const std::function<void(std::string_view)>& sink);
  void Judged(Endpoint endpoint, const cli::Judgement& result, httplib::Response& response);
  void White(const httplib::Request& request, httplib::Response& response);
  void Health(const httplib::Request& request, httplib::Response& response);

  const Options options_;
  ServiceHolder& services_;
  Metrics& metrics_;
  httplib::Server http_;
  int port_ = -1;
  int listener_ = -1;
};

}  // namespace pelmix::pelmixd
