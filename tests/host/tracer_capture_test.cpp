// The reference tracer's per-thread capture: each thread's lines apart, the thread's level
// raised, nothing kept in the tracer's own list, the echo still bound to the tracer's level.
#include <gtest/gtest.h>

#include <sstream>
#include <thread>

#include "host/tracer.h"
#include "internal/helpers/tracer/trace_writer.h"

namespace pelmix::host {
namespace {

TEST(TracerCapture, LinesOfEachThreadStayApart) {
  auto tracer = Tracer::Create(300);
  std::ostringstream echo;
  tracer->SetEcho(&echo);
  std::vector<TraceLine> a, b;
  const auto run = [&](std::vector<TraceLine>& into, const std::string& name) {
    Tracer::ThreadCapture capture(700);
    int level = 0;
    EXPECT_EQ(tracer->GetTraceLevel(&level), 0);
    EXPECT_EQ(level, 700);
    for (int i = 0; i < 50; ++i) cf::helpers::Trace(tracer.Get(), 700, name);
    cf::helpers::Trace(tracer.Get(), 800, name + " too verbose");
    cf::helpers::Trace(tracer.Get(), 300, name + " failed");
    into = capture.Take();
    EXPECT_TRUE(capture.Take().empty());
  };
  std::thread first(run, std::ref(a), "a");
  std::thread second(run, std::ref(b), "b");
  first.join();
  second.join();
  ASSERT_EQ(a.size(), 51u);
  ASSERT_EQ(b.size(), 51u);
  for (const auto& line : a) EXPECT_EQ(line.text[0], 'a');
  for (const auto& line : b) EXPECT_EQ(line.text[0], 'b');
  EXPECT_EQ(a.back().level, 300);
  EXPECT_TRUE(tracer->Lines().empty());
  // Only what the tracer's own level admits is echoed, in whichever order the threads ran.
  EXPECT_TRUE(echo.str() == "a failed\nb failed\n" || echo.str() == "b failed\na failed\n")
      << echo.str();

  // Without a capture the thread sees the tracer's own level again.
  cf::helpers::Trace(tracer.Get(), 700, "dropped");
  cf::helpers::Trace(tracer.Get(), 300, "kept");
  ASSERT_EQ(tracer->Texts(), (std::vector<std::string>{"kept"}));
  int level = 0;
  tracer->GetTraceLevel(&level);
  EXPECT_EQ(level, 300);
}

TEST(TracerCapture, CapturesNest) {
  auto tracer = Tracer::Create(1000);
  Tracer::ThreadCapture outer(0);
  cf::helpers::Trace(tracer.Get(), 700, "outer");
  std::vector<TraceLine> inner;
  {
    Tracer::ThreadCapture capture(0);
    cf::helpers::Trace(tracer.Get(), 700, "inner");
    inner = capture.Take();
  }
  cf::helpers::Trace(tracer.Get(), 700, "outer again");
  ASSERT_EQ(inner.size(), 1u);
  EXPECT_EQ(inner[0].text, "inner");
  const auto lines = outer.Take();
  ASSERT_EQ(lines.size(), 2u);
  EXPECT_EQ(lines[1].text, "outer again");
}

}  // namespace
}  // namespace pelmix::host
