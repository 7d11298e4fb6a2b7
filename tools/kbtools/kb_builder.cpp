#include "tools/kbtools/kb_builder.h"

#include <fstream>
#include <map>
#include <sstream>
#include <stdexcept>

#include "engine/kb/categorized_hosts.h"
#include "engine/kb/engine_config.h"
#include "engine/kb/hosts_pathes_db.h"
#include "engine/kb/org_db.h"
#include "engine/kb/white_domains.h"
#include "engine/kb/words_db.h"
#include "tools/kbtools/hpdb_writer.h"
#include "tools/kbtools/white_domains_compiler.h"

namespace pelmix::kbtools {

std::string ReadWholeFile(const std::filesystem::path& path) {
  std::ifstream in(path, std::ios::binary);
  if (!in) throw std::runtime_error(path.string() + ": cannot be read");
  std::ostringstream bytes;
  bytes << in.rdbuf();
  if (in.bad()) throw std::runtime_error(path.string() + ": read failed");
  return std::move(bytes).str();
}

namespace {

namespace fs = std::filesystem;

bool LoadsEmptyWhenEmpty(const std::string& name) {
  return name == ap::kOrgsEntry || name == lex::kLexdbEntry || name == ap::kShareLinksEntry;
}

// Reads a packed text base back as the engine would; raises with the engine's message.
void CheckEntry(const std::string& name, const std::string& data, const std::string& shown) {
  try {
    std::istringstream in(data);
    if (name == ap::kOrgsEntry) {
      ap::SimpleOrgDB orgs(in);
    } else if (name == lex::kLexdbEntry) {
      lex::WordsDB<char, lex::LexemeStats> words;
      words.Load(in);
    } else if (name == ap::kShareLinksEntry) {
      ap::HostsPathesDB links(in);
    } else if (name == ap::kEngineConfigEntry) {
      ap::EngineConfig config;
      ap::ReadEngineConfig(data, config);
    }
  } catch (const std::exception& e) {
    throw std::runtime_error(shown + ": " + e.what());
  }
}

}  // namespace

void BuildKnowledgeBase(const fs::path& dir, const fs::path& skip, ContainerWriter& writer) {
  std::error_code error;
  if (!fs::is_directory(dir, error)) throw std::runtime_error(dir.string() + ": not a directory");
  std::map<std::string, std::string> entries;
  const auto add = [&](const std::string& name, std::string data, const std::string& from) {
    if (!entries.emplace(name, std::move(data)).second) {
      throw std::runtime_error(from + ": entry " + name + " is given twice");
    }
  };
  for (const fs::directory_entry& file : fs::recursive_directory_iterator(dir)) {
    if (!file.is_regular_file()) continue;
    if (fs::equivalent(file.path(), skip, error)) continue;
    if (file.path().extension() == kDocumentationExtension) continue;
    const std::string name = file.path().lexically_relative(dir).generic_string();
    const std::string shown = file.path().string();
    std::string data = ReadWholeFile(file.path());
    if (name == kWhiteDomainsSource) {
      add(wd::kWhiteDomainsEntry, CompileWhiteDomains(data, shown), shown);
    } else if (name == kCategorisedHostsSource) {
      add(hpdb::kCategorisedHostsEntry, CompileCategorisedHosts(data, shown), shown);
    } else {
      if (data.empty() && LoadsEmptyWhenEmpty(name)) data.push_back('\n');
      CheckEntry(name, data, shown);
      add(name, std::move(data), shown);
    }
  }
  for (auto& [name, data] : entries) writer.Add(name, std::move(data));
}

}  // namespace pelmix::kbtools
