// The sink a host's external data source delivers into: it forwards session parameters and
// data blocks to the engine's receiver until Close. The host may deliver, and close, on its
// own threads: each delivery works on its own reference to the receiver, taken under the
// sink's lock, so Close never frees a receiver in use.
#pragma once

#include <memory>

#include "engine/checkers/base_checker.h"
#include "framework/uvo/anti_phishing.h"
#include "framework/uvo/module_lock.h"
#include "framework/uvo/object.h"
#include "internal/helpers/exception/exception_dispatcher.h"
#include "internal/helpers/service_locator/locator_services.h"
#include "platform/critical_section.h"

namespace cf::services::anti_phishing::heuristic {

class HttpExternalSink final : public uvo::ObjectImpl<HttpExternalSink, IHttpExternalSink> {
 public:
  // Returns the creation reference. The locator and the receiver must be non-null.
  static HttpExternalSink* Create(uvo::IServiceLocator* locator,
                                  std::shared_ptr<ap::easy2::ExtDataReceiver> receiver);

  HttpExternalSink(uvo::IServiceLocator* locator,
                   std::shared_ptr<ap::easy2::ExtDataReceiver> receiver);
  ~HttpExternalSink();

  uvo::result_t SetSessionParams(const SessionParamList* params) override;
  uvo::result_t AppendData(ByteRange data) override;
  uvo::result_t Close() override;

 private:
  std::shared_ptr<ap::easy2::ExtDataReceiver> Receiver();

  uvo::detail::ObjectModuleAutoLock moduleLock_;
  helpers::LocatorServices services_;
  std::shared_ptr<ap::easy2::ExtDataReceiver> receiver_;  // emptied by Close
  helpers::ExceptionDispatcher dispatcher_;
  platform::CriticalSection section_;
};

}  // namespace cf::services::anti_phishing::heuristic
