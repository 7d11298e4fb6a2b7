// pelmixd as a client sees it: the endpoints with real-looking pages, agreement with
// pelmix scan, bodies streamed in any chunking, limits, timeouts, malformed requests, reloads
// under load, draining on SIGTERM and a bounded load test. Every daemon is started here on a
// free loopback port.
#include <gtest/gtest.h>
#include <signal.h>

#include <atomic>
#include <cctype>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <nlohmann/json.hpp>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "tests/support/example_kb.h"
#include "tests/tools/pelmix/cli_runner.h"
#include "tests/tools/pelmixd/daemon_runner.h"

namespace {

using nlohmann::json;
using pelmix::testing::CliTest;
using pelmix::testing::Daemon;
using pelmix::testing::RawConnection;
using pelmix::testing::RunCli;

constexpr char kLoginPage[] =
    "<html><head><title>Sign in</title></head><body><form action=\"http://evil.example/p\">"
    "<input type=password name=pw></form><a href=\"https://www.paypal.com/\">PayPal</a>"
    "</body></html>";

const std::string& BankPage() {
  static const std::string page = [] {
    std::string text =
        "<!DOCTYPE html><html lang=en><head><meta charset=utf-8>"
        "<title>Example Bank - Online Banking Login</title>"
        "<link rel=icon href=\"https://www.examplebank.com/favicon.ico\">"
        "<script>var t = '<div>' + \"</scr\" + \"ipt>\"; document.title = t;</script>"
        "<style>body{font:12px Arial}</style></head><body>"
        "<div id=header><img src=\"https://www.examplebank.com/logo.png\" alt=\"Example Bank\">"
        "</div><h1>Verify your account</h1><p>Dear customer, your account has been suspended."
        " Please confirm your identity within 24 hours.</p>"
        "<form method=post action=\"https://login-examplebank.example.net/verify.php\">"
        "<label>User ID <input name=user></label><label>Password <input type=password "
        "name=pass></label><label>Card number <input name=card></label>"
        "<input type=submit value=\"Sign in\"></form><ul>";
    for (int i = 0; i < 200; ++i) {
      text += "<li><a href=\"https://www.examplebank.com/help/" + std::to_string(i) +
              "\">Help topic " + std::to_string(i) + " &amp; more</a></li>";
    }
    text += "</ul><!-- footer --><p>&copy; Example Bank</p></body></html>";
    return text;
  }();
  return page;
}

constexpr char kCleanPage[] =
    "<html><head><title>Recipes</title></head><body><h1>Bread</h1><p>Flour, water, salt."
    "</p><a href=\"/more\">more</a></body></html>";

std::string Kb() { return PELMIX_EXAMPLE_KB; }

// Percent-encodes everything but unreserved characters, for a URL inside a query.
std::string Escape(const std::string& text) {
  std::string out;
  for (const unsigned char c : text) {
    if (std::isalnum(c) || c == '-' || c == '.' || c == '_' || c == '~') {
      out += static_cast<char>(c);
    } else {
      char hex[4];
      std::snprintf(hex, sizeof hex, "%%%02X", c);
      out += hex;
    }
  }
  return out;
}

std::string Stamped(std::int64_t stamp) {
  service_test::Entries entries = service_test::ExampleEntries();
  std::string& config = entries.at("v3.cfg");
  const std::size_t at = config.find("dbstamp=");
  const std::size_t end = config.find(';', at);
  config.replace(at, end - at, "dbstamp=" + std::to_string(stamp));
  return service_test::Pack(entries);
}

class Pelmixd : public CliTest {
 protected:
  // Starts a daemon on a copy of the knowledge base, so that tests may replace the file.
  void Start(std::vector<std::string> args = {}) {
    kb_ = Write("served.kb", service_test::ReadFileBytes(Kb()));
    args.insert(args.begin(), {"--kb", kb_});
    ASSERT_TRUE(daemon_.Start(args)) << daemon_.Log();
  }

  json Post(httplib::Client& client, const std::string& url, const std::string& body,
            int expect = 200, const std::string& extra = "") {
    auto answer = client.Post(("/v1/web?url=" + Escape(url) + extra).c_str(), body, "text/html");
    if (!answer) {
      ADD_FAILURE() << "no answer: " << httplib::to_string(answer.error());
      return json();
    }
    EXPECT_EQ(answer->status, expect) << answer->body;
    EXPECT_EQ(answer->get_header_value("Content-Type"), "application/json");
    return json::parse(answer->body, nullptr, false);
  }

  Daemon daemon_;
  std::string kb_;
};

TEST_F(Pelmixd, JudgesPagesAnswersWhiteDomainsHealthAndMetrics) {
  Start();
  httplib::Client client = daemon_.Client();
  json verdict = Post(client, "http://phish.example/login/", kLoginPage);
  EXPECT_EQ(verdict["phishing"], true);
  EXPECT_EQ(verdict["quiet"], false);
  EXPECT_EQ(verdict["target"], "PayPal|c");
  EXPECT_EQ(verdict["dbstamp"], 20240611);
  // The documented order of the keys.
  auto raw = client.Post("/v1/web?url=http%3A%2F%2Fphish.example%2F", kLoginPage, "text/html");
  ASSERT_TRUE(raw);
  const nlohmann::ordered_json ordered = nlohmann::ordered_json::parse(raw->body);
  std::vector<std::string> keys;
  for (auto it = ordered.begin(); it != ordered.end(); ++it) keys.push_back(it.key());
  EXPECT_EQ(keys, (std::vector<std::string>{"phishing", "quiet", "weight", "target", "confidence",
                                            "dbstamp"}));
  verdict = Post(client, "https://www.paypal.com/", kLoginPage);
  EXPECT_EQ(verdict["phishing"], false);

  auto white = client.Get("/v1/white?domain=www.paypal.com");
  ASSERT_TRUE(white);
  EXPECT_EQ(json::parse(white->body)["white"], true);
  white = client.Get("/v1/white?domain=paypal.evil.example");
  ASSERT_TRUE(white);
  EXPECT_EQ(json::parse(white->body)["white"], false);

  auto health = client.Get("/healthz");
  ASSERT_TRUE(health);
  EXPECT_EQ(health->status, 200);
  EXPECT_EQ(json::parse(health->body)["dbstamp"], 20240611);

  auto metrics = client.Get("/metrics");
  ASSERT_TRUE(metrics);
  for (const char* line : {"pelmixd_requests_total{endpoint=\"web\",code=\"200\"} 3\n",
                           "pelmixd_verdicts_total{endpoint=\"web\",verdict=\"phishing\"} 2\n",
                           "pelmixd_verdicts_total{endpoint=\"web\",verdict=\"clean\"} 1\n",
                           "pelmixd_requests_total{endpoint=\"white\",code=\"200\"} 2\n",
                           "pelmixd_request_duration_seconds_count{endpoint=\"web\"} 3\n",
                           "pelmixd_kb_stamp 20240611\n"}) {
    EXPECT_NE(metrics->body.find(line), std::string::npos) << line << metrics->body;
  }
}

TEST_F(Pelmixd, AgreesWithPelmixScan) {
  Start();
  httplib::Client client = daemon_.Client();
  const std::vector<std::pair<std::string, std::string>> pages = {
      {"login", kLoginPage}, {"bank", BankPage()}, {"clean", kCleanPage}, {"empty", ""}};
  for (const auto& [name, page] : pages) {
    const std::string file = Write(name + ".html", page);
    for (const std::string url : {"http://phish.example/login/", "https://www.paypal.com/",
                                  "http://login-examplebank.example.net/verify.php"}) {
      for (int level = 1; level <= 3; ++level) {
        const auto run = RunCli("scan --json --kb " + Kb() + " --level " + std::to_string(level) +
                                " --url " + url + " " + file);
        const json cli = json::parse(run.out, nullptr, false);
        const json served = Post(client, url, page, 200, "&level=" + std::to_string(level));
        ASSERT_FALSE(cli.is_discarded()) << run.out << run.err;
        for (const char* key : {"phishing", "quiet", "target", "confidence", "dbstamp"}) {
          EXPECT_EQ(served[key], cli[key]) << name << " " << url << " " << level << " " << key;
        }
        char weight[32];
        std::snprintf(weight, sizeof weight, "%.9g", served["weight"].get<double>());
        EXPECT_EQ(weight, cli["weight"].dump()) << name << " " << url << " " << level;
      }
    }
  }
}

// Messages are parsed with the same MIME walk as pelmix mail and get the same judgement.
TEST_F(Pelmixd, MailAgreesWithPelmixMail) {
  Start();
  httplib::Client client = daemon_.Client();
  int phishing = 0;
  for (const auto& entry : std::filesystem::directory_iterator(PELMIX_MAIL_DATA_DIR)) {
    const std::string file = entry.path().string();
    if (entry.path().extension() != ".eml") continue;
    const std::string message = service_test::ReadFileBytes(file);
    for (int level = 1; level <= 3; level += 2) {
      const auto run =
          RunCli("mail --json --kb " + Kb() + " --level " + std::to_string(level) + " " + file);
      const json cli = json::parse(run.out, nullptr, false);
      ASSERT_FALSE(cli.is_discarded()) << file << run.out << run.err;
      auto answer = client.Post(("/v1/mail?level=" + std::to_string(level)).c_str(), message,
                                "message/rfc822");
      ASSERT_TRUE(answer);
      if (cli.contains("error")) {
        EXPECT_EQ(answer->status, 422) << file;
        continue;
      }
      ASSERT_EQ(answer->status, 200) << file << answer->body;
      const json served = json::parse(answer->body);
      for (const char* key : {"phishing", "quiet", "target", "confidence", "dbstamp"}) {
        EXPECT_EQ(served[key], cli[key]) << file << " " << level << " " << key;
      }
      char weight[32];
      std::snprintf(weight, sizeof weight, "%.9g", served["weight"].get<double>());
      EXPECT_EQ(weight, cli["weight"].dump()) << file;
      phishing += served["phishing"] == true;
    }
  }
  EXPECT_GT(phishing, 0) << "no phishing message among the samples: the comparison is weak";
  // What is not a message, or nothing at all.
  auto answer = client.Post(
      "/v1/mail", service_test::ReadFileBytes(std::string(PELMIX_MAIL_DATA_DIR) + "/garbage.bin"),
      "message/rfc822");
  ASSERT_TRUE(answer);
  EXPECT_EQ(answer->status, 422) << answer->body;
  answer = client.Post("/v1/mail", "", "message/rfc822");
  ASSERT_TRUE(answer);
  EXPECT_EQ(answer->status, 400) << answer->body;
  auto metrics = client.Get("/metrics");
  ASSERT_TRUE(metrics);
  EXPECT_NE(metrics->body.find("pelmixd_verdicts_total{endpoint=\"mail\",verdict=\"phishing\"} " +
                               std::to_string(phishing) + "\n"),
            std::string::npos);
}

// The body goes into the session as it arrives: any chunking gives the verdict of the whole.
TEST_F(Pelmixd, ChunkedBodiesGiveTheVerdictOfTheWholePage) {
  Start();
  httplib::Client client = daemon_.Client();
  const std::string& page = BankPage();
  const std::string url = "/v1/web?url=" + Escape("http://login-examplebank.example.net/");
  const json whole = Post(client, "http://login-examplebank.example.net/", page);
  std::mt19937 random(19);
  for (const std::size_t fixed : {std::size_t{1}, std::size_t{0}}) {
    auto answer = client.Post(
        url.c_str(),
        [&](std::size_t offset, httplib::DataSink& sink) {
          if (offset >= page.size()) {
            sink.done();
            return true;
          }
          const std::size_t size =
              fixed != 0 ? fixed : std::uniform_int_distribution<std::size_t>(1, 700)(random);
          sink.write(page.data() + offset, std::min(size, page.size() - offset));
          return true;
        },
        "text/html");
    ASSERT_TRUE(answer);
    ASSERT_EQ(answer->status, 200) << answer->body;
    EXPECT_EQ(json::parse(answer->body), whole) << "chunk " << fixed;
  }
}

TEST_F(Pelmixd, RefusesBadRequestsWithJsonErrors) {
  Start();
  httplib::Client client = daemon_.Client();
  struct Case {
    std::string method, target, contentType;
    int status;
  };
  const std::vector<Case> cases = {
      {"POST", "/v1/web", "text/html", 400},
      {"POST", "/v1/web?url=", "text/html", 400},
      {"POST", "/v1/web?url=http%3A%2F%2Fa%2F&level=4", "text/html", 400},
      {"POST", "/v1/web?url=http%3A%2F%2Fa%2F&level=x", "text/html", 400},
      {"POST", "/v1/web?url=http%3A%2F%2Fa%2F", "multipart/form-data; boundary=x", 415},
      {"GET", "/v1/web?url=http%3A%2F%2Fa%2F", "", 404},
      {"GET", "/v1/white", "", 400},
      {"POST", "/v1/mail?level=0", "message/rfc822", 400},
      {"POST", "/v1/mail", "multipart/form-data; boundary=x", 415},
      {"GET", "/nothing/here", "", 404},
      {"POST", "/healthz", "text/plain", 404},
  };
  for (const Case& c : cases) {
    httplib::Request request;
    request.method = c.method;
    request.path = c.target;
    if (!c.contentType.empty()) {
      request.set_header("Content-Type", c.contentType);
      request.body = "--x\r\n\r\n<html></html>";
    }
    auto answer = client.send(request);
    ASSERT_TRUE(answer) << c.target;
    EXPECT_EQ(answer->status, c.status) << c.method << " " << c.target;
    const json error = json::parse(answer->body, nullptr, false);
    EXPECT_TRUE(error.contains("error")) << c.target << ": " << answer->body;
  }
  // Still serving after all of them.
  EXPECT_EQ(Post(client, "http://phish.example/login/", kLoginPage)["phishing"], true);
}

TEST_F(Pelmixd, MalformedRequestsAreRefusedAndTheServiceGoesOn) {
  Start({"--keep-alive-timeout", "1"});
  const std::string post = "POST /v1/web?url=http://a/ HTTP/1.1\r\nHost: x\r\n";
  const std::vector<std::string> requests = {
      "NONSENSE\r\n\r\n",
      post + "Content-Length: ten\r\n\r\n<html>",
      post + "Content-Length: 6\r\nContent-Length: 60\r\n\r\n<html>",
      post + "Content-Length: -1\r\n\r\n<html>",
      post + "Content-Length: 6\r\nTransfer-Encoding: chunked\r\n\r\n6\r\n<html>\r\n0\r\n\r\n",
      post + "Transfer-Encoding: chunked\r\n\r\nzz\r\nhello\r\n0\r\n\r\n",
      "GET /" + std::string(20000, 'a') + " HTTP/1.1\r\nHost: x\r\n\r\n",
      "GET /healthz HTTP/1.1\r\nHost: x\r\nX-Big: " + std::string(20000, 'b') + "\r\n\r\n",
  };
  for (const std::string& bytes : requests) {
    RawConnection connection(daemon_.Port());
    ASSERT_TRUE(connection.ok());
    connection.Send(bytes);
    const std::string answer = connection.ReadAll(30);
    // Refused with a 4xx, or the connection closed without an answer: never a 200 or a 5xx.
    if (!answer.empty()) {
      EXPECT_EQ(answer.rfind("HTTP/1.1 4", 0), 0u) << bytes.substr(0, 80) << "\n" << answer;
    }
  }
  httplib::Client client = daemon_.Client();
  EXPECT_EQ(Post(client, "http://phish.example/login/", kLoginPage)["phishing"], true);
}

TEST_F(Pelmixd, BodiesAboveTheLimitGet413) {
  Start({"--max-body", "1000"});
  httplib::Client client = daemon_.Client();
  const std::string limit(1000, 'a'), over(1001, 'a'), far(5'000'000, 'a');
  Post(client, "http://a.example/", limit, 200);
  json error = Post(client, "http://a.example/", over, 413);
  EXPECT_NE(error["error"].get<std::string>().find("1000"), std::string::npos);
  Post(client, "http://a.example/", far, 413);
  // Without a length up front (chunked), the limit holds as the body arrives.
  for (const std::string* body : {&over, &far}) {
    auto answer = client.Post(
        "/v1/web?url=http%3A%2F%2Fa.example%2F",
        [&](std::size_t offset, httplib::DataSink& sink) {
          if (offset >= body->size()) {
            sink.done();
          } else {
            sink.write(body->data() + offset, std::min<std::size_t>(400, body->size() - offset));
          }
          return true;
        },
        "text/html");
    if (answer) {
      EXPECT_EQ(answer->status, 413) << answer->body;
    }
  }
  EXPECT_EQ(Post(client, "http://phish.example/login/", kLoginPage)["phishing"], true);
}

TEST_F(Pelmixd, SlowClientsAreCutOffByTheReadTimeout) {
  Start({"--read-timeout", "1", "--keep-alive-timeout", "1"});
  struct Case {
    const char* name;
    std::string bytes;
  };
  const std::vector<Case> cases = {
      {"half a request line", "POST /v1/web?url=http://a/ HT"},
      {"headers never ended", "POST /v1/web?url=http://a/ HTTP/1.1\r\nHost: x\r\n"},
      {"body shorter than its length",
       "POST /v1/web?url=http://a/ HTTP/1.1\r\nHost: x\r\nContent-Length: 100\r\n\r\n<html>"},
  };
  for (const Case& c : cases) {
    RawConnection connection(daemon_.Port());
    ASSERT_TRUE(connection.ok());
    const auto start = std::chrono::steady_clock::now();
    connection.Send(c.bytes);
    const std::string answer = connection.ReadAll(60);
    const double seconds =
        std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    EXPECT_LT(seconds, 30) << c.name;  // closed by the server, not by our own deadline
    if (!answer.empty()) {
      EXPECT_EQ(answer.rfind("HTTP/1.1 4", 0), 0u) << c.name << answer;
    }
  }
  httplib::Client client = daemon_.Client();
  EXPECT_EQ(Post(client, "http://phish.example/login/", kLoginPage)["phishing"], true);
}

// Clients keep posting pages while the file is replaced and SIGHUP arrives: first a good
// knowledge base with a new stamp, then a broken file, which leaves the new one serving.
TEST_F(Pelmixd, ReloadsAGoodKnowledgeBaseAndKeepsServingThroughABrokenOne) {
  Start({"--threads", "4"});
  std::atomic<bool> stop{false};
  std::atomic<int> answered{0}, failed{0};
  std::vector<std::thread> clients;
  for (int t = 0; t < 4; ++t) {
    clients.emplace_back([&] {
      httplib::Client client = daemon_.Client();
      while (!stop) {
        auto answer = client.Post("/v1/web?url=http%3A%2F%2Fphish.example%2Flogin%2F", kLoginPage,
                                  "text/html");
        const bool good = answer && answer->status == 200 &&
                          json::parse(answer->body, nullptr, false)["phishing"] == true;
        (good ? answered : failed)++;
      }
    });
  }
  const auto replace = [&](const std::string& bytes) {
    Write("next.kb", bytes);
    std::filesystem::rename(Path("next.kb"), kb_);
  };
  const auto stampServed = [&] {
    auto health = daemon_.Client().Get("/healthz");
    return health ? json::parse(health->body)["dbstamp"].get<std::int64_t>() : -1;
  };
  std::this_thread::sleep_for(std::chrono::milliseconds(300));
  replace(Stamped(20251231));
  daemon_.Signal(SIGHUP);
  EXPECT_TRUE(daemon_.WaitForLog("reloaded " + kb_ + ", stamp 20251231")) << daemon_.Log();
  EXPECT_EQ(stampServed(), 20251231);

  replace("this is not a knowledge base");
  daemon_.Signal(SIGHUP);
  EXPECT_TRUE(daemon_.WaitForLog("reload failed, still serving the previous knowledge base"))
      << daemon_.Log();
  std::this_thread::sleep_for(std::chrono::milliseconds(300));
  stop = true;
  for (std::thread& client : clients) client.join();
  EXPECT_EQ(failed, 0);
  EXPECT_GT(answered, 0);
  EXPECT_EQ(stampServed(), 20251231);
  httplib::Client client = daemon_.Client();
  EXPECT_EQ(Post(client, "http://phish.example/login/", kLoginPage)["dbstamp"], 20251231);
  auto metrics = client.Get("/metrics");
  ASSERT_TRUE(metrics);
  EXPECT_NE(metrics->body.find("pelmixd_reloads_total{result=\"loaded\"} 1\n"), std::string::npos);
  EXPECT_NE(metrics->body.find("pelmixd_reloads_total{result=\"failed\"} 1\n"), std::string::npos);
  EXPECT_NE(metrics->body.find("pelmixd_kb_stamp 20251231\n"), std::string::npos);
}

TEST_F(Pelmixd, SigtermAnswersTheRequestInFlightThenStops) {
  Start();
  const std::string page = kLoginPage;
  RawConnection connection(daemon_.Port());
  ASSERT_TRUE(connection.ok());
  connection.Send(
      "POST /v1/web?url=http%3A%2F%2Fphish.example%2Flogin%2F HTTP/1.1\r\nHost: x\r\n"
      "Content-Length: " +
      std::to_string(page.size()) + "\r\n\r\n" + page.substr(0, 40));
  std::this_thread::sleep_for(std::chrono::milliseconds(300));
  daemon_.Signal(SIGTERM);
  ASSERT_TRUE(daemon_.WaitForLog("stopping"));
  connection.Send(page.substr(40));
  const std::string answer = connection.ReadAll(60);
  EXPECT_EQ(answer.rfind("HTTP/1.1 200", 0), 0u) << answer;
  EXPECT_NE(answer.find("\"phishing\":true"), std::string::npos) << answer;
  EXPECT_EQ(daemon_.Stop(), 0) << daemon_.Log();
  EXPECT_NE(daemon_.Log().find("stopped"), std::string::npos);
}

TEST_F(Pelmixd, StartupFailuresExitWithAReason) {
  Daemon broken;
  EXPECT_FALSE(broken.Start({"--kb", Write("broken.kb", "not a container")}));
  EXPECT_EQ(broken.ExitStatus(), 2);
  EXPECT_NE(broken.Log().find("the service failed to load"), std::string::npos) << broken.Log();
  Daemon usage;
  EXPECT_FALSE(usage.Start({"--threads", "0"}));
  EXPECT_EQ(usage.ExitStatus(), 64);
  Daemon config;
  EXPECT_FALSE(config.Start({"--config", Write("bad.conf", "threads = 4\nbogus = 1\n")}));
  EXPECT_EQ(config.ExitStatus(), 64);
  EXPECT_NE(config.Log().find("line 2: unknown setting bogus"), std::string::npos) << config.Log();
}

TEST_F(Pelmixd, ConfigFileSetsTheLimits) {
  Start({"--config", Write("pelmixd.conf", "# limits\nmax-body = 100\nthreads = 2\n")});
  httplib::Client client = daemon_.Client();
  Post(client, "http://a.example/", std::string(100, 'a'), 200);
  Post(client, "http://a.example/", std::string(101, 'a'), 413);
}

// 2,000 requests from 8 keep-alive clients: every one answered, and the daemon's memory after
// the run close to what it was after a warm-up.
TEST_F(Pelmixd, LoadFromEightClientsIsAllAnsweredInBoundedMemory) {
#ifdef PELMIX_SANITIZED
  // The sanitizers' quarantine and shadow memory, and their slowdown against the daemon's
  // timeouts, are not what this bound is about; the plain build runs it.
  GTEST_SKIP() << "memory and timing bounds are measured without sanitizers";
#endif
  Start({"--threads", "8"});
  constexpr int kClients = 8, kPerClient = 250;
  const auto run = [&](int perClient, std::atomic<int>& good) {
    std::vector<std::thread> clients;
    for (int t = 0; t < kClients; ++t) {
      clients.emplace_back([&, t] {
        httplib::Client client = daemon_.Client();
        client.set_keep_alive(true);
        for (int i = 0; i < perClient; ++i) {
          const bool phish = (i + t) % 2 == 0;
          auto answer = client.Post(phish ? "/v1/web?url=http%3A%2F%2Fphish.example%2Fa%2F"
                                          : "/v1/web?url=https%3A%2F%2Fwww.paypal.com%2F",
                                    i % 3 == 0 ? BankPage() : std::string(kLoginPage), "text/html");
          if (answer && answer->status == 200 &&
              json::parse(answer->body, nullptr, false)["phishing"] == phish) {
            ++good;
          }
        }
      });
    }
    for (std::thread& client : clients) client.join();
  };
  std::atomic<int> warm{0}, good{0};
  run(20, warm);
  EXPECT_EQ(warm, kClients * 20);
  const long before = daemon_.RssKb();
  run(kPerClient, good);
  const long after = daemon_.RssKb();
  EXPECT_EQ(good, kClients * kPerClient);
  EXPECT_LT(after - before, 32 * 1024) << before << " kB before, " << after << " kB after";
  auto metrics = daemon_.Client().Get("/metrics");
  ASSERT_TRUE(metrics);
  EXPECT_NE(metrics->body.find("pelmixd_requests_total{endpoint=\"web\",code=\"200\"} " +
                               std::to_string(kClients * (20 + kPerClient)) + "\n"),
            std::string::npos);
}

}  // namespace
