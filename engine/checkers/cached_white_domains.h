// The one object through which checkers and the page analyser ask about hosts. It answers
// white-domain lookups from a cache of the eight most recently asked hosts (a page asks
// about the same few hosts again and again) and forwards the rest to the loaded knowledge.
// Not thread-safe: each checker has its own, and the service serialises the factory's.
#pragma once

#include <cstddef>
#include <list>
#include <memory>
#include <string>

#include "engine/kb/categorized_hosts.h"
#include "engine/kb/hosts_pathes_db.h"
#include "engine/kb/white_domain_i.h"

namespace easy3_impl {

class CachedWhiteDomains final : public ap::WhiteDomainI {
 public:
  static constexpr std::size_t kCacheSize = 8;

  // `domains` is not owned and must outlive this object; either database may be empty.
  CachedWhiteDomains(ap::WhiteDomainI& domains,
                     std::shared_ptr<const ap::HostsPathesDB> shareLinks = nullptr,
                     std::shared_ptr<const ap::CategorizedHostsPathesDB> categorised = nullptr);

  ap::WhiteDomainRecord Lookup(const char* begin, const char* end) override;
  bool find_org(std::uint64_t id, ap::OrgResult& result) override;
  // False without a categorised database; a leading "www." in any letter case is dropped.
  bool IsCategorised(const char* host_begin, const char* host_end, const char* path_begin,
                     const char* path_end) override;
  // False without a share-link database.
  bool IsShareLink(const char* host_begin, const char* host_end, const char* path_begin,
                   const char* path_end) override;

 private:
  struct Entry {
    std::string host;
    ap::WhiteDomainRecord record;
  };

  ap::WhiteDomainI& domains_;
  std::shared_ptr<const ap::HostsPathesDB> shareLinks_;
  std::shared_ptr<const ap::CategorizedHostsPathesDB> categorised_;
  std::list<Entry> cache_;  // most recently used first
};

}  // namespace easy3_impl
