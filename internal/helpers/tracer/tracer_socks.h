// A tracer that puts a fixed prefix before every line it passes to the host tracer. The
// module wraps the host tracer in one so that all its lines start "anti_phishing_service\t".
#pragma once

#include <string>

#include "framework/uvo/interfaces.h"
#include "framework/uvo/module_lock.h"
#include "framework/uvo/object.h"

namespace cf {

class TracerSocks final : public uvo::ObjectImpl<TracerSocks, uvo::ITracer> {
 public:
  // Takes the host tracer from `locator` and wraps it. Returns null when the locator hands
  // out no tracer. An empty prefix raises a LogicError (0x80000046).
  static uvo::Ptr<uvo::ITracer> Create(uvo::IServiceLocator* locator, const std::string& prefix);

  TracerSocks(uvo::Ptr<uvo::ITracer> host, std::string prefix);
  ~TracerSocks() = default;

  uvo::result_t CreateRecord(int level, char** buffer, std::uint32_t size) override;
  uvo::result_t CommitRecord(char* buffer, std::uint32_t length) override;

 private:
  uvo::detail::ObjectModuleAutoLock moduleLock_;
  uvo::Ptr<uvo::ITracer> host_;
  std::string prefix_;
};

}  // namespace cf
