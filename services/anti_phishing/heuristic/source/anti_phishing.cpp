#include "services/anti_phishing/heuristic/source/anti_phishing.h"

#include <atomic>
#include <new>
#include <stdexcept>

#include "engine/checkers/check_factory_v3.h"
#include "framework/uvo/exception.h"
#include "framework/uvo/result.h"
#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"
#include "internal/helpers/tracer/trace_writer.h"
#include "services/anti_phishing/heuristic/source/http_session.h"
#include "services/anti_phishing/heuristic/source/mail_session.h"

namespace cf::services::anti_phishing::heuristic {
namespace {

constexpr char kInitialize[] = "cf::services::anti_phishing::heuristic::AntiPhishing::Initialize";
constexpr char kGetHttpSessionFactory[] =
    "cf::services::anti_phishing::heuristic::AntiPhishing::GetHttpSessionFactory";
constexpr char kGetMailSessionFactory[] =
    "cf::services::anti_phishing::heuristic::AntiPhishing::GetMailSessionFactory";
constexpr char kCreateSession[] =
    "cf::services::anti_phishing::heuristic::AntiPhishing::CreateSession";
constexpr char kCreateSessionWithExternalDataSource[] =
    "cf::services::anti_phishing::heuristic::AntiPhishing::CreateSessionWithExternalDataSource";
constexpr char kIsDomainWhite[] =
    "cf::services::anti_phishing::heuristic::AntiPhishing::IsDomainWhite";

// Serialises every construction of a check factory (and so every knowledge-base load) in
// the process.
platform::CriticalSection& ConstructionLock() {
  static platform::CriticalSection section;
  return section;
}

std::atomic<std::uint32_t> sessionCounter{0};

// "%s %u\t", composed by hand: Boost.Format parses through the locale's ctype facet, whose
// lazily filled narrow cache libstdc++ writes without a lock, and sessions are created on
// many threads at once.
std::string SessionPrefix(const char* kind) {
  return std::string(kind) + ' ' + std::to_string(NextSessionNumber()) + '\t';
}

}  // namespace

std::shared_ptr<ap::easy2::CheckFactoryI> BuildCheckFactory(std::shared_ptr<ap::FileIO> file) {
  return std::make_shared<easy3_impl::CheckFactoryV3>(std::move(file));
}

int GetConfidence(std::int32_t protectionLevel) {
  switch (protectionLevel) {
    case 1:
      return 2;
    case 2:
      return 1;
    case 3:
      return 0;
    default:
      throw std::runtime_error("GetConfidence: unexpected protection level value - " +
                               std::to_string(protectionLevel));
  }
}

std::uint32_t NextSessionNumber() { return sessionCounter.fetch_add(1) + 1; }

AntiPhishing* AntiPhishing::Create(uvo::IServiceLocator* locator, uvo::IStream* knowledgeFile,
                                   std::shared_ptr<TracerHolder> tracerHolder,
                                   const CheckFactoryBuilder& build) {
  UVO_CHECK(locator != nullptr);
  UVO_CHECK(knowledgeFile != nullptr);
  UVO_CHECK(tracerHolder != nullptr);
  uvo::Ptr<uvo::IAllocator> allocator;
  UVO_CHECK_RESULT(locator->GetService(uvo::IAllocator::kIid, 0, allocator.ReceiveVoid()));
  UVO_CHECK(allocator);
  AntiPhishing* service = CreateWithAllocator(allocator.Get(), locator);
  try {
    service->Initialize(knowledgeFile, std::move(tracerHolder), build);
  } catch (...) {
    service->Release();
    throw;
  }
  return service;
}

AntiPhishing::AntiPhishing(uvo::IServiceLocator* locator)
    : services_(helpers::LocatorServices::From(locator)), dispatcher_(services_.tracer.Get()) {
  platform::InitializeCriticalSection(&whiteDomainSection_);
}

AntiPhishing::~AntiPhishing() { platform::DeleteCriticalSection(&whiteDomainSection_); }

void AntiPhishing::Initialize(uvo::IStream* knowledgeFile,
                              std::shared_ptr<TracerHolder> tracerHolder,
                              const CheckFactoryBuilder& build) {
  UVO_CHECK(knowledgeFile != nullptr);
  UVO_CHECK(tracerHolder != nullptr);
  auto adapter = std::make_shared<adapters::AntiphishingIOAdapter>(knowledgeFile);
  helpers::Trace(services_.tracer.Get(), 700,
                 std::string(kInitialize) + " creating heuristic checker factory..");
  std::shared_ptr<ap::easy2::CheckFactoryI> factory;
  {
    platform::CriticalSectionLock lock(ConstructionLock());
    factory = build(std::move(adapter));
  }
  helpers::Trace(services_.tracer.Get(), 700,
                 std::string(kInitialize) + " heuristic checker factory was created successfully");
  checkFactory_ = std::move(factory);
  tracerHolder_ = std::move(tracerHolder);
}

uvo::result_t AntiPhishing::GetHttpSessionFactory(IHttpSessionFactory** out) {
  try {
    UVO_CHECK(out != nullptr);
    *out = this;
    AddRef();
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kGetHttpSessionFactory);
  }
}

uvo::result_t AntiPhishing::GetMailSessionFactory(IMailSessionFactory** out) {
  try {
    UVO_CHECK(out != nullptr);
    *out = this;
    AddRef();
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kGetMailSessionFactory);
  }
}

uvo::result_t AntiPhishing::IsDomainWhite(const char* domain, bool* out) {
  if (out == nullptr || domain == nullptr) return uvo::kErrInvalidArgument;
  // The host boundary must see a result code whatever happens inside.
  try {
    platform::CriticalSectionLock lock(whiteDomainSection_);
    const std::string copy(domain);
    UVO_CHECK(checkFactory_ != nullptr);
    *out = checkFactory_->IsWhiteDomain(copy);
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kIsDomainWhite);
  }
}

uvo::result_t AntiPhishing::CreateWebSession(const char* place, const SessionSettings* settings,
                                             const char* url, const SessionParamList* params,
                                             IHttpExternalDataSource* source, IHttpSession** out) {
  if (out == nullptr) return uvo::kErrInvalidArgument;
  try {
    UVO_CHECK(checkFactory_ != nullptr);
    UVO_CHECK(settings != nullptr);
    UVO_CHECK(url != nullptr);
    const std::string page(url);
    const int confidence = GetConfidence(settings->protectionLevel);
    std::shared_ptr<ap::easy2::WebCheckerI> checker =
        checkFactory_->CreateWebChecker(page, confidence);
    if (!checker) throw std::runtime_error("Can't create web checker");
    const std::string prefix = SessionPrefix("http session");
    auto session = uvo::Ptr<HttpSession>::Adopt(HttpSession::Create(services_.locator.Get(), prefix,
                                                                    std::move(checker), *settings,
                                                                    params, tracerHolder_, source));
    if (!session) throw std::runtime_error("Can't create new session");
    *out = session.Detach();
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(place);
  }
}

uvo::result_t AntiPhishing::CreateSession(const SessionSettings* settings, const char* url,
                                          const SessionParamList* params, IHttpSession** out) {
  return CreateWebSession(kCreateSession, settings, url, params, nullptr, out);
}

uvo::result_t AntiPhishing::CreateSessionWithExternalDataSource(const SessionSettings* settings,
                                                                const char* url,
                                                                const SessionParamList* params,
                                                                IHttpExternalDataSource* source,
                                                                IHttpSession** out) {
  return CreateWebSession(kCreateSessionWithExternalDataSource, settings, url, params, source, out);
}

uvo::result_t AntiPhishing::CreateSession(const SessionSettings* settings, IMailSession** out) {
  if (out == nullptr) return uvo::kErrInvalidArgument;
  try {
    UVO_CHECK(checkFactory_ != nullptr);
    UVO_CHECK(settings != nullptr);
    const int confidence = GetConfidence(settings->protectionLevel);
    std::shared_ptr<ap::easy2::MailCheckerI> checker = checkFactory_->CreateMailChecker(confidence);
    if (!checker) throw std::runtime_error("Can't create mail checker");
    const std::string prefix = SessionPrefix("mail session");
    auto session = uvo::Ptr<MailSession>::Adopt(MailSession::Create(
        services_.locator.Get(), prefix, std::move(checker), *settings, tracerHolder_));
    if (!session) throw std::runtime_error("Can't create new session");
    *out = session.Detach();
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kCreateSession);
  }
}

}  // namespace cf::services::anti_phishing::heuristic
