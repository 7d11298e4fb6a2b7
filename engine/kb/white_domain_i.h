// What the checkers ask about a host: which organisation owns it and whether the listing is
// a clean one, an organisation's category, and two host-and-path questions.
#pragma once

#include <cstdint>

#include "engine/kb/org_db.h"

namespace ap {

// The answer about one host. key is the owning organisation (0: not listed); the flags
// restrict the listing: partial_flag, the host has extra labels before a name listed as
// exact; other_suffix_flag, the name is listed but not under this suffix.
struct WhiteDomainRecord {
  std::uint32_t key = 0;
  std::uint8_t partial_flag = 0;
  std::uint8_t other_suffix_flag = 0;
};

// A host is white when it is listed and neither flag restricts it.
inline bool IsWhite(const WhiteDomainRecord& record) {
  return record.key != 0 && record.partial_flag == 0 && record.other_suffix_flag == 0;
}

class WhiteDomainI {
 public:
  virtual WhiteDomainRecord Lookup(const char* begin, const char* end) = 0;
  virtual bool find_org(std::uint64_t id, OrgResult& result) = 0;
  virtual bool IsCategorised(const char* host_begin, const char* host_end, const char* path_begin,
                             const char* path_end) = 0;
  virtual bool IsShareLink(const char* host_begin, const char* host_end, const char* path_begin,
                           const char* path_end) = 0;
  virtual ~WhiteDomainI() = default;
};

}  // namespace ap
