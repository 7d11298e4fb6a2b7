#include "engine/kb/org_db.h"

#include <algorithm>
#include <limits>

#include "engine/common/error.h"
#include "engine/kb/readable_stream.h"

namespace ap {
namespace {

constexpr std::uint32_t kIdMask = (1u << kOrgIdBits) - 1;

std::uint32_t IdOf(std::uint32_t entry) { return entry & kIdMask; }
std::int32_t CategoryOf(std::uint32_t entry) {
  return static_cast<std::int32_t>((entry >> kOrgIdBits) & 0x7F);
}

void SkipLine(std::istream& in) { in.ignore(std::numeric_limits<std::streamsize>::max(), '\n'); }

}  // namespace

SimpleOrgDB::SimpleOrgDB(std::shared_ptr<ReadableFileI> entry) {
  if (!entry) ThrowError("Failed to load orgs db - null file");
  EntryTextStream in(std::move(entry));
  Load(in);
}

SimpleOrgDB::SimpleOrgDB(std::istream& in) { Load(in); }

void SimpleOrgDB::Load(std::istream& in) {
  if (!in) ThrowError("Failed to load orgs db");
  while (!in.eof()) {
    std::uint64_t id = 0;
    if (!(in >> id)) break;  // no id: nothing more can be read from here on
    long long category = kNoOrgCategory;
    if (!(in >> category)) {
      in.clear(in.rdstate() & ~std::ios_base::failbit);
      category = kNoOrgCategory;
    }
    SkipLine(in);
    SkipLine(in);
    // Ids are kept in 24 bits; the order is checked on what is kept, so that the search
    // below always sees a sorted table.
    const std::uint32_t kept = static_cast<std::uint32_t>(id) & kIdMask;
    if (!entries_.empty() && kept <= IdOf(entries_.back())) break;
    if (category < 0 || category > kMaxOrgCategory) category = kNoOrgCategory;
    entries_.push_back(kept | static_cast<std::uint32_t>(category) << kOrgIdBits);
  }
}

bool SimpleOrgDB::find_org(std::uint64_t id, OrgResult& result) const {
  const auto it = std::lower_bound(
      entries_.begin(), entries_.end(), id,
      [](std::uint32_t entry, std::uint64_t wanted) { return IdOf(entry) < wanted; });
  if (it == entries_.end() || IdOf(*it) != id) {
    result.category = kNoOrgCategory;
    return false;
  }
  result.org_id = static_cast<std::uint32_t>(id);
  result.category = CategoryOf(*it);
  return true;
}

}  // namespace ap
