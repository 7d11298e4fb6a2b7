// A web session: checks one page for the host. The host appends the page's HTML, then asks
// for the verdict and, if it wants, for the heuristic details; both are recomputed from all
// that was appended, in either order and as often as asked. One caller at a time.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "engine/checkers/web_checker_i.h"
#include "framework/uvo/anti_phishing.h"
#include "framework/uvo/module_lock.h"
#include "framework/uvo/object.h"
#include "internal/helpers/exception/exception_dispatcher.h"
#include "internal/helpers/service_locator/locator_services.h"
#include "services/anti_phishing/heuristic/source/adapters/external_data_handler.h"
#include "services/anti_phishing/heuristic/source/tracer_holder.h"

namespace cf::services::anti_phishing::heuristic {

class HttpSession final : public uvo::ObjectImpl<HttpSession, IHttpSession> {
 public:
  // Builds and initialises the session; returns the creation reference. `prefix` is the
  // session's trace prefix ("http session N\t"); every parameter goes to the checker in
  // order; with a `source`, the checker gets an external data handler on it.
  static HttpSession* Create(uvo::IServiceLocator* locator, const std::string& prefix,
                             std::shared_ptr<ap::easy2::WebCheckerI> checker,
                             const SessionSettings& settings, const SessionParamList* params,
                             std::shared_ptr<TracerHolder> tracerHolder,
                             IHttpExternalDataSource* source = nullptr);

  explicit HttpSession(uvo::IServiceLocator* locator);

  uvo::result_t AppendHtml(ByteRange html) override;
  uvo::result_t GetVerdict(Verdict* out) override;
  uvo::result_t GetHeuristicVerdictInfo(HeuristicVerdictInfo* out) override;

 private:
  void Initialize(const std::string& prefix, std::shared_ptr<ap::easy2::WebCheckerI> checker,
                  std::int32_t protectionLevel, std::shared_ptr<TracerHolder> tracerHolder);

  uvo::detail::ObjectModuleAutoLock moduleLock_;
  helpers::LocatorServices services_;
  std::shared_ptr<TracerHolder> tracerHolder_;
  helpers::ExceptionDispatcher dispatcher_;
  // Declared before the checker so that it outlives it: the checker holds a plain pointer.
  std::shared_ptr<ExternalDataHandler> extHandler_;
  std::shared_ptr<ap::easy2::WebCheckerI> checker_;
  std::int32_t protectionLevel_ = 0;
  std::string prefix_;
  bool traceFeatures_ = false;
};

}  // namespace cf::services::anti_phishing::heuristic
