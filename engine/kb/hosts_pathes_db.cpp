#include "engine/kb/hosts_pathes_db.h"

#include "engine/kb/readable_stream.h"

namespace ap {

HostsPathesDB::HostsPathesDB(std::istream& in) {
  while (in) {
    std::string host;
    std::string path;
    in >> host >> path;
    if (host.empty() || path.empty()) break;
    hosts_[std::move(host)].insert(std::move(path));
  }
}

bool HostsPathesDB::contains(std::string_view host, std::string_view path) const {
  const auto it = hosts_.find(host);
  return it != hosts_.end() && it->second.find(path) != it->second.end();
}

std::shared_ptr<HostsPathesDB> LoadHostsPathesDB(FileSystemI& container) {
  EntryTextStream in(container.open(kShareLinksEntry));
  return std::make_shared<HostsPathesDB>(in);
}

}  // namespace ap
