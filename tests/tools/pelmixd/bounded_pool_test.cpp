// The listener's pool: a full queue holds the listener back, and shutdown runs what was queued.
#include "tools/pelmixd/bounded_pool.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <future>
#include <thread>

namespace {

using pelmix::pelmixd::BoundedPool;

TEST(BoundedPool, AFullQueueHoldsTheCallerBackAndShutdownRunsEverything) {
  BoundedPool pool(1, 2);
  std::promise<void> release;
  std::shared_future<void> released = release.get_future().share();
  std::atomic<int> ran{0};
  pool.enqueue([&] {
    released.wait();
    ++ran;
  });
  // Wait until the worker holds the first job, so that the queue is empty again.
  std::this_thread::sleep_for(std::chrono::milliseconds(100));
  pool.enqueue([&] { ++ran; });
  pool.enqueue([&] { ++ran; });
  std::atomic<bool> third{false};
  std::thread caller([&] {
    pool.enqueue([&] { ++ran; });
    third = true;
  });
  std::this_thread::sleep_for(std::chrono::milliseconds(200));
  EXPECT_FALSE(third) << "a full queue took one more job";
  release.set_value();
  caller.join();
  EXPECT_TRUE(third);
  pool.shutdown();
  EXPECT_EQ(ran, 4);
  pool.shutdown();  // twice is harmless
}

}  // namespace
