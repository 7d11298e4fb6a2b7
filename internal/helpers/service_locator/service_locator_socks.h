// A locator that hands out a replacement for one host interface (the prefixed tracer) and
// forwards every other request to the host locator.
#pragma once

#include "framework/uvo/interfaces.h"
#include "framework/uvo/module_lock.h"
#include "framework/uvo/object.h"

namespace cf {

template <class Interface>
class ServiceLocatorSocks final
    : public uvo::ObjectImpl<ServiceLocatorSocks<Interface>, uvo::IServiceLocator> {
 public:
  // Null locator or null replacement raise a LogicError (0x80000046).
  static uvo::Ptr<uvo::IServiceLocator> Create(uvo::IServiceLocator* locator,
                                               Interface* replacement);

  ServiceLocatorSocks(uvo::IServiceLocator* host, Interface* replacement)
      : host_(uvo::Ptr<uvo::IServiceLocator>::Share(host)),
        replacement_(uvo::Ptr<Interface>::Share(replacement)) {}
  ~ServiceLocatorSocks() = default;

  uvo::result_t GetService(uvo::iid_t iid, std::uint32_t param, void** out) override;

 private:
  uvo::detail::ObjectModuleAutoLock moduleLock_;
  uvo::Ptr<uvo::IServiceLocator> host_;
  uvo::Ptr<Interface> replacement_;
};

extern template class ServiceLocatorSocks<uvo::ITracer>;

}  // namespace cf
