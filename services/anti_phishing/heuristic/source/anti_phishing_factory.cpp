#include "services/anti_phishing/heuristic/source/anti_phishing_factory.h"

#include "framework/uvo/exception.h"
#include "framework/uvo/result.h"
#include "internal/helpers/service_locator/service_locator_socks.h"
#include "internal/helpers/tracer/trace_writer.h"
#include "internal/helpers/tracer/tracer_socks.h"
#include "services/anti_phishing/heuristic/source/anti_phishing.h"

namespace cf::services::anti_phishing::heuristic {
namespace {

constexpr char kFinalConstruct[] =
    "cf::services::anti_phishing::heuristic::AntiPhishingFactory::FinalConstruct";
constexpr char kCreateService[] =
    "cf::services::anti_phishing::heuristic::AntiPhishingFactory::CreateAntiPhishingService";

helpers::LocatorServices WrapLocator(uvo::IServiceLocator* locator) {
  UVO_CHECK(locator != nullptr);
  uvo::Ptr<uvo::ITracer> tracer = TracerSocks::Create(locator, kTracePrefix);
  uvo::Ptr<uvo::IServiceLocator> wrapped =
      ServiceLocatorSocks<uvo::ITracer>::Create(locator, tracer.Get());
  return helpers::LocatorServices::From(wrapped.Get());
}

}  // namespace

AntiPhishingFactory::AntiPhishingFactory(uvo::IServiceLocator* locator)
    : services_(WrapLocator(locator)), dispatcher_(services_.tracer.Get()) {}

uvo::result_t AntiPhishingFactory::FinalConstruct() {
  try {
    tracerHolder_ = TracerHolder::Acquire(services_.tracer.Get());
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kFinalConstruct);
  }
}

uvo::result_t AntiPhishingFactory::CreateAntiPhishingService(uvo::IStream* knowledgeFile,
                                                             IAntiPhishingService** out) {
  try {
    UVO_CHECK(knowledgeFile != nullptr);
    UVO_CHECK(out != nullptr);
    UVO_CHECK(*out == nullptr);
    helpers::Trace(services_.tracer.Get(), 700,
                   std::string(kCreateService) + " creating anti-phishing service instance..");
    AntiPhishing* service =
        AntiPhishing::Create(services_.locator.Get(), knowledgeFile, tracerHolder_);
    UVO_CHECK(service != nullptr);
    helpers::Trace(services_.tracer.Get(), 600,
                   std::string(kCreateService) + " anti-phishing service instance created");
    *out = service;  // the creation reference goes to the host
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kCreateService);
  }
}

}  // namespace cf::services::anti_phishing::heuristic
