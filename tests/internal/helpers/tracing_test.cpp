// The trace writer and the prefixing tracer wrapper, over the reference host's tracer.
#include <gtest/gtest.h>

#include "host/host.h"
#include "internal/helpers/exception/logic_error.h"
#include "internal/helpers/service_locator/service_locator_socks.h"
#include "internal/helpers/tracer/trace_writer.h"
#include "internal/helpers/tracer/tracer_socks.h"

namespace {

constexpr char kPrefix[] = "anti_phishing_service\t";

TEST(TraceWriter, WritesOneLineAtItsLevel) {
  pelmix::host::Host host(700);
  cf::helpers::Trace(host.tracer.Get(), 700, "hello");
  cf::helpers::Trace(host.tracer.Get(), 800, "too detailed");  // refused by a level-700 tracer
  ASSERT_EQ(host.tracer->Lines().size(), 1u);
  EXPECT_EQ(host.tracer->Lines()[0].text, "hello");
  EXPECT_EQ(host.tracer->Lines()[0].level, 700);
  EXPECT_EQ(host.tracer->OpenRecords(), 0u);
}

TEST(TraceWriter, RegrowsThroughTheSocksAndKeepsTheText) {
  pelmix::host::Host host;
  uvo::Ptr<uvo::ITracer> socks = cf::TracerSocks::Create(host.locator.Get(), kPrefix);
  ASSERT_TRUE(socks);
  std::string longText;
  for (int i = 0; i < 300; ++i) longText += "0123456789";
  {
    cf::helpers::TraceWriter writer(socks.Get(), 700);
    // 500 fits the first 512 bytes; 600 doubles the record to 1024; 3000 takes what it needs.
    writer.Append(longText.substr(0, 500)).Append(longText.substr(500, 100));
    writer.Append(longText.substr(600));
  }
  ASSERT_EQ(host.tracer->Lines().size(), 1u);
  EXPECT_EQ(host.tracer->Lines()[0].text, kPrefix + longText);
  // The wrapper asks the host for its prefix room on top of each size.
  const std::uint32_t room = sizeof kPrefix - 1;
  EXPECT_EQ(host.tracer->RegrowSizes(), (std::vector<std::uint32_t>{1024 + room, 3000 + room}));
  EXPECT_EQ(host.tracer->OpenRecords(), 0u);
}

TEST(TraceWriter, RefusedRegrowDropsTheText) {
  pelmix::host::Host host;
  host.tracer->SetRefuseRegrow(true);
  cf::helpers::Trace(host.tracer.Get(), 700, std::string(600, 'x'));
  EXPECT_TRUE(host.tracer->Lines().empty());
  cf::helpers::Trace(host.tracer.Get(), 700, std::string(512, 'y'));  // fits: no regrow needed
  ASSERT_EQ(host.tracer->Lines().size(), 1u);
  EXPECT_EQ(host.tracer->Lines()[0].text, std::string(512, 'y'));
}

TEST(TraceWriter, NullTracerWritesNothing) {
  cf::helpers::TraceWriter writer(nullptr, 700);
  EXPECT_FALSE(writer.Accepted());
  writer.Append("ignored");
}

TEST(TracerSocks, RefusesAnEmptyPrefix) {
  pelmix::host::Host host;
  try {
    cf::TracerSocks::Create(host.locator.Get(), "");
    FAIL() << "socks without prefix";
  } catch (const cf::helpers::LogicError& e) {
    EXPECT_STREQ(e.what(), "What do you need these socks for without prefix?");
    EXPECT_EQ(*e.Code(), uvo::kErrInvalidArgument);
  }
}

TEST(ServiceLocatorSocks, HandsOutTheReplacementAndForwardsTheRest) {
  pelmix::host::Host host;
  uvo::Ptr<uvo::ITracer> socks = cf::TracerSocks::Create(host.locator.Get(), kPrefix);
  uvo::Ptr<uvo::IServiceLocator> wrapped =
      cf::ServiceLocatorSocks<uvo::ITracer>::Create(host.locator.Get(), socks.Get());

  uvo::Ptr<uvo::ITracer> tracer;
  ASSERT_EQ(wrapped->GetService(uvo::ITracer::kIid, 0, tracer.ReceiveVoid()), 0);
  EXPECT_EQ(tracer.Get(), socks.Get());
  uvo::Ptr<uvo::IAllocator> allocator;
  ASSERT_EQ(wrapped->GetService(uvo::IAllocator::kIid, 0, allocator.ReceiveVoid()), 0);
  EXPECT_EQ(static_cast<void*>(allocator.Get()),
            static_cast<void*>(static_cast<uvo::IAllocator*>(host.allocator.Get())));
  uvo::Ptr<uvo::IServiceLocator> inner;
  ASSERT_EQ(wrapped->GetService(uvo::IServiceLocator::kIid, 0, inner.ReceiveVoid()), 0);
  EXPECT_EQ(static_cast<void*>(inner.Get()),
            static_cast<void*>(static_cast<uvo::IServiceLocator*>(host.locator.Get())));
  EXPECT_EQ(wrapped->GetService(uvo::ITracer::kIid, 0, nullptr), uvo::kErrInvalidArgument);
  void* unknown = &inner;
  EXPECT_EQ(wrapped->GetService(0x12345678, 0, &unknown), uvo::kErrNotFound);
  EXPECT_EQ(unknown, nullptr);

  cf::helpers::Trace(tracer.Get(), 300, "line");
  ASSERT_EQ(host.tracer->Texts().size(), 1u);
  EXPECT_EQ(host.tracer->Texts()[0], "anti_phishing_service\tline");
}

TEST(ServiceLocatorSocks, RefusesMissingParts) {
  pelmix::host::Host host;
  EXPECT_THROW(cf::ServiceLocatorSocks<uvo::ITracer>::Create(nullptr, host.tracer.Get()),
               cf::helpers::LogicError);
  try {
    cf::ServiceLocatorSocks<uvo::ITracer>::Create(host.locator.Get(), nullptr);
    FAIL() << "socks without interface";
  } catch (const cf::helpers::LogicError& e) {
    EXPECT_STREQ(e.what(),
                 "ServiceLocatorSocks::Create(): what is these socks about without interface?");
  }
}

}  // namespace
