// Taking host services from a locator, and the three services every locator-built object of
// the module keeps: the allocator, the tracer and the locator itself.
#pragma once

#include "framework/uvo/exception.h"
#include "framework/uvo/interfaces.h"
#include "framework/uvo/object.h"

namespace cf::helpers {

// Asks `locator` for interface T. A failing result raises uvo::GetInterfaceException; a
// successful call may still hand out null.
template <class T>
uvo::Ptr<T> GetService(uvo::IServiceLocator* locator) {
  uvo::Ptr<T> service;
  const uvo::result_t result = locator->GetService(T::kIid, 0, service.ReceiveVoid());
  if (result < 0) {
    throw uvo::GetInterfaceException(uvo::SourceBaseName(__FILE__), __LINE__, __func__, T::kIid,
                                     result);
  }
  return service;
}

struct LocatorServices {
  uvo::Ptr<uvo::IAllocator> allocator;
  uvo::Ptr<uvo::ITracer> tracer;
  uvo::Ptr<uvo::IServiceLocator> locator;

  // Takes the allocator and the tracer from `locator` and one reference to it.
  static LocatorServices From(uvo::IServiceLocator* locator) {
    LocatorServices services;
    services.allocator = GetService<uvo::IAllocator>(locator);
    services.tracer = GetService<uvo::ITracer>(locator);
    services.locator = uvo::Ptr<uvo::IServiceLocator>::Share(locator);
    return services;
  }
};

}  // namespace cf::helpers
