#include "tools/pelmix/progress_bar.h"

#include <string>

namespace pelmix::cli {

ProgressBar::ProgressBar(std::ostream& out, std::size_t total, bool enabled)
    : out_(out), total_(total), enabled_(enabled) {}

ProgressBar::~ProgressBar() {
  if (enabled_) out_ << "\r\033[K" << std::flush;
}

void ProgressBar::Advance() {
  if (!enabled_) return;
  std::lock_guard<std::mutex> lock(mutex_);
  ++done_;
  const auto now = std::chrono::steady_clock::now();
  if (done_ != total_ && now - last_ < std::chrono::milliseconds(kRedrawMs)) return;
  last_ = now;
  Draw();
}

void ProgressBar::Draw() {
  const std::size_t filled = total_ == 0 ? kWidth : done_ * kWidth / total_;
  std::string bar(filled, '#');
  bar.resize(kWidth, '.');
  out_ << "\rscanned " << done_ << '/' << total_ << " [" << bar << ']' << std::flush;
}

}  // namespace pelmix::cli
