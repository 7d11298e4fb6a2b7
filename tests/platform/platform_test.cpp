#include <gtest/gtest.h>

#include <chrono>
#include <thread>
#include <vector>

#include "engine/common/error.h"
#include "platform/critical_section.h"
#include "platform/exception_notification.h"
#include "platform/system_time.h"

namespace {

TEST(PlatformTime, CountsHundredNanosecondsSince1601) {
  const std::uint64_t ticks = platform::GetSystemTimeAsFileTime();
  const auto unixSeconds = std::chrono::duration_cast<std::chrono::seconds>(
                               std::chrono::system_clock::now().time_since_epoch())
                               .count();
  const std::uint64_t expected =
      (static_cast<std::uint64_t>(unixSeconds) + 11644473600ull) * 10'000'000ull;
  EXPECT_NEAR(static_cast<double>(ticks), static_cast<double>(expected), 2 * 10'000'000.0);
}

TEST(PlatformCriticalSection, SerialisesThreads) {
  platform::CriticalSection section;
  platform::InitializeCriticalSection(&section);
  long counter = 0;
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&] {
      for (int i = 0; i < 20000; ++i) {
        platform::CriticalSectionLock lock(section);
        ++counter;
      }
    });
  }
  for (auto& thread : threads) thread.join();
  platform::DeleteCriticalSection(&section);
  EXPECT_EQ(counter, 80000);
}

std::vector<std::uint32_t> notified;
void Observe(std::uint32_t code, std::uint32_t flags) {
  notified.push_back(code);
  EXPECT_EQ(flags, 0u);
}

TEST(PlatformNotification, PrecedesEveryEngineError) {
  notified.clear();
  const platform::ExceptionObserver previous = platform::SetExceptionObserver(&Observe);
  try {
    ap::ThrowError("Control summ is invalid");
    ADD_FAILURE() << "no error was raised";
  } catch (const ap::Error& e) {
    EXPECT_STREQ(e.what(), "Control summ is invalid");
    // The notification was delivered before the error reached this handler.
    ASSERT_EQ(notified.size(), 1u);
    EXPECT_EQ(notified[0], 0x42849FD0u);
  }
  platform::SetExceptionObserver(previous);
  platform::RaiseException(platform::kEngineErrorNotification);  // no observer: nothing happens
  EXPECT_EQ(notified.size(), 1u);
}

}  // namespace
