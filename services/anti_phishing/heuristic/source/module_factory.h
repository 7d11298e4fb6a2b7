// The module's own object factory and the implementation of the two module exports.
#pragma once

#include <cstdint>

#include "framework/uvo/interfaces.h"
#include "framework/uvo/module_lock.h"
#include "framework/uvo/object.h"

namespace cf::services::anti_phishing::heuristic {

// Builds AntiPhishingFactory objects on the locator it is given.
class ModuleFactory final : public uvo::ObjectImpl<ModuleFactory, uvo::IObjectFactory> {
 public:
  ModuleFactory() = default;
  ~ModuleFactory() = default;
  uvo::result_t CreateInstance(uvo::IServiceLocator* locator, uvo::iid_t iid, void** out) override;

 private:
  uvo::detail::ObjectModuleAutoLock moduleLock_;
};

uvo::result_t GetObjectFactory(uvo::IServiceLocator* locator, std::uint32_t clsid,
                               uvo::IObjectFactory** out);
uvo::result_t CanUnloadModule();

}  // namespace cf::services::anti_phishing::heuristic
