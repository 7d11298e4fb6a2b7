#include "tools/pelmixd/service_holder.h"

#include "host/stream.h"
#include "host/tracer.h"
#include "tools/pelmixd/log.h"

namespace pelmix::pelmixd {
namespace {

using namespace cf::services::anti_phishing;

constexpr int kFailureLevel = 300;
constexpr char kProbeUrl[] = "http://localhost/";
constexpr char kProbePage[] = "<html><head><title>probe</title></head><body></body></html>";

// The module's last failure line, without its prefix.
std::string FailureLine(const std::vector<host::TraceLine>& lines) {
  for (auto it = lines.rbegin(); it != lines.rend(); ++it) {
    if (it->level != kFailureLevel) continue;
    const std::size_t tab = it->text.find('\t');
    return tab == std::string::npos ? it->text : it->text.substr(tab + 1);
  }
  return {};
}

}  // namespace

ServiceHolder::ServiceHolder(cli::ModuleHost& host, std::string kbPath)
    : host_(host), kbPath_(std::move(kbPath)) {}

std::string ServiceHolder::Load() {
  std::lock_guard<std::mutex> one(loading_);
  // The module's lines about this load stay with it rather than piling up in the tracer.
  host::Tracer::ThreadCapture capture(kFailureLevel);
  const auto failed = [&](const std::string& what, uvo::result_t code) {
    std::string text = what + ": " + cli::DescribeResult(code);
    if (const std::string line = FailureLine(capture.Take()); !line.empty()) text += ": " + line;
    return text;
  };

  std::string error;
  uvo::Ptr<host::FileStream> file = host::FileStream::Open(kbPath_, &error);
  if (!file) return kbPath_ + ": " + error;

  auto loaded = std::make_shared<LoadedService>();
  loaded->kbPath = kbPath_;
  uvo::Ptr<IAntiPhishingServiceFactory> factory;
  uvo::result_t code = host_.CreateServiceFactory(&factory);
  if (code < 0) return failed("no service factory", code);
  code = factory->CreateAntiPhishingService(file.Get(), loaded->service.Receive());
  if (code < 0) return failed(kbPath_ + ": the service failed to load", code);
  code = loaded->service->GetHttpSessionFactory(loaded->web.Receive());
  if (code < 0) return failed("no web session factory", code);
  code = loaded->service->GetMailSessionFactory(loaded->mail.Receive());
  if (code < 0) return failed("no mail session factory", code);

  // A page judged end to end proves the service works and tells its knowledge-base stamp.
  uvo::Ptr<IHttpSession> probe;
  const SessionSettings settings{2};
  const SessionParamList none{nullptr, nullptr};
  code = loaded->web->CreateSession(&settings, kProbeUrl, &none, probe.Receive());
  if (code >= 0) {
    code = probe->AppendHtml({kProbePage, kProbePage + sizeof kProbePage - 1});
  }
  HeuristicVerdictInfo info{};
  if (code >= 0) code = probe->GetHeuristicVerdictInfo(&info);
  if (code < 0) return failed(kbPath_ + ": the probe page could not be judged", code);
  loaded->dbstamp = info.dbstamp;
  loaded->loadedAt = std::chrono::system_clock::now();

  std::lock_guard<std::mutex> lock(mutex_);
  current_ = std::move(loaded);
  return {};
}

std::shared_ptr<const LoadedService> ServiceHolder::Current() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return current_;
}

std::string StartServing(std::string& module, std::string& kb, ServingHost& out) {
  if (kb.empty()) kb = cli::DefaultKnowledgeBase();
  if (module.empty()) module = cli::DefaultModulePath();
  try {
    out.host = std::make_unique<cli::ModuleHost>(cli::GlobalOptions{module, std::nullopt});
  } catch (const std::exception& e) {
    return e.what();
  }
  out.services = std::make_unique<ServiceHolder>(*out.host, kb);
  if (std::string error = out.services->Load(); !error.empty()) return error;
  Log("knowledge base " + kb + " loaded, stamp " +
      std::to_string(out.services->Current()->dbstamp));
  return {};
}

}  // namespace pelmix::pelmixd
