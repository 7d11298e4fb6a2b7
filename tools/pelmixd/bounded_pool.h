// The worker threads behind pelmixd's listener. Unlike a plain pool its queue of accepted
// connections is bounded: when every worker is busy and the queue is full, the listener waits
// instead of accepting more, so a flood of connections waits in the kernel's backlog rather
// than in our memory.
#pragma once

#include <httplib.h>

#include <condition_variable>
#include <cstddef>
#include <deque>
#include <functional>
#include <mutex>
#include <thread>
#include <vector>

namespace pelmix::pelmixd {

class BoundedPool final : public httplib::TaskQueue {
 public:
  BoundedPool(std::size_t threads, std::size_t maxQueued);
  ~BoundedPool() override;

  // Waits while the queue is full.
  void enqueue(std::function<void()> job) override;
  // Runs what is queued, then joins the workers.
  void shutdown() override;

 private:
  void Work();

  const std::size_t maxQueued_;
  std::mutex mutex_;
  std::condition_variable jobReady_;
  std::condition_variable roomReady_;
  std::deque<std::function<void()>> jobs_;
  bool stopping_ = false;
  std::vector<std::thread> workers_;
};

}  // namespace pelmix::pelmixd
