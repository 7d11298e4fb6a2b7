#include "services/anti_phishing/heuristic/source/module_factory.h"

#include <new>

#include "framework/uvo/anti_phishing.h"
#include "framework/uvo/exception.h"
#include "framework/uvo/result.h"
#include "internal/helpers/exception/exception_dispatcher.h"
#include "internal/helpers/service_locator/locator_services.h"
#include "internal/helpers/tracer/trace_writer.h"
#include "services/anti_phishing/heuristic/source/anti_phishing_factory.h"

namespace cf::services::anti_phishing::heuristic {
namespace {

// Traces a construction failure through the host locator's own tracer, if it has one.
void TraceConstructionFailure(uvo::IServiceLocator* locator, const std::string& text) {
  if (locator == nullptr) return;
  try {
    uvo::Ptr<uvo::ITracer> tracer;
    if (locator->GetService(uvo::ITracer::kIid, 0, tracer.ReceiveVoid()) < 0 || !tracer) return;
    helpers::Trace(tracer.Get(), 300, "Exception during object construction: " + text);
  } catch (...) {
  }
}

}  // namespace

uvo::result_t ModuleFactory::CreateInstance(uvo::IServiceLocator* locator, uvo::iid_t iid,
                                            void** out) {
  if (out == nullptr) return uvo::kErrInvalidArgument;
  *out = nullptr;
  AntiPhishingFactory* factory = nullptr;
  try {
    UVO_CHECK(locator != nullptr);
    uvo::Ptr<uvo::IAllocator> allocator = helpers::GetService<uvo::IAllocator>(locator);
    UVO_CHECK(allocator);
    factory = AntiPhishingFactory::CreateWithAllocator(allocator.Get(), locator);
  } catch (...) {
    // Classifying composes a message, which may itself run out of memory.
    try {
      const helpers::DispatchedException caught = helpers::ClassifyCurrentException();
      TraceConstructionFailure(locator, caught.text);
      return caught.code;
    } catch (...) {
      return uvo::kErrOutOfMemory;
    }
  }
  const uvo::result_t constructed = factory->FinalConstruct();
  if (constructed < 0) {
    factory->Release();
    return constructed;
  }
  const uvo::result_t result = factory->QueryInterface(iid, out);
  factory->Release();
  return result;
}

uvo::result_t GetObjectFactory(uvo::IServiceLocator* /*locator*/, std::uint32_t clsid,
                               uvo::IObjectFactory** out) {
  if (out == nullptr) return uvo::kErrInvalidArgument;
  *out = nullptr;
  if (clsid != kAntiPhishingClassId) return uvo::kErrNotImplemented;
  auto* factory = new (std::nothrow) ModuleFactory();
  if (factory == nullptr) return uvo::kErrOutOfMemory;
  const uvo::result_t result =
      factory->QueryInterface(uvo::IObjectFactory::kIid, reinterpret_cast<void**>(out));
  factory->Release();
  return result;
}

uvo::result_t CanUnloadModule() {
  return uvo::detail::ModuleLockCount() == 0 ? uvo::kOk : uvo::kFalse;
}

}  // namespace cf::services::anti_phishing::heuristic
