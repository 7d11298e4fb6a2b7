// pelmix version: the CLI's version and whether the module loads and builds its factory.
#include <iostream>

#include "tools/pelmix/command.h"
#include "tools/pelmix/module_host.h"

namespace pelmix::cli {
namespace {

constexpr char kVersion[] = "0.1.0";

int RunVersion(const std::vector<std::string>& args, const GlobalOptions& options) {
  if (!args.empty()) return UsageError("version takes no arguments");
  std::cout << "pelmix " << kVersion << "\n";
  try {
    ModuleHost host(options);
    uvo::Ptr<cf::services::anti_phishing::IAntiPhishingServiceFactory> factory;
    const uvo::result_t result = host.CreateServiceFactory(&factory);
    if (result < 0) {
      std::cout << "module " << options.modulePath << ": service factory failed, "
                << DescribeResult(result) << "\n";
      return kExitModule;
    }
    std::cout << "module " << options.modulePath << ": ok\n";
  } catch (const std::exception& e) {
    std::cout << "module " << options.modulePath << ": " << e.what() << "\n";
    return kExitModule;
  }
  return kExitOk;
}

}  // namespace

PELMIX_COMMAND({"version", "", "print the version and check that the module loads", RunVersion})

}  // namespace pelmix::cli
