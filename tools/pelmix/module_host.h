// The CLI's host: the reference host objects, the module loaded from --module, and the
// tracer echo that --trace asks for.
#pragma once

#include <filesystem>
#include <memory>
#include <string>
#include <vector>

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

// The environment variable that names the knowledge base used without --kb.
inline constexpr char kKnowledgeBaseVariable[] = "PELMIX_KB";
inline constexpr char kDefaultKnowledgeBaseName[] = "default.kb";

// Where the default knowledge base may lie for a binary in `binDir`, in the order tried: an
// installed share/pelmix/ beside the binary's folder, then the build tree's own. Never the
// current directory: what a command judges must not depend on where it is run.
std::vector<std::filesystem::path> DefaultKnowledgeBaseCandidates(
    const std::filesystem::path& binDir);

// The knowledge base the commands use without --kb: $PELMIX_KB when set and not empty, else
// the first candidate that exists, else the last candidate (so that the error names it).
std::string DefaultKnowledgeBase();

// "0x80000043 (Not implemented)"
std::string DescribeResult(uvo::result_t code);

}  // namespace pelmix::cli
