#include "tools/pelmixd/bounded_pool.h"

namespace pelmix::pelmixd {

BoundedPool::BoundedPool(std::size_t threads, std::size_t maxQueued) : maxQueued_(maxQueued) {
  workers_.reserve(threads);
  for (std::size_t i = 0; i < threads; ++i) workers_.emplace_back([this] { Work(); });
}

BoundedPool::~BoundedPool() { shutdown(); }

void BoundedPool::enqueue(std::function<void()> job) {
  std::unique_lock<std::mutex> lock(mutex_);
  roomReady_.wait(lock, [&] { return jobs_.size() < maxQueued_ || stopping_; });
  jobs_.push_back(std::move(job));
  lock.unlock();
  jobReady_.notify_one();
}

void BoundedPool::shutdown() {
  {
    std::lock_guard<std::mutex> lock(mutex_);
    if (stopping_ && workers_.empty()) return;
    stopping_ = true;
  }
  jobReady_.notify_all();
  roomReady_.notify_all();
  for (std::thread& worker : workers_) worker.join();
  workers_.clear();
}

void BoundedPool::Work() {
  for (;;) {
    std::function<void()> job;
    {
      std::unique_lock<std::mutex> lock(mutex_);
      jobReady_.wait(lock, [&] { return !jobs_.empty() || stopping_; });
      if (jobs_.empty()) return;  // stopping, and nothing left to run
      job = std::move(jobs_.front());
      jobs_.pop_front();
    }
    roomReady_.notify_one();
    job();
  }
}

}  // namespace pelmix::pelmixd
