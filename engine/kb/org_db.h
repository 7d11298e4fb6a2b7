// The organisations database, container entry "orgs": the category of every organisation
// that the white-domain set can name.
//
// The entry is text, one record per two lines: the organisation id and its category as
// decimal numbers (anything after them is ignored), then a free line such as the
// organisation's name. The name is kept trimmed, cut to kMaxOrgNameBytes at a character
// boundary, with blanks and '|' replaced by '_' (it is joined into verdict targets, where
// both are separators); an empty name reads as the decimal id. Ids must be strictly increasing:
// loading stops, silently, at the first record whose id is not greater than the last one kept, and
// at the first record whose id cannot be read. A category that cannot be read, is negative or is
// above 9 is kept as 6, the category of no particular organisation.
#pragma once

#include <cstdint>
#include <istream>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "engine/common/file_interfaces.h"

namespace ap {

inline constexpr char kOrgsEntry[] = "orgs";
// The category of "no particular organisation".
inline constexpr std::int32_t kNoOrgCategory = 6;
// Ids are stored in 24 bits, categories 0 to 9 in the 7 bits above them.
inline constexpr std::uint32_t kOrgIdBits = 24;
inline constexpr std::int32_t kMaxOrgCategory = 9;
// The longest organisation name kept, in bytes.
inline constexpr std::size_t kMaxOrgNameBytes = 64;

struct OrgResult {
  std::uint32_t org_id = 0;
  std::int32_t category = 0;
  std::string_view name;  // valid as long as the database; empty on a miss
};

class OrgDBI {
 public:
  // On a hit `result` holds the id, its category and its name; otherwise result.category
  // becomes 6, the name empty, and result.org_id is left as it was.
  virtual bool find_org(std::uint64_t id, OrgResult& result) const = 0;
  virtual ~OrgDBI() = default;
};

class SimpleOrgDB final : public OrgDBI {
 public:
  // Reads an opened entry. A null entry raises ap::Error "Failed to load orgs db - null
  // file"; a stream already failed at the start raises "Failed to load orgs db".
  explicit SimpleOrgDB(std::shared_ptr<ReadableFileI> entry);
  // Reads records from `in` (the text of the entry).
  explicit SimpleOrgDB(std::istream& in);

  bool find_org(std::uint64_t id, OrgResult& result) const override;

  std::size_t size() const { return entries_.size(); }

 private:
  void Load(std::istream& in);

  // Bits 0-23 the id, bits 24-30 the category; sorted by id, strictly increasing.
  std::vector<std::uint32_t> entries_;
  // The name of entries_[i] is names_[offsets_[i], offsets_[i + 1]).
  std::string names_;
  std::vector<std::uint32_t> offsets_{0};
};

}  // namespace ap
