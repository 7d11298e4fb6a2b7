// pelmixd's settings: defaults, then the config file (--config), then the command line, each
// overriding the one before. Every number a user sets has a named bound, so that a typo
// cannot ask for a million threads or a body the size of the disk.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace pelmix::pelmixd {

inline constexpr char kDefaultHost[] = "127.0.0.1";
inline constexpr int kDefaultPort = 8639;
inline constexpr unsigned kDefaultThreads = 8;
inline constexpr unsigned kMaxThreads = 256;
inline constexpr std::size_t kDefaultMaxBody = 16 * 1024 * 1024;
inline constexpr std::size_t kMaxMaxBody = std::size_t{1} << 30;
inline constexpr int kDefaultTimeoutSeconds = 10;
inline constexpr int kMaxTimeoutSeconds = 3600;
inline constexpr int kDefaultKeepAliveSeconds = 5;
inline constexpr unsigned kDefaultKeepAliveRequests = 100;
inline constexpr unsigned kMaxKeepAliveRequests = 100000;
// A config file is a few lines; anything longer is not one.
inline constexpr std::size_t kMaxConfigBytes = 64 * 1024;

struct Options {
  std::string kb;      // empty: the knowledge base next to the binary
  std::string module;  // empty: the module next to the binary
  std::string config;
  std::string host = kDefaultHost;
  int port = kDefaultPort;  // 0: any free port (tests)
  unsigned threads = kDefaultThreads;
  std::size_t maxBody = kDefaultMaxBody;
  int readTimeout = kDefaultTimeoutSeconds;
  int writeTimeout = kDefaultTimeoutSeconds;
  int keepAliveTimeout = kDefaultKeepAliveSeconds;
  unsigned keepAliveRequests = kDefaultKeepAliveRequests;
  int level = 2;  // for requests that do not say
  bool help = false;
};

// Applies one setting by its name (the long option without "--"). Returns an empty string or
// what is wrong with it.
std::string ApplySetting(const std::string& name, const std::string& value, Options& options);

// Applies "name = value" lines; '#' starts a comment. Returns an empty string or the first
// error with its line number.
std::string ApplyConfigText(const std::string& text, Options& options);

// Reads the config file named by --config (if any), then applies the command line over it.
// Returns an empty string or the error.
std::string ParseOptions(const std::vector<std::string>& args, Options& options);

// "HOST:PORT" or "[V6HOST]:PORT".
bool ParseListen(const std::string& text, std::string& host, int& port);

std::string Usage();

}  // namespace pelmix::pelmixd
