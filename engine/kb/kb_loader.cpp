#include "engine/kb/kb_loader.h"

#include "engine/kb/packed_file.h"
#include "engine/kb/simple_solver.h"
#include "engine/kb/test_white_doms.h"

namespace loaders_misc {

void load(WebCheckerV3Data& knowledge, std::shared_ptr<ap::FileIO> file) {
  // The header check of the container runs here.
  auto container = std::make_shared<ap::PackedFile>(std::move(file));
  knowledge.whiteDomains = LoadTestWhiteDoms(*container);
  lex::LoadWordsDB(*container, knowledge.lexemes);
  knowledge.webSolver = std::make_shared<SimpleSolver>(kWebFlowEntry, container, kWebVectorSize);
  knowledge.mailSolver = std::make_shared<SimpleSolver>(kMailFlowEntry, container, kMailVectorSize);
  knowledge.shareLinks = ap::LoadHostsPathesDB(*container);
  knowledge.categorisedHosts = hpdb::LoadHashedCatHostsPathes(*container);
  ap::LoadEngineConfig(*container, knowledge.config);
}

}  // namespace loaders_misc
