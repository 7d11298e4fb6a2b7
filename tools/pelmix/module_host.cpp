#include "tools/pelmix/module_host.h"

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

std::string DescribeResult(uvo::result_t code) {
  return uvo::HexCode(static_cast<std::uint32_t>(code)) + " (" +
         uvo::ToUtf8(uvo::ResultMessage(code)) + ")";
}

std::string DefaultKnowledgeBase() {
  std::error_code error;
  const std::filesystem::path self = std::filesystem::read_symlink("/proc/self/exe", error);
  if (error) return "example.kb";
  return (self.parent_path() / ".." / "example.kb").lexically_normal().string();
}

}  // namespace pelmix::cli
