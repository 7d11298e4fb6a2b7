// The categorised hosts database, container entry "sb.db": hosts known by the MD5 digest of
// their lower-cased names, each with a category, a 64-bit mask and path prefixes with
// categories of their own.
//
// The entry is a sequence of sections until its end (integers little-endian): a type byte,
// a 16-bit payload size, the payload.
//   "h"  18 bytes: category (2), MD5 of the lower-cased host (16); becomes the current host
//   "m"   8 bytes: mask of the current host
//   "p"  2 + n bytes: category (2) and n > 0 bytes of lower-case path for the current host
//   any other type: skipped
// A host or mask section of the wrong size, a path section under 2 bytes, and a mask or
// path before any host are traced and skipped. Faults that end the load (ap::Error):
//   "HPDB: Invalid db format"      a section header cut inside its size
//   "HDBP: Can't read"             a payload cut short (an empty path counts), or a read
//                                  failure of the entry
//   "HPDB: invalid section size"   a payload to skip that runs past the end
// A missing entry gives an empty database.
#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "engine/common/file_interfaces.h"

namespace ap {

class CategorizedHostsPathesDB {
 public:
  // Writes the outputs only when the host is found. `category` is the host's, or that of
  // its first path prefix (in file order) that matches `path`.
  virtual bool lookup(const std::string& host, const std::string& path, std::uint16_t& category,
                      std::uint64_t& mask, bool& no_paths) const = 0;
  virtual ~CategorizedHostsPathesDB() = default;
};

}  // namespace ap

namespace hpdb {

inline constexpr char kCategorisedHostsEntry[] = "sb.db";
inline constexpr std::uint8_t kHostSection = 'h';
inline constexpr std::uint8_t kMaskSection = 'm';
inline constexpr std::uint8_t kPathSection = 'p';
inline constexpr std::size_t kHostPayloadSize = 18;
inline constexpr std::size_t kMaskPayloadSize = 8;
inline constexpr std::size_t kPathCategorySize = 2;
// Unknown payloads are skipped through a stack buffer of this size.
inline constexpr std::size_t kSkipChunk = 1024;
// The loader reads the entry through one buffer of this size: a database of real size holds
// tens of thousands of sections of a few bytes, and one host-file read per field made its
// load take hundreds of milliseconds.
inline constexpr std::size_t kLoadBufferSize = 64 * 1024;

class HashedCatHostsPathes final : public ap::CategorizedHostsPathesDB {
 public:
  struct Path {
    std::string text;
    std::uint16_t category = 0;
  };
  struct Host {
    std::uint16_t category = 0;
    std::uint64_t mask = 0;
    std::vector<Path> paths;
  };
  // The digest as two 64-bit halves, each read little-endian.
  using Key = std::pair<std::uint64_t, std::uint64_t>;

  // The loader's reading buffer over the entry (defined beside the loader).
  class BufferedEntry;

  // Reads the entry, which may be null (traced, empty database).
  explicit HashedCatHostsPathes(std::shared_ptr<ap::ReadableFileI> entry);

  bool lookup(const std::string& host, const std::string& path, std::uint16_t& category,
              std::uint64_t& mask, bool& no_paths) const override;

  std::size_t host_count() const { return hosts_.size(); }

 private:
  void Load(BufferedEntry& entry);

  std::map<Key, Host> hosts_;
  Host* current_ = nullptr;  // the host of the last host section, while loading
};

// Opens "sb.db" in `container` (absent or not) and builds the database.
std::shared_ptr<HashedCatHostsPathes> LoadHashedCatHostsPathes(ap::FileSystemI& container);

}  // namespace hpdb
