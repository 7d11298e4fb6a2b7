// Writes the categorised hosts database "sb.db": the one writer of the format that
// hpdb::HashedCatHostsPathes reads, and the compiler of its text source
// categorised_hosts.txt.
//
// Source lines; "#" starts a comment, blank lines are skipped:
//   HOST CATEGORY [MASK]   a host with its category and, when MASK is given, its mask
//   HOST/PATH CATEGORY     a path prefix of a host named on an earlier line; PATH keeps its
//                          leading "/" (a prefix ending in "/" covers everything below it,
//                          any other matches only itself)
// CATEGORY is 0 .. 65535, MASK a 64-bit number in decimal or in hexadecimal after "0x".
// Hosts and paths are lower-cased (ASCII), as the reader looks them up.
//
// Output: per host in the order first named, its host section, its mask section, then its
// path sections in line order. The result is checked with the engine's reader: every host
// must come back with its category and mask, every path with its category (a path hidden
// by an earlier prefix of its host with another category is an error). Every fault raises
// SourceError naming the file and line.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace pelmix::kbtools {

// A path section holds 2 bytes of category and the path in a 16-bit size.
inline constexpr std::size_t kMaxHpdbPathLength = 0xFFFF - 2;

class HpdbWriter {
 public:
  // Adds a host (lower-cased here). Raises std::invalid_argument for an empty host or one
  // added before.
  void AddHost(std::string_view host, std::uint16_t category,
               std::optional<std::uint64_t> mask = std::nullopt);
  // Adds a path prefix to a host added before. Raises std::invalid_argument for an unknown
  // host, an empty path or one longer than kMaxHpdbPathLength.
  void AddPath(std::string_view host, std::string_view path, std::uint16_t category);

  std::string Build() const;

 private:
  struct Path {
    std::string text;
    std::uint16_t category;
  };
  struct Host {
    std::string name;
    std::uint16_t category;
    std::optional<std::uint64_t> mask;
    std::vector<Path> paths;
  };
  Host* Find(const std::string& name);

  std::vector<Host> hosts_;
};

// The bytes of "sb.db" for the source `text`; `file` names the source in errors.
std::string CompileCategorisedHosts(std::string_view text, const std::string& file);

}  // namespace pelmix::kbtools
