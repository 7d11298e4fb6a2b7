#include "services/anti_phishing/heuristic/source/http_session.h"

#include <cstdio>
#include <vector>

#include "framework/uvo/exception.h"
#include "framework/uvo/result.h"
#include "internal/helpers/tracer/trace_writer.h"
#include "services/anti_phishing/heuristic/source/verdict_records.h"

namespace cf::services::anti_phishing::heuristic {
namespace {

constexpr char kAppendHtml[] = "cf::services::anti_phishing::heuristic::HttpSession::AppendHtml";
constexpr char kGetVerdict[] = "cf::services::anti_phishing::heuristic::HttpSession::GetVerdict";
constexpr char kGetHeuristicVerdictInfo[] =
    "cf::services::anti_phishing::heuristic::HttpSession::GetHeuristicVerdictInfo";
constexpr int kVerdictTraceLevel = 700;

}  // namespace

HttpSession* HttpSession::Create(uvo::IServiceLocator* locator, const std::string& prefix,
                                 std::shared_ptr<ap::easy2::WebCheckerI> checker,
                                 const SessionSettings& settings, const SessionParamList* params,
                                 std::shared_ptr<TracerHolder> tracerHolder,
                                 IHttpExternalDataSource* source) {
  UVO_CHECK(locator != nullptr);
  UVO_CHECK(tracerHolder != nullptr);
  auto session = uvo::Ptr<HttpSession>::Adopt(new HttpSession(locator));
  session->Initialize(prefix, std::move(checker), settings.protectionLevel,
                      std::move(tracerHolder));
  if (params != nullptr) {
    // A reversed or half-null range would walk outside the host's list.
    UVO_CHECK((params->begin == nullptr) == (params->end == nullptr));
    UVO_CHECK(params->begin <= params->end);
    for (const SessionParam* p = params->begin; p != params->end; ++p) {
      // A null name or value reads as empty, as the external data sink reads them.
      const std::string name = p->name != nullptr ? p->name : "";
      const std::string value = p->value != nullptr ? p->value : "";
      session->checker_->SetParameter(name, value);
      if (name == kTraceFeaturesParameter) session->traceFeatures_ = value == "1";
    }
  }
  // After the parameters, when the checker is in place.
  if (source != nullptr) {
    session->extHandler_ = std::make_shared<ExternalDataHandler>(locator, source);
    session->checker_->SetExtHandler(session->extHandler_.get());
  }
  return session.Detach();
}

HttpSession::HttpSession(uvo::IServiceLocator* locator)
    : services_(helpers::LocatorServices::From(locator)), dispatcher_(services_.tracer.Get()) {}

void HttpSession::Initialize(const std::string& prefix,
                             std::shared_ptr<ap::easy2::WebCheckerI> checker,
                             std::int32_t protectionLevel,
                             std::shared_ptr<TracerHolder> tracerHolder) {
  UVO_CHECK(!prefix.empty());
  UVO_CHECK(checker != nullptr);
  UVO_CHECK(static_cast<std::uint32_t>(protectionLevel - 1) < 3u);
  UVO_CHECK(tracerHolder != nullptr);
  prefix_ = prefix;
  checker_ = std::move(checker);
  protectionLevel_ = protectionLevel;
  tracerHolder_ = std::move(tracerHolder);
}

uvo::result_t HttpSession::AppendHtml(ByteRange html) {
  try {
    if (html.begin == html.end) return uvo::kFalse;
    // A reversed or half-null range would read outside the host's memory.
    UVO_CHECK(html.begin != nullptr && html.end != nullptr && html.begin < html.end);
    checker_->AppendData(html.begin, static_cast<std::size_t>(html.end - html.begin));
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kAppendHtml);
  }
}

uvo::result_t HttpSession::GetVerdict(Verdict* out) {
  if (out == nullptr) return uvo::kErrInvalidArgument;
  try {
    AnswerVerdict(*checker_, {services_.tracer.Get(), prefix_, kGetVerdict, protectionLevel_},
                  *out);
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kGetVerdict);
  }
}

uvo::result_t HttpSession::GetHeuristicVerdictInfo(HeuristicVerdictInfo* out) {
  if (out == nullptr) return uvo::kErrInvalidArgument;
  try {
    AnswerHeuristicVerdictInfo(
        *checker_, {services_.tracer.Get(), prefix_, kGetHeuristicVerdictInfo, protectionLevel_},
        services_.allocator.Get(),
        traceFeatures_ ? std::optional<int>(kVerdictTraceLevel) : std::nullopt, *out);
    return uvo::kOk;
  } catch (...) {
    return dispatcher_.Dispatch(kGetHeuristicVerdictInfo);
  }
}

}  // namespace cf::services::anti_phishing::heuristic
