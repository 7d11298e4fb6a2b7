// A mail session: checks one message for the host. The host hands over the message's parts
// (subject, text parts, attachments, images, the links it found) as it walks the message,
// then asks for the verdict and, if it wants, for the heuristic details; both are recomputed
// from everything added so far. One caller at a time.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "engine/checkers/mail_checker_i.h"
#include "framework/uvo/anti_phishing.h"
#include "framework/uvo/module_lock.h"
#include "framework/uvo/object.h"
#include "internal/helpers/exception/exception_dispatcher.h"
#include "internal/helpers/service_locator/locator_services.h"
#include "services/anti_phishing/heuristic/source/tracer_holder.h"

namespace cf::services::anti_phishing::heuristic {

// The level of the trace line that lists the vector a mail verdict judged; above the
// ordinary messages (700), so only a host that asks for it pays for it.
inline constexpr int kMailFeaturesTraceLevel = 750;

class MailSession final : public uvo::ObjectImpl<MailSession, IMailSession> {
 public:
  // Builds and initialises the session; returns the creation reference. `prefix` is the
  // session's trace prefix ("mail session N\t").
  static MailSession* Create(uvo::IServiceLocator* locator, const std::string& prefix,
                             std::shared_ptr<ap::easy2::MailCheckerI> checker,
                             const SessionSettings& settings,
                             std::shared_ptr<TracerHolder> tracerHolder);

  explicit MailSession(uvo::IServiceLocator* locator);

  uvo::result_t AddText(uvo::IStream* stream) override;
  uvo::result_t AddImage(uvo::IStream* stream) override;
  uvo::result_t AddAttachment(const char* name, const char* contentType,
                              uvo::IStream* stream) override;
  uvo::result_t AddUrl(const char* url, bool* out) override;
  uvo::result_t Reserved() override;
  uvo::result_t SetMessageSubject(const char* subject) override;
  uvo::result_t GetVerdict(Verdict* out) override;
  uvo::result_t GetHeuristicVerdictInfo(HeuristicVerdictInfo* out) override;

 private:
  uvo::detail::ObjectModuleAutoLock moduleLock_;
  helpers::LocatorServices services_;
  std::shared_ptr<TracerHolder> tracerHolder_;
  helpers::ExceptionDispatcher dispatcher_;
  std::shared_ptr<ap::easy2::MailCheckerI> checker_;
  std::int32_t protectionLevel_ = 0;
  std::string prefix_;
};

}  // namespace cf::services::anti_phishing::heuristic
