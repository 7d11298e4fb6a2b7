// pelmix kb lint: checks the text sources of a knowledge base before they are built.
#include <iostream>

#include "tools/kbtools/kb_lint.h"
#include "tools/pelmix/command.h"

namespace pelmix::cli {
namespace {

int RunKbLint(const std::vector<std::string>& args, const GlobalOptions&) {
  if (args.size() != 1) return UsageError("kb lint needs SRC_DIR");
  kbtools::LintReport report;
  try {
    report = kbtools::LintKnowledgeBaseSources(args[0]);
  } catch (const std::exception& e) {
    std::cerr << "pelmix: kb lint: " << e.what() << "\n";
    return kExitFailure;
  }
  for (const std::string& problem : report.problems) std::cout << problem << "\n";
  if (!report.ok()) {
    std::cout << report.problem_count << " problem" << (report.problem_count == 1 ? "" : "s")
              << (report.problem_count > report.problems.size()
                      ? " (the first " + std::to_string(report.problems.size()) + " shown)"
                      : "")
              << "\n";
    return kExitFailure;
  }
  std::cout << "ok: " << report.organisations << " organisations, " << report.white_domains
            << " white domains, " << report.lexemes << " lexemes and phrases, "
            << report.share_links << " share links, " << report.categorised_hosts
            << " categorised hosts\n";
  return kExitOk;
}

}  // namespace

PELMIX_COMMAND({"kb lint", "SRC_DIR",
                "check the sources of SRC_DIR: ids in order, organisations that exist, nothing "
                "listed twice, no white host categorised",
                RunKbLint})

}  // namespace pelmix::cli
