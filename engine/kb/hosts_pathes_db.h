// The share-link list, container entry "share_links.txt": exact (host, path) pairs of
// shared-link pages.
//
// The entry is a sequence of whitespace-separated tokens taken in pairs, host then path
// (normally one pair per line). Nothing is normalised: lookups compare bytes exactly, with
// no case folding and no prefix matching. A trailing host without a path is ignored.
#pragma once

#include <cstddef>
#include <functional>
#include <istream>
#include <map>
#include <memory>
#include <set>
#include <string>
#include <string_view>

#include "engine/common/file_interfaces.h"

namespace ap {

inline constexpr char kShareLinksEntry[] = "share_links.txt";

class HostsPathesDB {
 public:
  // Reads pairs until the stream ends or fails.
  explicit HostsPathesDB(std::istream& in);

  bool contains(const char* host_begin, const char* host_end, const char* path_begin,
                const char* path_end) const {
    return contains(std::string_view(host_begin, static_cast<std::size_t>(host_end - host_begin)),
                    std::string_view(path_begin, static_cast<std::size_t>(path_end - path_begin)));
  }
  bool contains(std::string_view host, std::string_view path) const;

  std::size_t host_count() const { return hosts_.size(); }

 private:
  std::map<std::string, std::set<std::string, std::less<>>, std::less<>> hosts_;
};

// Opens "share_links.txt" in `container` and reads it through the entry text stream. A
// missing (or empty) entry raises ap::Error "null readable for tell".
std::shared_ptr<HostsPathesDB> LoadHostsPathesDB(FileSystemI& container);

}  // namespace ap
