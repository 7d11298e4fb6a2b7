#include "tools/pelmix/module_host.h"

#include <cstdlib>
#include <filesystem>
#include <iostream>

#include "framework/uvo/result.h"
#include "framework/uvo/text.h"

namespace pelmix::cli {

ModuleHost::ModuleHost(const GlobalOptions& options) : host_(options.traceLevel.value_or(0)) {
  if (options.traceLevel) {
    host_.tracer->SetEcho(&std::cerr);
  } else {
    // Without --trace the module's lines are still kept for the command to report.
    host_.tracer->SetTraceLevel(300);
  }
  module_ = std::make_unique<host::Module>(options.modulePath);
}

uvo::result_t ModuleHost::CreateServiceFactory(
    uvo::Ptr<cf::services::anti_phishing::IAntiPhishingServiceFactory>* out) {
  using cf::services::anti_phishing::IAntiPhishingServiceFactory;
  uvo::Ptr<uvo::IObjectFactory> factory;
  uvo::result_t result = module_->GetObjectFactory(
      host_.locator.Get(), cf::services::anti_phishing::kAntiPhishingClassId, factory.Receive());
  if (result < 0) return result;
  return factory->CreateInstance(host_.locator.Get(), IAntiPhishingServiceFactory::kIid,
                                 out->ReceiveVoid());
}

std::vector<std::filesystem::path> DefaultKnowledgeBaseCandidates(
    const std::filesystem::path& binDir) {
  const std::filesystem::path prefix = binDir / "..";
  return {(prefix / "share" / "pelmix" / kDefaultKnowledgeBaseName).lexically_normal(),
          (prefix / kDefaultKnowledgeBaseName).lexically_normal()};
}

std::string DefaultKnowledgeBase() {
  const char* named = std::getenv(kKnowledgeBaseVariable);
  if (named != nullptr && *named != '\0') return named;
  std::error_code error;
  const std::filesystem::path self = std::filesystem::read_symlink("/proc/self/exe", error);
  // Without our own location there is no default; the name alone makes a clear open error.
  if (error) return kDefaultKnowledgeBaseName;
  const std::vector<std::filesystem::path> candidates =
      DefaultKnowledgeBaseCandidates(self.parent_path());
  for (const std::filesystem::path& candidate : candidates) {
    if (std::filesystem::is_regular_file(candidate, error)) return candidate.string();
  }
  return candidates.back().string();
}

std::string DescribeResult(uvo::result_t code) {
  return uvo::HexCode(static_cast<std::uint32_t>(code)) + " (" +
         uvo::ToUtf8(uvo::ResultMessage(code)) + ")";
}

}  // namespace pelmix::cli
