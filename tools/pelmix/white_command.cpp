// pelmix white: asks the module, through its exports, whether domains are on the white list.
#include <iostream>

#include "framework/uvo/anti_phishing.h"
#include "host/stream.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/module_host.h"

namespace pelmix::cli {
namespace {

using cf::services::anti_phishing::IAntiPhishingService;
using cf::services::anti_phishing::IAntiPhishingServiceFactory;

// The last failure line the module traced, if any.
std::string LastFailureLine(const host::Tracer& tracer) {
  std::string last;
  for (const host::TraceLine& line : tracer.Lines()) {
    if (line.level == 300) last = line.text;
  }
  return last;
}

int RunWhite(const std::vector<std::string>& args, const GlobalOptions& options) {
  std::string kbPath;
  std::vector<std::string> domains;
  for (std::size_t i = 0; i < args.size(); ++i) {
    if (args[i] == "--kb") {
      if (i + 1 >= args.size()) return UsageError("--kb needs a file");
      kbPath = args[++i];
      if (kbPath.empty()) return UsageError("--kb needs a file");
    } else if (args[i].size() > 1 && args[i][0] == '-') {
      return UsageError("white: unknown option " + args[i]);
    } else {
      domains.push_back(args[i]);
    }
  }
  if (domains.empty()) return UsageError("white needs at least one domain");
  const bool explicitKb = !kbPath.empty();
  if (kbPath.empty()) kbPath = DefaultKnowledgeBase();

  std::string error;
  uvo::Ptr<host::FileStream> file = host::FileStream::Open(kbPath, &error);
  if (!file) {
    std::cerr << "pelmix white: " << error << "\n";
    if (!explicitKb) {
      std::cerr << "pelmix white: no knowledge base given: use --kb FILE or set "
                << kKnowledgeBaseVariable << "\n";
    }
    return kExitFailure;
  }

  ModuleHost moduleHost(options);
  uvo::Ptr<IAntiPhishingServiceFactory> factory;
  uvo::result_t result = moduleHost.CreateServiceFactory(&factory);
  uvo::Ptr<IAntiPhishingService> service;
  if (result >= 0) result = factory->CreateAntiPhishingService(file.Get(), service.Receive());
  if (result < 0) {
    std::cerr << "pelmix white: the service failed to load from " << kbPath << ": "
              << DescribeResult(result) << "\n";
    const std::string line = LastFailureLine(*moduleHost.Host().tracer.Get());
    if (!line.empty()) std::cerr << line << "\n";
    return kExitModule;
  }

  int status = kExitOk;
  for (const std::string& domain : domains) {
    bool white = false;
    const uvo::result_t asked = service->IsDomainWhite(domain.c_str(), &white);
    if (asked < 0) {
      std::cout << domain << "\terror " << DescribeResult(asked) << "\n";
      status = kExitFailure;
      continue;
    }
    std::cout << domain << '\t' << (white ? "white" : "not white") << "\n";
  }
  return status;
}

}  // namespace

PELMIX_COMMAND({"white", "[--kb FILE] DOMAIN...",
                "ask the module whether each DOMAIN is white (default knowledge base: $PELMIX_KB, "
                "else default.kb of the installation or the build tree)",
                RunWhite})

}  // namespace pelmix::cli
