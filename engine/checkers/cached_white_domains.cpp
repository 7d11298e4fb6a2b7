#include "engine/checkers/cached_white_domains.h"

#include <cstring>
#include <locale>
#include <string_view>

namespace easy3_impl {
namespace {

// A leading "www." in any mix of letter case, compared with the classic locale's tolower.
bool StartsWithWww(std::string_view host) {
  static constexpr std::string_view kWww = "www.";
  if (host.size() < kWww.size()) return false;
  const std::locale& classic = std::locale::classic();
  for (std::size_t i = 0; i < kWww.size(); ++i) {
    if (std::tolower(host[i], classic) != kWww[i]) return false;
  }
  return true;
}

}  // namespace

CachedWhiteDomains::CachedWhiteDomains(
    ap::WhiteDomainI& domains, std::shared_ptr<const ap::HostsPathesDB> shareLinks,
    std::shared_ptr<const ap::CategorizedHostsPathesDB> categorised)
    : domains_(domains), shareLinks_(std::move(shareLinks)), categorised_(std::move(categorised)) {}

ap::WhiteDomainRecord CachedWhiteDomains::Lookup(const char* begin, const char* end) {
  const std::string_view host(begin, static_cast<std::size_t>(end - begin));
  for (auto it = cache_.begin(); it != cache_.end(); ++it) {
    if (it->host == host) {
      if (it != cache_.begin()) cache_.splice(cache_.begin(), cache_, it);
      return cache_.front().record;
    }
  }
  if (cache_.size() == kCacheSize) {
    // Reuse the least recently used entry rather than allocate a new one.
    cache_.splice(cache_.begin(), cache_, std::prev(cache_.end()));
    cache_.front().host.assign(host);
  } else {
    cache_.push_front(Entry{std::string(host), {}});
  }
  cache_.front().record = domains_.Lookup(begin, end);
  return cache_.front().record;
}

bool CachedWhiteDomains::find_org(std::uint64_t id, ap::OrgResult& result) {
  return domains_.find_org(id, result);
}

bool CachedWhiteDomains::IsCategorised(const char* host_begin, const char* host_end,
                                       const char* path_begin, const char* path_end) {
  if (!categorised_) return false;
  std::string_view host(host_begin, static_cast<std::size_t>(host_end - host_begin));
  if (StartsWithWww(host)) host.remove_prefix(4);
  const std::string hostCopy(host);
  const std::string pathCopy(path_begin, static_cast<std::size_t>(path_end - path_begin));
  std::uint16_t category = 0;
  std::uint64_t mask = 0;
  bool noPaths = false;
  return categorised_->lookup(hostCopy, pathCopy, category, mask, noPaths);
}

bool CachedWhiteDomains::IsShareLink(const char* host_begin, const char* host_end,
                                     const char* path_begin, const char* path_end) {
  if (!shareLinks_) return false;
  return shareLinks_->contains(host_begin, host_end, path_begin, path_end);
}

}  // namespace easy3_impl
