#include "tools/pelmixd/server.h"

#include <sys/socket.h>

#include <chrono>
#include <nlohmann/json.hpp>
#include <optional>

#include "host/tracer.h"
#include "tools/mail/mail_limits.h"
#include "tools/mail/message_buffer.h"
#include "tools/pelmix/mail_scan.h"
#include "tools/pelmix/page_scan.h"
#include "tools/pelmixd/bounded_pool.h"

namespace pelmix::pelmixd {
namespace {

using Clock = std::chrono::steady_clock;
// Keys in the order the API documents them.
using json = nlohmann::ordered_json;

constexpr char kJson[] = "application/json";
constexpr int kFailureLevel = 300;

// When the request on this worker thread began (its headers were read): set before routing,
// read when the answer has been written. One connection is one thread at a time.
thread_local std::optional<Clock::time_point> requestStart;

std::string Dump(const json& value) {
  // Targets and domains come from pages; bytes that are not UTF-8 are replaced, not refused.
  return value.dump(-1, ' ', false, json::error_handler_t::replace);
}

void Answer(httplib::Response& response, int status, const json& body) {
  response.status = status;
  response.set_content(Dump(body), kJson);
}

void Fail(httplib::Response& response, int status, const std::string& error) {
  Answer(response, status, json{{"error", error}});
}

// The protection level of a request: ?level=1|2|3, or the configured one.
bool LevelOf(const httplib::Request& request, int fallback, int& level) {
  if (!request.has_param("level")) {
    level = fallback;
    return true;
  }
  const std::string text = request.get_param_value("level");
  if (text.size() != 1 || text[0] < '1' || text[0] > '3') return false;
  level = text[0] - '0';
  return true;
}

// The HTTP layer reads a length it cannot parse as zero and takes the first of several, so
// the rest of such a body would be read as the next request. Those requests are refused.
const char* FramingError(const httplib::Request& request) {
  const std::size_t lengths = request.get_header_value_count("Content-Length");
  if (lengths == 0) return nullptr;
  if (request.has_header("Transfer-Encoding")) {
    return "a request has either a Content-Length or a Transfer-Encoding, not both";
  }
  const std::string first = request.get_header_value("Content-Length");
  for (std::size_t i = 0; i < lengths; ++i) {
    const std::string value = request.get_header_value("Content-Length", i);
    if (value.empty() || value.size() > 18 ||
        value.find_first_not_of("0123456789") != std::string::npos) {
      return "Content-Length is not a number";
    }
    if (value != first) return "conflicting Content-Length headers";
  }
  return nullptr;
}

const char* StatusText(int status) {
  switch (status) {
    case 400:
      return "bad request";
    case 404:
      return "no such endpoint";
    case 405:
      return "method not allowed";
    case 408:
      return "the request took too long";
    case 413:
      return "the body is larger than the limit";
    case 414:
      return "the request line is too long";
    case 415:
      return "unsupported content type";
    case 416:
      return "range not satisfiable";
    case 431:
      return "the request headers are too large";
    default:
      return status < 500 ? "the request was refused" : "internal error";
  }
}

}  // namespace

Server::Server(const Options& options, ServiceHolder& services, Metrics& metrics)
    : options_(options), services_(services), metrics_(metrics) {
  const std::size_t threads = options_.threads;
  http_.new_task_queue = [threads] {
    return new BoundedPool(threads, threads * kQueuedConnectionsPerThread);
  };
  // Headers and body leave in separate writes; without this, Nagle and delayed ACKs add
  // some 40 ms to every answer on a keep-alive connection.
  http_.set_tcp_nodelay(true);
  http_.set_socket_options([this](int socket) {
    httplib::default_socket_options(socket);
    listener_ = socket;
  });
  http_.set_payload_max_length(options_.maxBody);
  http_.set_read_timeout(options_.readTimeout, 0);
  http_.set_write_timeout(options_.writeTimeout, 0);
  http_.set_keep_alive_timeout(options_.keepAliveTimeout);
  http_.set_keep_alive_max_count(options_.keepAliveRequests);

  http_.set_pre_routing_handler(
      [this](const httplib::Request& request, httplib::Response& response) {
        requestStart = Clock::now();
        metrics_.EnterRequest();
        if (const char* error = FramingError(request)) {
          response.set_header("Connection", "close");
          Fail(response, 400, error);
          return httplib::Server::HandlerResponse::Handled;
        }
        return httplib::Server::HandlerResponse::Unhandled;
      });
  http_.set_logger([this](const httplib::Request& request, const httplib::Response& response) {
    double seconds = 0;
    if (requestStart) {
      seconds = std::chrono::duration<double>(Clock::now() - *requestStart).count();
      requestStart.reset();
      metrics_.LeaveRequest();
    }
    metrics_.CountRequest(EndpointOf(request.path), response.status, seconds);
  });
  // Every 4xx or 5xx answer is JSON, also those the HTTP layer makes by itself.
  http_.set_error_handler([](const httplib::Request&, httplib::Response& response) {
    if (response.body.empty()) Fail(response, response.status, StatusText(response.status));
  });
  http_.set_exception_handler([](const httplib::Request&, httplib::Response& response,
                                 std::exception_ptr) { Fail(response, 500, "internal error"); });

  http_.Post("/v1/web",
             [this](const httplib::Request& request, httplib::Response& response,
                    const httplib::ContentReader& reader) { Web(request, response, reader); });
  http_.Post("/v1/mail",
             [this](const httplib::Request& request, httplib::Response& response,
                    const httplib::ContentReader& reader) { Mail(request, response, reader); });
  http_.Get("/v1/white", [this](const httplib::Request& request, httplib::Response& response) {
    White(request, response);
  });
  http_.Get("/healthz", [this](const httplib::Request& request, httplib::Response& response) {
    Health(request, response);
  });
  http_.Get("/metrics", [this](const httplib::Request&, httplib::Response& response) {
    response.set_content(metrics_.Render(), "text/plain; version=0.0.4");
  });
}

bool Server::Bind(std::string* error) {
  if (options_.port == 0) {
    port_ = http_.bind_to_any_port(options_.host);
  } else if (http_.bind_to_port(options_.host, options_.port)) {
    port_ = options_.port;
  } else {
    port_ = -1;
  }
  if (port_ <= 0) {
    *error = "cannot listen on " + options_.host + ":" + std::to_string(options_.port);
    return false;
  }
  // The HTTP layer listens with a backlog of 5: a burst of clients connecting at once would
  // see SYNs dropped and retried a second later. Listening again only deepens the queue.
  if (listener_ >= 0) ::listen(listener_, kListenBacklog);
  return true;
}

bool Server::Run() { return http_.listen_after_bind(); }

void Server::Stop() { http_.stop(); }

namespace {

// Refused before its body was read: the connection cannot carry another request.
void Refuse(httplib::Response& response, int status, const std::string& error) {
  response.set_header("Connection", "close");
  Fail(response, status, error);
}

}  // namespace

// Reads the body in the chunks it arrives in, up to --max-body. Returns false after answering
// the request with the error.
bool Server::ReadBody(const httplib::ContentReader& reader, httplib::Response& response,
                      const std::function<void(std::string_view)>& sink) {
  std::size_t received = 0;
  bool tooLarge = false;
  const bool read = reader([&](const char* data, std::size_t length) {
    received += length;
    if (received > options_.maxBody) {
      tooLarge = true;
      return false;
    }
    sink({data, length});
    return true;
  });
  if (tooLarge || response.status == 413) {
    Refuse(response, 413,
           "the body is larger than the limit of " + std::to_string(options_.maxBody) + " bytes");
    return false;
  }
  if (!read) {
    Refuse(response, 400, "the body could not be read");
    return false;
  }
  return true;
}

void Server::Judged(Endpoint endpoint, const cli::Judgement& result, httplib::Response& response) {
  if (!result.error.empty()) {
    return Fail(response, 422, "the input could not be judged: " + result.error);
  }
  metrics_.CountVerdict(endpoint, result.phishing);
  Answer(response, 200,
         json{{"phishing", result.phishing},
              {"quiet", result.quiet},
              {"weight", result.weight},
              {"target", result.target},
              {"confidence", result.confidence},
              {"dbstamp", result.dbstamp}});
}

void Server::Web(const httplib::Request& request, httplib::Response& response,
                 const httplib::ContentReader& reader) {
  // Multipart bodies would need the form parser; the page is the body itself.
  if (request.is_multipart_form_data()) {
    return Refuse(response, 415, "send the page itself as the body, not a form");
  }
  if (!request.has_param("url") || request.get_param_value("url").empty()) {
    return Refuse(response, 400, "missing url: POST /v1/web?url=URL with the page as the body");
  }
  int level = 0;
  if (!LevelOf(request, options_.level, level)) {
    return Refuse(response, 400, "level needs 1, 2 or 3");
  }
  const std::shared_ptr<const LoadedService> service = services_.Current();
  cli::PageScanOptions scan;
  scan.level = level;
  cli::PageJudgement judgement(*service->web.Get(), request.get_param_value("url"), scan);
  if (!ReadBody(reader, response, [&](std::string_view chunk) { judgement.Append(chunk); })) {
    return;
  }
  Judged(Endpoint::kWeb, judgement.Finish(), response);
}

void Server::Mail(const httplib::Request& request, httplib::Response& response,
                  const httplib::ContentReader& reader) {
  if (request.is_multipart_form_data()) {
    return Refuse(response, 415, "send the message itself as the body, not a form");
  }
  int level = 0;
  if (!LevelOf(request, options_.level, level)) {
    return Refuse(response, 400, "level needs 1, 2 or 3");
  }
  const std::shared_ptr<const LoadedService> service = services_.Current();
  // The MIME parser needs the message whole. Past the message budget the bytes are skipped,
  // as the mail readers of the CLI skip them.
  mail::MessageBuffer message;
  message.index = 1;
  if (!ReadBody(reader, response, [&](std::string_view chunk) {
        message.inputBytes += chunk.size();
        const std::size_t room = mail::kMaxMessageBytes - message.size();
        if (chunk.size() > room) message.cut = true;
        message.Append(chunk.substr(0, std::min(room, chunk.size())));
      })) {
    return;
  }
  if (message.size() == 0) return Fail(response, 400, "the body is empty: send the message");
  cli::MailScanOptions scan;
  scan.level = level;
  Judged(Endpoint::kMail, cli::ScanMessage(*service->mail.Get(), message, scan), response);
}

void Server::White(const httplib::Request& request, httplib::Response& response) {
  if (!request.has_param("domain") || request.get_param_value("domain").empty()) {
    return Fail(response, 400, "missing domain: GET /v1/white?domain=D");
  }
  const std::string domain = request.get_param_value("domain");
  const std::shared_ptr<const LoadedService> service = services_.Current();
  host::Tracer::ThreadCapture capture(kFailureLevel);
  bool white = false;
  const uvo::result_t code = service->service->IsDomainWhite(domain.c_str(), &white);
  if (code < 0) {
    return Fail(response, 422, "the domain could not be looked up: " + cli::DescribeResult(code));
  }
  Answer(response, 200, json{{"domain", domain}, {"white", white}, {"dbstamp", service->dbstamp}});
}

void Server::Health(const httplib::Request&, httplib::Response& response) {
  const std::shared_ptr<const LoadedService> service = services_.Current();
  const auto loaded =
      std::chrono::duration_cast<std::chrono::seconds>(service->loadedAt.time_since_epoch())
          .count();
  Answer(response, 200,
         json{{"status", "ok"},
              {"kb", service->kbPath},
              {"dbstamp", service->dbstamp},
              {"loaded", loaded}});
}

}  // namespace pelmix::pelmixd
