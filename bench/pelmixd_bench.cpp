// pelmixd under load: requests per second over keep-alive connections and the latency
// percentiles, for a 4 KB login page and a 64 KB page, from 1 and 8 client threads. The
// daemon is the built one, started here on a free loopback port with the knowledge base of
// $PELMIX_BENCH_KB (the example one otherwise).
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <httplib.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "bench/html_pages.h"

namespace {

class Daemon {
 public:
  Daemon() {
    ::signal(SIGPIPE, SIG_IGN);
    const char* kb = std::getenv("PELMIX_BENCH_KB");
    std::string binary = PELMIXD_PATH, kbPath = kb != nullptr ? kb : PELMIX_EXAMPLE_KB;
    std::vector<std::string> args = {binary,        "--kb",      kbPath, "--listen",
                                     "127.0.0.1:0", "--threads", "8"};
    char log[] = "/tmp/pelmixd-bench-XXXXXX";
    const int fd = ::mkstemp(log);
    log_ = log;
    pid_ = ::fork();
    if (pid_ == 0) {
      ::dup2(fd, STDERR_FILENO);
      std::vector<char*> argv;
      for (std::string& arg : args) argv.push_back(arg.data());
      argv.push_back(nullptr);
      ::execv(argv[0], argv.data());
      ::_exit(127);
    }
    ::close(fd);
    for (int i = 0; i < 3000 && port_ == 0; ++i) {
      std::this_thread::sleep_for(std::chrono::milliseconds(10));
      std::ifstream in(log_);
      std::stringstream text;
      text << in.rdbuf();
      const std::string mark = "listening on 127.0.0.1:";
      const std::string s = text.str();
      if (const std::size_t at = s.find(mark);
          at != std::string::npos && s.find('\n', at) != s.npos) {
        port_ = std::stoi(s.substr(at + mark.size()));
      }
    }
  }
  ~Daemon() {
    if (pid_ > 0) {
      ::kill(pid_, SIGTERM);
      ::waitpid(pid_, nullptr, 0);
    }
    ::unlink(log_.c_str());
  }
  int Port() const { return port_; }

 private:
  pid_t pid_ = -1;
  int port_ = 0;
  std::string log_;
};

Daemon& Shared() {
  static Daemon daemon;
  return daemon;
}

const std::string& Page(std::size_t size) {
  static const std::string synthetic = bench_pages::SyntheticPage();
  static std::string small = synthetic.substr(0, 4 * 1024), medium = synthetic.substr(0, 64 * 1024);
  return size <= 4 * 1024 ? small : medium;
}

double Percentile(std::vector<double>& values, double p) {
  if (values.empty()) return 0;
  const std::size_t at = std::min(values.size() - 1, static_cast<std::size_t>(p * values.size()));
  std::nth_element(values.begin(), values.begin() + static_cast<std::ptrdiff_t>(at), values.end());
  return values[at];
}

// A message with a plain and an HTML part, the HTML being the first `size` bytes of the page.
const std::string& Message(std::size_t size) {
  static std::string messages[2];
  std::string& message = messages[size <= 4 * 1024 ? 0 : 1];
  if (message.empty()) {
    message =
        "From: Example Bank <service@examplebank.example.net>\r\nTo: you@example.org\r\n"
        "Subject: Your account has been suspended\r\nMIME-Version: 1.0\r\n"
        "Content-Type: multipart/alternative; boundary=\"b1\"\r\n\r\n--b1\r\n"
        "Content-Type: text/plain; charset=utf-8\r\n\r\nPlease verify your account at "
        "http://login-examplebank.example.net/verify\r\n--b1\r\n"
        "Content-Type: text/html; charset=utf-8\r\n\r\n" +
        Page(size) + "\r\n--b1--\r\n";
  }
  return message;
}

// Each iteration: every client thread sends kPerClient bodies over one keep-alive connection.
void Run(benchmark::State& state, const char* target, const std::string& page) {
  constexpr int kPerClient = 50;
  const int clients = static_cast<int>(state.range(1));
  const int port = Shared().Port();
  if (port == 0) {
    state.SkipWithError("pelmixd did not start");
    return;
  }
  std::vector<double> latencies;
  std::int64_t failures = 0;
  for (auto _ : state) {
    std::vector<std::vector<double>> times(static_cast<std::size_t>(clients));
    std::vector<int> failed(static_cast<std::size_t>(clients), 0);
    std::vector<std::thread> threads;
    for (int c = 0; c < clients; ++c) {
      threads.emplace_back([&, c] {
        httplib::Client client("127.0.0.1", port);
        client.set_keep_alive(true);
        client.set_tcp_nodelay(true);
        for (int i = 0; i < kPerClient; ++i) {
          const auto start = std::chrono::steady_clock::now();
          auto answer = client.Post(target, page, "text/html");
          times[static_cast<std::size_t>(c)].push_back(
              std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start)
                  .count());
          if (!answer || answer->status != 200) ++failed[static_cast<std::size_t>(c)];
        }
      });
    }
    for (std::thread& thread : threads) thread.join();
    for (int c = 0; c < clients; ++c) {
      latencies.insert(latencies.end(), times[static_cast<std::size_t>(c)].begin(),
                       times[static_cast<std::size_t>(c)].end());
      failures += failed[static_cast<std::size_t>(c)];
    }
  }
  state.SetItemsProcessed(state.iterations() * clients * kPerClient);
  state.SetBytesProcessed(state.iterations() * clients * kPerClient *
                          static_cast<std::int64_t>(page.size()));
  state.counters["p50_ms"] = Percentile(latencies, 0.50);
  state.counters["p90_ms"] = Percentile(latencies, 0.90);
  state.counters["p99_ms"] = Percentile(latencies, 0.99);
  state.counters["max_ms"] =
      latencies.empty() ? 0 : *std::max_element(latencies.begin(), latencies.end());
  state.counters["failed"] = static_cast<double>(failures);
}
void BM_PelmixdWeb(benchmark::State& state) {
  Run(state, "/v1/web?url=https%3A%2F%2Flogin.example.net%2F",
      Page(static_cast<std::size_t>(state.range(0))));
}
void BM_PelmixdMail(benchmark::State& state) {
  Run(state, "/v1/mail", Message(static_cast<std::size_t>(state.range(0))));
}
BENCHMARK(BM_PelmixdMail)
    ->ArgsProduct({{4 * 1024, 64 * 1024}, {1, 8}})
    ->ArgNames({"bytes", "clients"})
    ->UseRealTime()
    ->Unit(benchmark::kMillisecond);
BENCHMARK(BM_PelmixdWeb)
    ->ArgsProduct({{4 * 1024, 64 * 1024}, {1, 8}})
    ->ArgNames({"bytes", "clients"})
    ->UseRealTime()
    ->Unit(benchmark::kMillisecond);

}  // namespace
