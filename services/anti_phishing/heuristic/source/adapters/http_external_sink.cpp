#include "services/anti_phishing/heuristic/source/adapters/http_external_sink.h"

#include <string>

#include "framework/uvo/exception.h"
#include "framework/uvo/result.h"

namespace cf::services::anti_phishing::heuristic {
namespace {

constexpr char kSetSessionParams[] =
    "cf::services::anti_phishing::heuristic::HttpExternalSink::SetSessionParams";
constexpr char kAppendData[] =
    "cf::services::anti_phishing::heuristic::HttpExternalSink::AppendData";

std::string Copy(const char* text) { return text != nullptr ? std::string(text) : std::string(); }

}  // namespace

HttpExternalSink* HttpExternalSink::Create(uvo::IServiceLocator* locator,
                                           std::shared_ptr<ap::easy2::ExtDataReceiver> receiver) {
  UVO_CHECK(locator != nullptr);
  UVO_CHECK(receiver != nullptr);
  return new HttpExternalSink(locator, std::move(receiver));
}

HttpExternalSink::HttpExternalSink(uvo::IServiceLocator* locator,
                                   std::shared_ptr<ap::easy2::ExtDataReceiver> receiver)
    : services_(helpers::LocatorServices::From(locator)),
      receiver_(std::move(receiver)),
      dispatcher_(services_.tracer.Get()) {
  platform::InitializeCriticalSection(&section_);
}

HttpExternalSink::~HttpExternalSink() { platform::DeleteCriticalSection(&section_); }

std::shared_ptr<ap::easy2::ExtDataReceiver> HttpExternalSink::Receiver() {
  platform::CriticalSectionLock lock(section_);
  return receiver_;
}

uvo::result_t HttpExternalSink::SetSessionParams(const SessionParamList* params) {
  try {
    const std::shared_ptr<ap::easy2::ExtDataReceiver> receiver = Receiver();
    if (receiver == nullptr || params == nullptr) return uvo::kOk;
    UVO_CHECK((params->begin == nullptr) == (params->end == nullptr));
    UVO_CHECK(params->begin <= params->end);
    for (const SessionParam* p = params->begin; p != params->end; ++p) {
      receiver->SetParameter(Copy(p->name), Copy(p->value));
    }
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kSetSessionParams);
  }
}

uvo::result_t HttpExternalSink::AppendData(ByteRange data) {
  try {
    const std::shared_ptr<ap::easy2::ExtDataReceiver> receiver = Receiver();
    if (receiver == nullptr) return uvo::kOk;
    // A reversed range is the host's fault; it must not turn into a huge length.
    UVO_CHECK(data.begin <= data.end);
    receiver->AppendData(data.begin, static_cast<std::size_t>(data.end - data.begin));
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kAppendData);
  }
}

uvo::result_t HttpExternalSink::Close() {
  std::shared_ptr<ap::easy2::ExtDataReceiver> dropped;
  {
    platform::CriticalSectionLock lock(section_);
    dropped.swap(receiver_);
  }
  // The receiver goes (if this was its last reference) outside the lock.
  return uvo::kOk;
}

}  // namespace cf::services::anti_phishing::heuristic
