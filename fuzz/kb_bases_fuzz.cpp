// The fuzzer's bytes are one knowledge-base entry; the first byte picks its reader ("wdb",
// "sb.db", "orgs", "lexdb.txt" or "share_links.txt"). The entry is loaded as the engine
// loads it, then asked the questions a page would ask. Refusals are expected; crashes and
// reads outside the entry are what the harness looks for.
#include <cstddef>
#include <cstdint>
#include <exception>
#include <sstream>
#include <string>
#include <vector>

#include "engine/kb/categorized_hosts.h"
#include "engine/kb/hosts_pathes_db.h"
#include "engine/kb/org_db.h"
#include "engine/kb/readable_buffer.h"
#include "engine/kb/white_domains.h"
#include "engine/kb/words_db.h"

namespace {

const char* const kHosts[] = {"paypal.com", "www.paypal.co.uk", "a.b.c.d.e", "x..y.z",
                              "ab.com",     "login.bank.com.",  "q.io",      "a-b.c-d.ef"};

void AskWhiteDomains(const std::uint8_t* data, std::size_t size) {
  const wd::WhiteDomains set(std::vector<std::uint8_t>(data, data + size));
  for (const char* host : kHosts) set.Lookup(host);
  // Hosts made of the entry's own bytes reach names that the image lists.
  const std::string text(reinterpret_cast<const char*>(data), size);
  set.Lookup(text);
  for (std::size_t cut = 0; cut < text.size() && cut < 64; cut += 7) set.Lookup(text.substr(cut));
}

void AskCategorisedHosts(const std::uint8_t* data, std::size_t size) {
  const hpdb::HashedCatHostsPathes db(
      size == 0 ? nullptr
                : std::make_shared<util::ReadableBuffer>(data, static_cast<std::uint32_t>(size)));
  std::uint16_t category;
  std::uint64_t mask;
  bool no_paths;
  for (const char* host : kHosts) db.lookup(host, "/login/x", category, mask, no_paths);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  if (size == 0) return 0;
  const std::uint8_t which = data[0] % 5;
  ++data;
  --size;
  const std::string text(reinterpret_cast<const char*>(data), size);
  try {
    switch (which) {
      case 0:
        AskWhiteDomains(data, size);
        break;
      case 1:
        AskCategorisedHosts(data, size);
        break;
      case 2: {
        std::istringstream in(text);
        const ap::SimpleOrgDB orgs(in);
        ap::OrgResult result;
        for (std::uint64_t id : {0ull, 1ull, 7ull, 101ull, 1ull << 24}) orgs.find_org(id, result);
        break;
      }
      case 3: {
        std::istringstream in(text);
        lex::WordsDB<char, lex::LexemeStats> db;
        db.Load(in);
        for (const char* word : {"paypal", "log", "in", "a"}) db.StatsOf(db.FindTerm(word));
        break;
      }
      default: {
        std::istringstream in(text);
        const ap::HostsPathesDB links(in);
        links.contains("a.com", "/");
        break;
      }
    }
  } catch (const std::exception&) {
    // Refusing hostile input is the expected outcome; only crashes count.
  }
  return 0;
}
