// The module through its real ABI: dlopen of the built libpelmix.so, the reference host on
// the other side.
#include <gtest/gtest.h>

#include "framework/uvo/anti_phishing.h"
#include "framework/uvo/result.h"
#include "host/host.h"
#include "host/module_loader.h"
#include "host/stream.h"

namespace {

using cf::services::anti_phishing::IAntiPhishingService;
using cf::services::anti_phishing::IAntiPhishingServiceFactory;
using cf::services::anti_phishing::kAntiPhishingClassId;

constexpr char kCreateService[] =
    "anti_phishing_service\tcf::services::anti_phishing::heuristic::AntiPhishingFactory::"
    "CreateAntiPhishingService";

class ModuleAbi : public ::testing::Test {
 protected:
  uvo::Ptr<IAntiPhishingServiceFactory> CreateServiceFactory(uvo::result_t* result = nullptr) {
    uvo::Ptr<uvo::IObjectFactory> factory;
    EXPECT_EQ(
        module_.GetObjectFactory(host_.locator.Get(), kAntiPhishingClassId, factory.Receive()), 0);
    uvo::Ptr<IAntiPhishingServiceFactory> service;
    const uvo::result_t r = factory->CreateInstance(
        host_.locator.Get(), IAntiPhishingServiceFactory::kIid, service.ReceiveVoid());
    if (result) *result = r;
    return service;
  }

  pelmix::host::Host host_;
  pelmix::host::Module module_{PELMIX_MODULE_PATH};
};

TEST_F(ModuleAbi, UnknownClassIdentifier) {
  uvo::IObjectFactory* factory = reinterpret_cast<uvo::IObjectFactory*>(0x1);
  EXPECT_EQ(module_.GetObjectFactory(host_.locator.Get(), 0, &factory), uvo::kErrNotImplemented);
  EXPECT_EQ(factory, nullptr);
  EXPECT_EQ(module_.CanUnload(), 0);
}

TEST_F(ModuleAbi, UnloadWaitsForTheLastObject) {
  EXPECT_EQ(module_.CanUnload(), 0);
  uvo::Ptr<uvo::IObjectFactory> factory;
  ASSERT_EQ(module_.GetObjectFactory(host_.locator.Get(), kAntiPhishingClassId, factory.Receive()),
            0);
  EXPECT_EQ(module_.CanUnload(), 1);
  uvo::Ptr<IAntiPhishingServiceFactory> service;
  ASSERT_EQ(factory->CreateInstance(host_.locator.Get(), IAntiPhishingServiceFactory::kIid,
                                    service.ReceiveVoid()),
            0);
  factory.Reset();
  EXPECT_EQ(module_.CanUnload(), 1);  // the service factory and its wrappers are alive
  service.Reset();
  EXPECT_EQ(module_.CanUnload(), 0);
  EXPECT_EQ(host_.allocator->LiveBlocks(), 0u);
}

TEST_F(ModuleAbi, InterfacesOfTheFactories) {
  uvo::Ptr<uvo::IObjectFactory> factory;
  ASSERT_EQ(module_.GetObjectFactory(host_.locator.Get(), kAntiPhishingClassId, factory.Receive()),
            0);
  uvo::Ptr<uvo::IObject> same;
  EXPECT_EQ(factory->QueryInterface(0, same.ReceiveVoid()), 0);
  EXPECT_EQ(static_cast<void*>(same.Get()), static_cast<void*>(factory.Get()));

  uvo::Ptr<IAntiPhishingServiceFactory> service = CreateServiceFactory();
  ASSERT_TRUE(service);
  void* out = &same;
  EXPECT_EQ(service->QueryInterface(uvo::IObjectFactory::kIid, &out), uvo::kErrNoInterface);
  EXPECT_EQ(out, nullptr);
  uvo::Ptr<uvo::IObject> base;
  EXPECT_EQ(service->QueryInterface(0, base.ReceiveVoid()), 0);
  EXPECT_EQ(static_cast<void*>(base.Get()), static_cast<void*>(service.Get()));
  // An identifier the factory does not implement: no object is handed out.
  uvo::Ptr<uvo::IObject> wrong;
  EXPECT_EQ(factory->CreateInstance(host_.locator.Get(), 0x12345678, wrong.ReceiveVoid()),
            uvo::kErrNoInterface);
  EXPECT_FALSE(wrong);
}

TEST_F(ModuleAbi, ServiceFactoryMemoryComesFromTheHostAllocator) {
  uvo::Ptr<IAntiPhishingServiceFactory> service = CreateServiceFactory();
  ASSERT_TRUE(service);
  EXPECT_EQ(host_.allocator->LiveBlocks(), 1u);
  service.Reset();
  EXPECT_EQ(host_.allocator->LiveBlocks(), 0u);
}

TEST_F(ModuleAbi, LocatorThatRefusesTheTracer) {
  host_.locator->Withhold(uvo::ITracer::kIid);
  uvo::result_t result = 0;
  uvo::Ptr<IAntiPhishingServiceFactory> service = CreateServiceFactory(&result);
  EXPECT_EQ(result, uvo::kErrNotFound);
  EXPECT_FALSE(service);
  EXPECT_EQ(host_.allocator->LiveBlocks(), 0u);
  EXPECT_EQ(module_.CanUnload(), 0);
}

TEST_F(ModuleAbi, LocatorThatRefusesTheAllocatorTracesTheFailure) {
  host_.locator->Withhold(uvo::IAllocator::kIid);
  uvo::result_t result = 0;
  uvo::Ptr<IAntiPhishingServiceFactory> service = CreateServiceFactory(&result);
  EXPECT_EQ(result, uvo::kErrNotFound);
  EXPECT_FALSE(service);
  const auto lines = host_.tracer->Lines();
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_EQ(lines[0].level, 300);
  EXPECT_EQ(lines[0].text,
            "Exception during object construction: uvo::ResultCodeException "
            "iid = 0x9cca5603: 0x8000004c (Not found)");
}

TEST_F(ModuleAbi, AllocatorOutOfMemory) {
  host_.allocator->SetRefuse(true);
  uvo::result_t result = 0;
  EXPECT_FALSE(CreateServiceFactory(&result));
  EXPECT_EQ(result, uvo::kErrOutOfMemory);
}

TEST_F(ModuleAbi, CreateServiceChecksItsArguments) {
  uvo::Ptr<IAntiPhishingServiceFactory> factory = CreateServiceFactory();
  ASSERT_TRUE(factory);
  auto file = pelmix::host::MemoryStream::Create(std::string("kb"));
  IAntiPhishingService* out = nullptr;

  EXPECT_EQ(factory->CreateAntiPhishingService(nullptr, &out), uvo::kErrUnexpected);
  EXPECT_EQ(factory->CreateAntiPhishingService(file.Get(), nullptr), uvo::kErrUnexpected);
  // A filled out-pointer is left as it is.
  auto* sentinel = reinterpret_cast<IAntiPhishingService*>(0x10);
  out = sentinel;
  EXPECT_EQ(factory->CreateAntiPhishingService(file.Get(), &out), uvo::kErrUnexpected);
  EXPECT_EQ(out, sentinel);

  const auto lines = host_.tracer->Lines();
  ASSERT_EQ(lines.size(), 3u);
  for (const auto& line : lines) {
    EXPECT_EQ(line.level, 300);
    EXPECT_EQ(line.text, std::string(kCreateService) + ": uvo::Exception ");
  }
}

TEST_F(ModuleAbi, CreateServiceOnAFileThatIsNoContainer) {
  uvo::Ptr<IAntiPhishingServiceFactory> factory = CreateServiceFactory();
  ASSERT_TRUE(factory);
  // Two bytes: the container's header read runs past the end of the host file.
  auto file = pelmix::host::MemoryStream::Create(std::string("kb"));
  IAntiPhishingService* out = nullptr;
  EXPECT_EQ(factory->CreateAntiPhishingService(file.Get(), &out), uvo::kErrUnexpected);
  EXPECT_EQ(out, nullptr);
  const auto lines = host_.tracer->Lines();
  ASSERT_EQ(lines.size(), 3u);
  EXPECT_EQ(lines[0].level, 700);
  EXPECT_EQ(lines[0].text,
            std::string(kCreateService) + " creating anti-phishing service instance..");
  EXPECT_EQ(lines[1].level, 700);
  EXPECT_EQ(lines[1].text,
            "anti_phishing_service\tcf::services::anti_phishing::heuristic::AntiPhishing::"
            "Initialize creating heuristic checker factory..");
  EXPECT_EQ(lines[2].level, 300);
  EXPECT_EQ(lines[2].text, std::string(kCreateService) + ": uvo::Exception ");
  factory.Reset();
  EXPECT_EQ(module_.CanUnload(), 0);
  EXPECT_EQ(host_.allocator->LiveBlocks(), 0u);
}

TEST_F(ModuleAbi, EveryLineCarriesThePrefix) {
  uvo::Ptr<IAntiPhishingServiceFactory> factory = CreateServiceFactory();
  ASSERT_TRUE(factory);
  IAntiPhishingService* out = nullptr;
  factory->CreateAntiPhishingService(nullptr, &out);
  factory->CreateAntiPhishingService(pelmix::host::MemoryStream::Create(std::string()).Get(), &out);
  ASSERT_FALSE(host_.tracer->Lines().empty());
  for (const auto& text : host_.tracer->Texts()) {
    EXPECT_EQ(text.rfind("anti_phishing_service\t", 0), 0u) << text;
  }
}

TEST_F(ModuleAbi, TracerLevelFiltersTheModulesLines) {
  host_.tracer->SetTraceLevel(300);
  uvo::Ptr<IAntiPhishingServiceFactory> factory = CreateServiceFactory();
  IAntiPhishingService* out = nullptr;
  factory->CreateAntiPhishingService(pelmix::host::MemoryStream::Create(std::string()).Get(), &out);
  const auto lines = host_.tracer->Lines();
  ASSERT_EQ(lines.size(), 1u);  // the level-700 line was not accepted
  EXPECT_EQ(lines[0].level, 300);
}

}  // namespace
