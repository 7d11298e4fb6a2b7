#include "services/anti_phishing/heuristic/source/mail_session.h"

#include <cstdio>
#include <vector>

#include "framework/uvo/exception.h"
#include "framework/uvo/result.h"
#include "internal/helpers/tracer/trace_writer.h"
#include "services/anti_phishing/heuristic/source/stream_wrappers.h"
#include "services/anti_phishing/heuristic/source/verdict_records.h"

namespace cf::services::anti_phishing::heuristic {
namespace {

constexpr char kPlace[] = "cf::services::anti_phishing::heuristic::MailSession::";
constexpr char kAddText[] = "cf::services::anti_phishing::heuristic::MailSession::AddText";
constexpr char kAddImage[] = "cf::services::anti_phishing::heuristic::MailSession::AddImage";
constexpr char kAddAttachment[] =
    "cf::services::anti_phishing::heuristic::MailSession::AddAttachment";
constexpr char kAddUrl[] = "cf::services::anti_phishing::heuristic::MailSession::AddUrl";
constexpr char kSetMessageSubject[] =
    "cf::services::anti_phishing::heuristic::MailSession::SetMessageSubject";
constexpr char kGetVerdict[] = "cf::services::anti_phishing::heuristic::MailSession::GetVerdict";
constexpr char kGetHeuristicVerdictInfo[] =
    "cf::services::anti_phishing::heuristic::MailSession::GetHeuristicVerdictInfo";

// The operation's own name, after the namespace and class: the mail session's trace lines
// name it so.
const char* ShortName(const char* place) { return place + sizeof(kPlace) - 1; }

}  // namespace

MailSession* MailSession::Create(uvo::IServiceLocator* locator, const std::string& prefix,
                                 std::shared_ptr<ap::easy2::MailCheckerI> checker,
                                 const SessionSettings& settings,
                                 std::shared_ptr<TracerHolder> tracerHolder) {
  UVO_CHECK(locator != nullptr);
  auto session = uvo::Ptr<MailSession>::Adopt(new MailSession(locator));
  UVO_CHECK(!prefix.empty());
  UVO_CHECK(checker != nullptr);
  UVO_CHECK(static_cast<std::uint32_t>(settings.protectionLevel - 1) < 3u);
  UVO_CHECK(tracerHolder != nullptr);
  session->prefix_ = prefix;
  session->checker_ = std::move(checker);
  session->protectionLevel_ = settings.protectionLevel;
  session->tracerHolder_ = std::move(tracerHolder);
  return session.Detach();
}

MailSession::MailSession(uvo::IServiceLocator* locator)
    : services_(helpers::LocatorServices::From(locator)), dispatcher_(services_.tracer.Get()) {}

uvo::result_t MailSession::AddText(uvo::IStream* stream) {
  try {
    UVO_CHECK(stream != nullptr);
    checker_->AddText(std::make_shared<ReadableFileStream>(stream));
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kAddText);
  }
}

uvo::result_t MailSession::AddImage(uvo::IStream* stream) {
  try {
    UVO_CHECK(stream != nullptr);
    checker_->AddImage(std::make_shared<ImageLoadStream>(stream));
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kAddImage);
  }
}

uvo::result_t MailSession::AddAttachment(const char* name, const char* contentType,
                                         uvo::IStream* stream) {
  try {
    UVO_CHECK(name != nullptr);
    UVO_CHECK(contentType != nullptr);
    UVO_CHECK(stream != nullptr);
    checker_->AddAttachment(name, contentType, std::make_shared<ReadableFileStream>(stream));
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kAddAttachment);
  }
}

uvo::result_t MailSession::AddUrl(const char* url, bool* out) {
  try {
    UVO_CHECK(url != nullptr && *url != '\0');
    UVO_CHECK(out != nullptr);
    *out = checker_->AddUrl(url);
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kAddUrl);
  }
}

uvo::result_t MailSession::Reserved() { return uvo::kOk; }

uvo::result_t MailSession::SetMessageSubject(const char* subject) {
  try {
    UVO_CHECK(subject != nullptr);
    checker_->SetSubject(subject);
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kSetMessageSubject);
  }
}

uvo::result_t MailSession::GetVerdict(Verdict* out) {
  if (out == nullptr) return uvo::kErrInvalidArgument;
  try {
    AnswerVerdict(*checker_,
                  {services_.tracer.Get(), prefix_, ShortName(kGetVerdict), protectionLevel_},
                  *out);
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kGetVerdict);
  }
}

uvo::result_t MailSession::GetHeuristicVerdictInfo(HeuristicVerdictInfo* out) {
  if (out == nullptr) return uvo::kErrInvalidArgument;
  try {
    AnswerHeuristicVerdictInfo(
        *checker_,
        {services_.tracer.Get(), prefix_, ShortName(kGetHeuristicVerdictInfo), protectionLevel_},
        services_.allocator.Get(), kMailFeaturesTraceLevel, *out);
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kGetHeuristicVerdictInfo);
  }
}

}  // namespace cf::services::anti_phishing::heuristic
