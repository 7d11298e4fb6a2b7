// pelmix-milter's settings, from the command line. Every number an administrator sets has a
// named bound, so that a typo cannot ask for a message the size of the disk.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace pelmix::milter {

// What to do with a message judged phishing. A clean one is always tagged and accepted.
enum class Action {
  kTag,         // add X-Pelmix-Verdict and accept
  kReject,      // refuse it with 550 5.7.1
  kQuarantine,  // ask the MTA to hold it (and tag it)
};

// What to do with a message the engine could not judge.
enum class OnError {
  kAccept,    // tag it "unchecked" and accept: mail keeps flowing
  kTempfail,  // 451 4.7.1: the sender's MTA tries again later
};

inline constexpr char kDefaultSocket[] = "inet:8640@127.0.0.1";
// Bytes of one message kept for judging; the walk itself reads no more than its own budget
// (tools/mail, 32 MiB), so a larger setting would only hold bytes nobody reads.
inline constexpr std::size_t kDefaultMaxMessage = 16 * 1024 * 1024;
inline constexpr std::size_t kMaxMaxMessage = 32 * 1024 * 1024;
// How long libmilter waits for the MTA on a connection.
inline constexpr int kDefaultTimeoutSeconds = 300;
inline constexpr int kMaxTimeoutSeconds = 3600;
// Connections served at once; each holds at most one message of max-message bytes. Beyond
// this a new connection is answered 421 (temporary) so the MTA tries again.
inline constexpr unsigned kDefaultMaxConnections = 64;
inline constexpr unsigned kMaxMaxConnections = 4096;

struct Options {
  std::string kb;      // empty: the knowledge base next to the binary
  std::string module;  // empty: the module next to the binary
  std::string socket = kDefaultSocket;
  Action action = Action::kTag;
  OnError onError = OnError::kAccept;
  std::size_t maxMessage = kDefaultMaxMessage;
  int timeout = kDefaultTimeoutSeconds;
  unsigned maxConnections = kDefaultMaxConnections;
  int level = 2;
  bool help = false;
};

// Returns an empty string or what is wrong with the command line.
std::string ParseOptions(const std::vector<std::string>& args, Options& options);

// "inet:PORT@HOST", "inet6:PORT@HOST" or "unix:PATH" (also "local:PATH"), as libmilter takes
// it. A bare "inet:PORT" would listen on every address, so the host is required.
bool ValidSocket(const std::string& text);

std::string Usage();

}  // namespace pelmix::milter
