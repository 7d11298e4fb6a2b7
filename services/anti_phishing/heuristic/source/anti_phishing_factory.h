// The service factory the host obtains from the module factory. It wraps the host tracer so
// that every line the module traces starts "anti_phishing_service\t", connects the engine
// logger to it, and creates anti-phishing services on knowledge-base files.
#pragma once

#include <memory>

#include "framework/uvo/anti_phishing.h"
#include "framework/uvo/module_lock.h"
#include "framework/uvo/object.h"
#include "internal/helpers/exception/exception_dispatcher.h"
#include "internal/helpers/service_locator/locator_services.h"
#include "services/anti_phishing/heuristic/source/tracer_holder.h"

namespace cf::services::anti_phishing::heuristic {

// Prefix of every line the module traces.
inline constexpr char kTracePrefix[] = "anti_phishing_service\t";

class AntiPhishingFactory final
    : public uvo::ObjectImpl<AntiPhishingFactory, IAntiPhishingServiceFactory> {
 public:
  explicit AntiPhishingFactory(uvo::IServiceLocator* locator);
  ~AntiPhishingFactory() = default;

  // Creates the TracerHolder; returns a result code.
  uvo::result_t FinalConstruct();

  uvo::result_t CreateAntiPhishingService(uvo::IStream* knowledgeFile,
                                          IAntiPhishingService** out) override;

  uvo::ITracer* Tracer() const { return services_.tracer.Get(); }

 private:
  uvo::detail::ObjectModuleAutoLock moduleLock_;
  helpers::LocatorServices services_;  // from the wrapped locator: allocator, prefixed tracer
  std::shared_ptr<TracerHolder> tracerHolder_;
  helpers::ExceptionDispatcher dispatcher_;
};

}  // namespace cf::services::anti_phishing::heuristic
