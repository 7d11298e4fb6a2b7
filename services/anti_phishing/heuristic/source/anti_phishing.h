// The anti-phishing service handed to the host: owns the check factory (and through it every
// loaded knowledge base), makes web and mail sessions, and answers white-domain questions.
#pragma once

#include <functional>
#include <memory>
#include <string>

#include "engine/checkers/check_factory_i.h"
#include "engine/common/file_interfaces.h"
#include "framework/uvo/anti_phishing.h"
#include "framework/uvo/module_lock.h"
#include "framework/uvo/object.h"
#include "internal/helpers/exception/exception_dispatcher.h"
#include "internal/helpers/service_locator/locator_services.h"
#include "platform/critical_section.h"
#include "services/anti_phishing/heuristic/source/tracer_holder.h"

namespace cf::services::anti_phishing::heuristic {

// Maps a session's protection level (1..3) to the engine's confidence (2..0); any other
// level raises std::runtime_error "GetConfidence: unexpected protection level value - N".
int GetConfidence(std::int32_t protectionLevel);

// The process-wide session counter; the next value numbers the next session.
std::uint32_t NextSessionNumber();

// Builds the check factory on the knowledge-base file (the engine's loader by default).
using CheckFactoryBuilder =
    std::function<std::shared_ptr<ap::easy2::CheckFactoryI>(std::shared_ptr<ap::FileIO> file)>;
std::shared_ptr<ap::easy2::CheckFactoryI> BuildCheckFactory(std::shared_ptr<ap::FileIO> file);

class AntiPhishing final : public uvo::ObjectImpl<AntiPhishing, IAntiPhishingService,
                                                  IHttpSessionFactory, IMailSessionFactory> {
 public:
  // Builds the service in memory from the locator's allocator and initialises it on the
  // knowledge-base file. Returns the creation reference; raises on any failure.
  static AntiPhishing* Create(uvo::IServiceLocator* locator, uvo::IStream* knowledgeFile,
                              std::shared_ptr<TracerHolder> tracerHolder,
                              const CheckFactoryBuilder& build = BuildCheckFactory);

  explicit AntiPhishing(uvo::IServiceLocator* locator);
  ~AntiPhishing();

  // IAntiPhishingService
  uvo::result_t GetHttpSessionFactory(IHttpSessionFactory** out) override;
  uvo::result_t GetMailSessionFactory(IMailSessionFactory** out) override;
  uvo::result_t IsDomainWhite(const char* domain, bool* out) override;
  // IHttpSessionFactory
  uvo::result_t CreateSession(const SessionSettings* settings, const char* url,
                              const SessionParamList* params, IHttpSession** out) override;
  uvo::result_t CreateSessionWithExternalDataSource(const SessionSettings* settings,
                                                    const char* url, const SessionParamList* params,
                                                    IHttpExternalDataSource* source,
                                                    IHttpSession** out) override;
  // IMailSessionFactory
  uvo::result_t CreateSession(const SessionSettings* settings, IMailSession** out) override;

 private:
  void Initialize(uvo::IStream* knowledgeFile, std::shared_ptr<TracerHolder> tracerHolder,
                  const CheckFactoryBuilder& build);
  // Both web CreateSession operations; `source` is null for the plain one.
  uvo::result_t CreateWebSession(const char* place, const SessionSettings* settings,
                                 const char* url, const SessionParamList* params,
                                 IHttpExternalDataSource* source, IHttpSession** out);

  uvo::detail::ObjectModuleAutoLock moduleLock_;
  helpers::LocatorServices services_;
  std::shared_ptr<TracerHolder> tracerHolder_;
  helpers::ExceptionDispatcher dispatcher_;
  std::shared_ptr<ap::easy2::CheckFactoryI> checkFactory_;
  platform::CriticalSection whiteDomainSection_;
};

}  // namespace cf::services::anti_phishing::heuristic
