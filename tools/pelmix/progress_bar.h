// A one-line progress bar on a terminal: "scanned N/TOTAL [#####.....]", redrawn in place
// at most every kRedrawMs and erased when done. Thread-safe.
#pragma once

#include <chrono>
#include <cstddef>
#include <mutex>
#include <ostream>

namespace pelmix::cli {

class ProgressBar {
 public:
  static constexpr int kWidth = 30;
  static constexpr int kRedrawMs = 100;

  // Draws nothing unless `enabled`.
  ProgressBar(std::ostream& out, std::size_t total, bool enabled);
  ~ProgressBar();
  void Advance();

 private:
  void Draw();

  std::ostream& out_;
  std::size_t total_;
  std::size_t done_ = 0;
  bool enabled_;
  std::mutex mutex_;
  std::chrono::steady_clock::time_point last_{};
};

}  // namespace pelmix::cli
