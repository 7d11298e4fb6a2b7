// The module's only exported functions.
#include "framework/uvo/interfaces.h"
#include "services/anti_phishing/heuristic/source/module_factory.h"

namespace heuristic = cf::services::anti_phishing::heuristic;

extern "C" {

__attribute__((visibility("default"))) uvo::result_t uvoGetObjectFactory(
    uvo::IServiceLocator* locator, std::uint32_t clsid, uvo::IObjectFactory** out) {
  return heuristic::GetObjectFactory(locator, clsid, out);
}

__attribute__((visibility("default"))) uvo::result_t uvoCanUnloadModule() {
  return heuristic::CanUnloadModule();
}

}  // extern "C"
