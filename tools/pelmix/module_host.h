// The CLI's host: the reference host objects, the module loaded from --module, and the
// tracer echo that --trace asks for.
#pragma once

#include <memory>
#include <string>

#include "framework/uvo/anti_phishing.h"
#include "host/host.h"
#include "host/module_loader.h"
#include "tools/pelmix/command.h"

namespace pelmix::cli {

class ModuleHost {
 public:
  // Throws std::runtime_error when the module cannot be loaded.
  explicit ModuleHost(const GlobalOptions& options);

  host::Host& Host() { return host_; }
  host::Module& Module() { return *module_; }

  // Obtains the service factory; on failure returns the result code and leaves out empty.
  uvo::result_t CreateServiceFactory(
      uvo::Ptr<cf::services::anti_phishing::IAntiPhishingServiceFactory>* out);

 private:
  host::Host host_;
  std::unique_ptr<host::Module> module_;
};

// The knowledge base the commands use without --kb: the build tree's, beside the binary.
std::string DefaultKnowledgeBase();

// "0x80000043 (Not implemented)"
std::string DescribeResult(uvo::result_t code);

}  // namespace pelmix::cli
