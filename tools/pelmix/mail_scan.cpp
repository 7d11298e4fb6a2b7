#include "tools/pelmix/mail_scan.h"

#include "host/stream.h"
#include "host/tracer.h"
#include "tools/mail/message_walk.h"

namespace pelmix::cli {
namespace {

using namespace cf::services::anti_phishing;

constexpr int kFailureLevel = 300;
// The mail session traces the vector it judged at this level (above ordinary messages).
constexpr int kFeaturesLevel = 750;

uvo::Ptr<host::MemoryStream> StreamOf(std::string_view data) {
  return host::MemoryStream::Create(std::string(data));
}

// Hands every part the walk reports to the session; the first failing call is kept.
class SessionSink final : public mail::MessageSink {
 public:
  explicit SessionSink(IMailSession& session) : session_(session) {}

  void Subject(std::string_view subject, int depth) override {
    if (depth != 0) return;  // a forwarded message's subject is part of its body
    const std::string text(subject);
    Keep("SetMessageSubject", session_.SetMessageSubject(text.c_str()));
  }
  void Text(std::string_view data, const mail::PartInfo&) override {
    Keep("AddText", session_.AddText(StreamOf(data).Get()));
  }
  void Image(std::string_view data, const mail::PartInfo&) override {
    Keep("AddImage", session_.AddImage(StreamOf(data).Get()));
  }
  void Attachment(std::string_view name, std::string_view data,
                  const mail::PartInfo& part) override {
    const std::string n(name), type(part.contentType);
    Keep("AddAttachment", session_.AddAttachment(n.c_str(), type.c_str(), StreamOf(data).Get()));
  }
  void Url(std::string_view url) override {
    if (url.empty()) return;
    const std::string u(url);
    bool white = false;
    Keep("AddUrl", session_.AddUrl(u.c_str(), &white));
  }

  const char* failedCall = nullptr;
  uvo::result_t failure = 0;

 private:
  void Keep(const char* call, uvo::result_t code) {
    if (code < 0 && failedCall == nullptr) {
      failedCall = call;
      failure = code;
    }
  }
  IMailSession& session_;
};

}  // namespace

Judgement ScanMessage(IMailSessionFactory& sessions, const mail::MessageBuffer& message,
                      const MailScanOptions& options) {
  Judgement result;
  host::Tracer::ThreadCapture capture(options.features ? kFeaturesLevel : kFailureLevel);
  const SessionSettings settings{options.level};
  uvo::Ptr<IMailSession> session;
  uvo::result_t code = sessions.CreateSession(&settings, session.Receive());
  if (code < 0) {
    result.error = Failure("no session", code, capture.Take());
    return result;
  }
  SessionSink sink(*session.Get());
  const mail::WalkReport report = mail::WalkMessage(message, sink);
  if (!report.readable) {
    result.error = "unreadable message: " + report.error;
    return result;
  }
  if (sink.failedCall != nullptr) {
    result.error = Failure(sink.failedCall, sink.failure, capture.Take());
    return result;
  }
  if (!AskRecords(*session.Get(), capture, result)) return result;
  if (options.features) result.features = FeaturesOf(capture.Take(), kFeaturesLevel);
  return result;
}

}  // namespace pelmix::cli
