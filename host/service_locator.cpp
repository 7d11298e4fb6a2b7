#include "host/service_locator.h"

#include "framework/uvo/result.h"

namespace pelmix::host {

uvo::Ptr<ServiceLocator> ServiceLocator::Create(uvo::IAllocator* allocator, uvo::ITracer* tracer) {
  return uvo::Ptr<ServiceLocator>::Adopt(new ServiceLocator(allocator, tracer));
}

ServiceLocator::ServiceLocator(uvo::IAllocator* allocator, uvo::ITracer* tracer) {
  if (allocator) Register(uvo::IAllocator::kIid, allocator);
  if (tracer) Register(uvo::ITracer::kIid, tracer);
}

uvo::result_t ServiceLocator::GetService(uvo::iid_t iid, std::uint32_t, void** out) {
  if (out == nullptr) return uvo::kErrInvalidArgument;
  *out = nullptr;
  std::lock_guard<std::mutex> lock(mutex_);
  if (iid == uvo::IServiceLocator::kIid) {
    *out = static_cast<uvo::IServiceLocator*>(this);
    AddRef();
    return uvo::kOk;
  }
  auto it = services_.find(iid);
  if (withheld_[iid] || it == services_.end()) return uvo::kErrNotFound;
  // The registered object answers for the identifier it was registered under.
  return it->second->QueryInterface(iid, out);
}

void ServiceLocator::Withhold(uvo::iid_t iid, bool withhold) {
  std::lock_guard<std::mutex> lock(mutex_);
  withheld_[iid] = withhold;
}

void ServiceLocator::Register(uvo::iid_t iid, uvo::IObject* service) {
  std::lock_guard<std::mutex> lock(mutex_);
  services_[iid] = uvo::Ptr<uvo::IObject>::Share(service);
}

}  // namespace pelmix::host
