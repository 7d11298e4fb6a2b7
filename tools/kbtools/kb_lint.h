// Checks the text sources of a knowledge base for faults that the engine's readers accept
// without a word: organisation ids out of order (the loader stops there), white domains of
// organisations that do not exist, a domain or a host listed twice, a white host in the
// categorised hosts, lexemes bound to missing organisations or listed twice, phrases after
// the first lexeme, share-link lines that would pair the wrong tokens.
//
// It reads what maintainers write (orgs, white_domains.txt, lexdb.txt, share_links.txt,
// categorised_hosts.txt at the top of the folder); the white-domain questions go through the
// compiled set and the engine's own reader, so "white" means what the engine would answer.
#pragma once

#include <cstddef>
#include <filesystem>
#include <string>
#include <vector>

namespace pelmix::kbtools {

// Problems beyond this many are counted, not kept: a broken source could yield one per line.
inline constexpr std::size_t kMaxLintProblems = 200;
// Organisation names are cut to this many bytes by the reader; a longer one is a problem.
inline constexpr std::size_t kMaxOrganisationNameBytes = 64;

struct LintReport {
  std::vector<std::string> problems;  // "FILE:LINE: message", at most kMaxLintProblems
  std::size_t problem_count = 0;
  std::size_t organisations = 0;
  std::size_t white_domains = 0;
  std::size_t lexemes = 0;  // lexeme and phrase lines
  std::size_t share_links = 0;
  std::size_t categorised_hosts = 0;

  bool ok() const { return problem_count == 0; }
};

// Lints the sources of `dir`; raises std::runtime_error only when `dir` is not a folder.
LintReport LintKnowledgeBaseSources(const std::filesystem::path& dir);

}  // namespace pelmix::kbtools
