#include "engine/kb/org_db.h"

#include <algorithm>
#include <limits>
#include <string>

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

// Reads the name line: at most a few times the kept length is held, the rest is skipped.
std::string ReadName(std::istream& in) {
  std::string line;
  char c;
  while (in.get(c) && c != '\n') {
    if (line.size() < 4 * kMaxOrgNameBytes) line.push_back(c);
  }
  if (in.eof()) in.clear(in.rdstate() & ~std::ios_base::failbit);
  return line;
}

std::string CleanName(std::string_view line, std::uint32_t id) {
  const auto blank = [](char c) {
    return c == ' ' || c == '\t' || c == '\r' || c == '\v' || c == '\f';
  };
  while (!line.empty() && blank(line.front())) line.remove_prefix(1);
  while (!line.empty() && blank(line.back())) line.remove_suffix(1);
  if (line.size() > kMaxOrgNameBytes) {
    std::size_t cut = kMaxOrgNameBytes;
    // Step back over continuation bytes so that no character is split.
    while (cut > 0 && (static_cast<unsigned char>(line[cut]) & 0xC0) == 0x80) --cut;
    line = line.substr(0, cut);
  }
  std::string name(line);
  for (char& c : name)
    if (blank(c) || c == '|') c = '_';
  return name.empty() ? std::to_string(id) : name;
}

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
    const std::string line = ReadName(in);
    // Ids are kept in 24 bits; the order is checked on what is kept, so that the search
    // below always sees a sorted table.
    const std::uint32_t kept = static_cast<std::uint32_t>(id) & kIdMask;
    if (!entries_.empty() && kept <= IdOf(entries_.back())) break;
    if (category < 0 || category > kMaxOrgCategory) category = kNoOrgCategory;
    entries_.push_back(kept | static_cast<std::uint32_t>(category) << kOrgIdBits);
    names_ += CleanName(line, kept);
    offsets_.push_back(static_cast<std::uint32_t>(names_.size()));
  }
}

bool SimpleOrgDB::find_org(std::uint64_t id, OrgResult& result) const {
  const auto it = std::lower_bound(
      entries_.begin(), entries_.end(), id,
      [](std::uint32_t entry, std::uint64_t wanted) { return IdOf(entry) < wanted; });
  if (it == entries_.end() || IdOf(*it) != id) {
    result.category = kNoOrgCategory;
    result.name = {};
    return false;
  }
  const std::size_t i = static_cast<std::size_t>(it - entries_.begin());
  result.org_id = static_cast<std::uint32_t>(id);
  result.category = CategoryOf(*it);
  result.name = std::string_view(names_).substr(offsets_[i], offsets_[i + 1] - offsets_[i]);
  return true;
}

}  // namespace ap
