// pelmix kb query: asks a container's knowledge bases what the engine would answer, through
// the engine's own readers.
//
//   white DOMAIN           key=K partial=P other_suffix=O white=W category=C
//   org ID                 found=F category=C
//   categorised HOST PATH  found=F category=C mask=M no_paths=N
//   sharelink HOST PATH    found=F
//   lexeme WORD            the normalised word, then term=ID first=A second=B third=C, or
//                          found=0
#include <iostream>

#include "engine/kb/case_fold.h"
#include "engine/kb/categorized_hosts.h"
#include "engine/kb/hosts_pathes_db.h"
#include "engine/kb/test_white_doms.h"
#include "engine/kb/words_db.h"
#include "tools/kbtools/source_text.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/kb_container.h"

namespace pelmix::cli {
namespace {

int QueryWhite(ap::PackedFile& container, const std::string& domain) {
  const auto white = LoadTestWhiteDoms(container);
  const ap::WhiteDomainRecord record = white->Lookup(domain.data(), domain.data() + domain.size());
  ap::OrgResult org;
  org.category = ap::kNoOrgCategory;
  if (record.key != 0) white->find_org(record.key, org);
  std::cout << "key=" << record.key << " partial=" << int{record.partial_flag}
            << " other_suffix=" << int{record.other_suffix_flag}
            << " white=" << (ap::IsWhite(record) ? 1 : 0) << " category=" << org.category << "\n";
  return kExitOk;
}

int QueryOrg(ap::PackedFile& container, const std::string& id_text) {
  const auto id = kbtools::ParseNumber(id_text, UINT64_MAX);
  if (!id) return UsageError("kb query org: ID must be a decimal number, got " + id_text);
  const auto white = LoadTestWhiteDoms(container);
  ap::OrgResult org;
  const bool found = white->find_org(*id, org);
  std::cout << "found=" << (found ? 1 : 0) << " category=" << org.category << "\n";
  return kExitOk;
}

int QueryCategorised(ap::PackedFile& container, const std::string& host, const std::string& path) {
  const auto hosts = hpdb::LoadHashedCatHostsPathes(container);
  std::uint16_t category = 0;
  std::uint64_t mask = 0;
  bool no_paths = false;
  const bool found = hosts->lookup(host, path, category, mask, no_paths);
  std::cout << "found=" << (found ? 1 : 0) << " category=" << category << " mask=" << mask
            << " no_paths=" << (no_paths ? 1 : 0) << "\n";
  return kExitOk;
}

int QueryShareLink(ap::PackedFile& container, const std::string& host, const std::string& path) {
  const auto links = ap::LoadHostsPathesDB(container);
  std::cout << "found=" << (links->contains(host, path) ? 1 : 0) << "\n";
  return kExitOk;
}

int QueryLexeme(ap::PackedFile& container, const std::string& word) {
  lex::WordsDB<char, lex::LexemeStats> words;
  lex::LoadWordsDB(container, words);
  const std::string normalised = lex::NormalizeLine(word);
  const std::uint32_t term = words.FindTerm(normalised);
  const lex::LexemeStats* stats = words.StatsOf(term);
  std::cout << normalised << " ";
  if (stats == nullptr) {
    std::cout << "found=0\n";
  } else {
    std::cout << "term=" << term << " first=" << stats->first_value
              << " second=" << stats->second_value << " third=" << stats->third_value << "\n";
  }
  return kExitOk;
}

int RunKbQuery(const std::vector<std::string>& args, const GlobalOptions&) {
  if (args.size() < 2) return UsageError("kb query needs FILE and a question");
  const std::string& kind = args[1];
  const std::size_t wanted = (kind == "white" || kind == "org" || kind == "lexeme") ? 3
                             : (kind == "categorised" || kind == "sharelink")       ? 4
                                                                                    : 0;
  if (wanted == 0) return UsageError("kb query: unknown question " + kind);
  if (args.size() != wanted) {
    return UsageError("kb query " + kind +
                      (wanted == 3 ? " takes one argument" : " takes HOST PATH"));
  }
  try {
    const auto container = OpenContainer(args[0]);
    if (kind == "white") return QueryWhite(*container, args[2]);
    if (kind == "org") return QueryOrg(*container, args[2]);
    if (kind == "lexeme") return QueryLexeme(*container, args[2]);
    if (kind == "categorised") return QueryCategorised(*container, args[2], args[3]);
    return QueryShareLink(*container, args[2], args[3]);
  } catch (const std::exception& e) {
    std::cerr << "pelmix: kb query: " << DescribeFailure(e) << "\n";
    return kExitFailure;
  }
}

}  // namespace

PELMIX_COMMAND({"kb query",
                "FILE white DOMAIN | org ID | categorised HOST PATH | sharelink HOST PATH | "
                "lexeme WORD",
                "answer a question from a container's knowledge bases as the engine would",
                RunKbQuery})

}  // namespace pelmix::cli
