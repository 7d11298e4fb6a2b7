// Starts the built pelmixd on a free loopback port, the way an administrator runs it, and
// talks to it only over 127.0.0.1.
#pragma once

#include <fcntl.h>
#include <httplib.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <fstream>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

namespace pelmix::testing {

class Daemon {
 public:
  Daemon() = default;
  Daemon(const Daemon&) = delete;
  Daemon& operator=(const Daemon&) = delete;
  ~Daemon() {
    if (pid_ > 0) Stop();
    if (!logPath_.empty()) ::unlink(logPath_.c_str());
  }

  // Starts pelmixd with `args` (and --listen 127.0.0.1:0 unless given); waits until it
  // listens. Returns false when it exited or did not listen in time.
  bool Start(std::vector<std::string> args) {
    // A daemon that refuses a body closes the connection under the client's feet; that must
    // fail the write, not kill the test binary.
    ::signal(SIGPIPE, SIG_IGN);
    char path[] = "/tmp/pelmixd-log-XXXXXX";
    const int fd = ::mkstemp(path);
    if (fd < 0) return false;
    logPath_ = path;
    bool listen = false;
    for (const std::string& arg : args) listen = listen || arg == "--listen";
    if (!listen) args.insert(args.end(), {"--listen", "127.0.0.1:0"});
    std::vector<char*> argv;
    std::string binary = PELMIXD_PATH;
    argv.push_back(binary.data());
    for (std::string& arg : args) argv.push_back(arg.data());
    argv.push_back(nullptr);
    pid_ = ::fork();
    if (pid_ == 0) {
      // A test binary that dies must not leave its daemons behind.
      ::prctl(PR_SET_PDEATHSIG, SIGKILL);
      ::dup2(fd, STDERR_FILENO);
      const int null = ::open("/dev/null", O_RDWR);
      ::dup2(null, STDOUT_FILENO);
      ::dup2(null, STDIN_FILENO);
      ::execv(argv[0], argv.data());
      ::_exit(127);
    }
    ::close(fd);
    if (pid_ < 0) return false;
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(60);
    while (std::chrono::steady_clock::now() < deadline) {
      const std::string log = Log();
      const std::string mark = "listening on 127.0.0.1:";
      if (const std::size_t at = log.find(mark); at != std::string::npos) {
        const std::size_t end = log.find('\n', at);
        if (end != std::string::npos) {
          port_ = std::stoi(log.substr(at + mark.size(), end - at - mark.size()));
          return true;
        }
      }
      int status = 0;
      if (::waitpid(pid_, &status, WNOHANG) == pid_) {
        exitStatus_ = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
        pid_ = -1;
        return false;
      }
      std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    return false;
  }

  int Port() const { return port_; }
  pid_t Pid() const { return pid_; }
  std::string Log() const {
    std::ifstream in(logPath_);
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
  }
  void Signal(int signal) const {
    if (pid_ > 0) ::kill(pid_, signal);
  }

  // Waits until the log holds `text`; false after the timeout.
  bool WaitForLog(const std::string& text, int seconds = 60) const {
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(seconds);
    while (std::chrono::steady_clock::now() < deadline) {
      if (Log().find(text) != std::string::npos) return true;
      std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    return false;
  }

  // SIGTERM, then the exit status (-1 when it had to be killed or died by a signal).
  int Stop(int seconds = 60) {
    if (pid_ <= 0) return exitStatus_;
    ::kill(pid_, SIGTERM);
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(seconds);
    int status = 0;
    while (::waitpid(pid_, &status, WNOHANG) == 0) {
      if (std::chrono::steady_clock::now() > deadline) {
        ::kill(pid_, SIGKILL);
        ::waitpid(pid_, &status, 0);
        pid_ = -1;
        return exitStatus_ = -1;
      }
      std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    pid_ = -1;
    return exitStatus_ = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }
  int ExitStatus() const { return exitStatus_; }

  // Resident memory of the daemon, in kB (0 when unknown).
  long RssKb() const {
    std::ifstream in("/proc/" + std::to_string(pid_) + "/status");
    for (std::string line; std::getline(in, line);) {
      if (line.rfind("VmRSS:", 0) == 0) return std::stol(line.substr(6));
    }
    return 0;
  }

  httplib::Client Client() const {
    httplib::Client client("127.0.0.1", port_);
    client.set_connection_timeout(30);
    client.set_read_timeout(60);
    client.set_write_timeout(60);
    return client;
  }

 private:
  pid_t pid_ = -1;
  int port_ = 0;
  int exitStatus_ = -1;
  std::string logPath_;
};

// A raw loopback connection, for requests no well-behaved client would send.
class RawConnection {
 public:
  explicit RawConnection(int port);
  ~RawConnection();
  bool Send(const std::string& bytes);
  // Reads until the peer closes or `seconds` pass.
  std::string ReadAll(int seconds);
  bool ok() const { return fd_ >= 0; }

 private:
  int fd_ = -1;
};

}  // namespace pelmix::testing
