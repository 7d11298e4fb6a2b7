#include "internal/helpers/service_locator/service_locator_socks.h"

#include <new>

#include "framework/uvo/result.h"
#include "internal/helpers/exception/logic_error.h"

namespace cf {

template <class Interface>
uvo::Ptr<uvo::IServiceLocator> ServiceLocatorSocks<Interface>::Create(uvo::IServiceLocator* locator,
                                                                      Interface* replacement) {
  if (locator == nullptr) {
    throw helpers::LogicError("ServiceLocatorSocks::Create(): service locator requiered",
                              uvo::kErrInvalidArgument);
  }
  if (replacement == nullptr) {
    throw helpers::LogicError(
        "ServiceLocatorSocks::Create(): what is these socks about without interface?",
        uvo::kErrInvalidArgument);
  }
  auto* socks = new (std::nothrow) ServiceLocatorSocks(locator, replacement);
  if (socks == nullptr) {
    throw helpers::LogicError("ServiceLocatorSocks::Create(): failed to create an object",
                              uvo::kErrOutOfMemory);
  }
  return uvo::Ptr<uvo::IServiceLocator>::Adopt(socks);
}

template <class Interface>
uvo::result_t ServiceLocatorSocks<Interface>::GetService(uvo::iid_t iid, std::uint32_t param,
                                                         void** out) {
  if (out == nullptr) return uvo::kErrInvalidArgument;
  if (iid == Interface::kIid) {
    *out = replacement_.Get();
    if (replacement_) replacement_->AddRef();
    return uvo::kOk;
  }
  if (iid == uvo::IServiceLocator::kIid) {
    *out = static_cast<uvo::IServiceLocator*>(host_.Get());
    host_->AddRef();
    return uvo::kOk;
  }
  return host_->GetService(iid, param, out);
}

template class ServiceLocatorSocks<uvo::ITracer>;

}  // namespace cf
