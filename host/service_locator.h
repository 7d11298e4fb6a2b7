// The reference host's service locator: hands out its allocator and tracer, and any other
// object registered with it. Either service can be withheld to test the module's failure path.
#pragma once

#include <map>
#include <mutex>

#include "framework/uvo/interfaces.h"
#include "framework/uvo/object.h"

namespace pelmix::host {

class ServiceLocator final : public uvo::ObjectImpl<ServiceLocator, uvo::IServiceLocator> {
 public:
  static uvo::Ptr<ServiceLocator> Create(uvo::IAllocator* allocator, uvo::ITracer* tracer);
  ServiceLocator(uvo::IAllocator* allocator, uvo::ITracer* tracer);
  ~ServiceLocator() = default;

  uvo::result_t GetService(uvo::iid_t iid, std::uint32_t param, void** out) override;

  // A withheld service is refused with 0x8000004C ("Not found").
  void Withhold(uvo::iid_t iid, bool withhold = true);
  void Register(uvo::iid_t iid, uvo::IObject* service);

 private:
  std::mutex mutex_;
  std::map<uvo::iid_t, uvo::Ptr<uvo::IObject>> services_;
  std::map<uvo::iid_t, bool> withheld_;
};

}  // namespace pelmix::host
