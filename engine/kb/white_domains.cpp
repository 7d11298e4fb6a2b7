#include "engine/kb/white_domains.h"

#include <stdexcept>

#include "engine/common/error.h"
#include "engine/kb/fletcher16.h"

namespace wd {
namespace {

bool IsAsciiLetter(char c) { return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z'); }
bool IsAsciiDigit(char c) { return c >= '0' && c <= '9'; }
char LowerAscii(char c) { return (c >= 'A' && c <= 'Z') ? static_cast<char>(c - 'A' + 'a') : c; }

// Big-endian reads from an image whose bounds the caller has checked.
std::uint32_t Be16(const std::uint8_t* p) { return static_cast<std::uint32_t>(p[0] << 8 | p[1]); }
std::uint32_t Be32(const std::uint8_t* p) {
  return static_cast<std::uint32_t>(p[0]) << 24 | static_cast<std::uint32_t>(p[1]) << 16 |
         static_cast<std::uint32_t>(p[2]) << 8 | p[3];
}

constexpr std::size_t kEntryHeader = 6;  // name_code and n
constexpr std::size_t kOrgHeader = 4;    // organisation and count
constexpr std::size_t kSuffixItem = 3;   // checksum and flag

std::vector<std::uint8_t> ReadImage(const std::shared_ptr<ap::ReadableFileI>& entry) {
  if (!entry) throw std::runtime_error("null pointer to readable in WhiteDomains");
  const std::int64_t size = entry->file_size();
  if (size < 0) ap::ThrowError("WhiteDomains: entry read failed");
  if (static_cast<std::uint64_t>(size) > kMaxImageSize) {
    ap::ThrowError("WhiteDomains: entry is too large");
  }
  std::vector<std::uint8_t> image(static_cast<std::size_t>(size));
  std::size_t filled = 0;
  while (filled < image.size()) {
    const std::int64_t got = entry->file_read(image.data() + filled, image.size() - filled);
    if (got <= 0) break;
    filled += static_cast<std::size_t>(got);
  }
  // A short read would leave a set that silently lacks domains.
  if (filled != image.size()) ap::ThrowError("WhiteDomains: entry read failed");
  return image;
}

}  // namespace

bool SuffixPasses(std::string_view suffix) {
  bool digit_seen = false;
  for (std::size_t i = 0; i < suffix.size(); ++i) {
    const char c = suffix[i];
    if (c == '.') {
      if (i > kMaxSuffixDotPosition || digit_seen) return false;
    } else if (IsAsciiDigit(c)) {
      digit_seen = true;
    } else if (!IsAsciiLetter(c) && c != '-') {
      return false;
    }
  }
  return true;
}

std::uint16_t SuffixChecksum(std::string_view suffix) {
  ap::Fletcher16 sum;
  for (const char c : suffix) sum.Add(static_cast<std::uint8_t>(LowerAscii(c)));
  return sum.Value();
}

WhiteDomains::Helper::Helper(std::vector<std::uint8_t> image) : image_(std::move(image)) {}

bool WhiteDomains::Helper::Match(std::string_view name, std::uint16_t checksum, bool dropped_labels,
                                 std::uint32_t& greatest, DomainResult& result) const {
  if (image_.empty()) return false;
  const CodedName coded = HuffmanSpooky::Code(name);
  const std::size_t largest = image_[0];
  if (coded.length == 0 || coded.length > largest || coded.code == 0) return false;

  // Bucket bounds from the offset table; a slot outside the image, or a bucket that does
  // not lie within the image, holds nothing.
  const std::size_t size = image_.size();
  const std::size_t slot = 1 + 4 * (coded.length - 1);
  if (slot + 4 > size) return false;
  const std::size_t start = Be32(&image_[slot]);
  std::size_t stop = size;
  if (coded.length < largest) {
    if (slot + 8 > size) return false;
    stop = Be32(&image_[slot + 4]);
  }
  if (start > stop || stop > size) return false;

  const std::uint8_t* const data = image_.data();
  std::size_t at = start;
  while (stop - at >= kEntryHeader) {
    const std::uint32_t name_code = Be32(data + at);
    const std::size_t list = at + kEntryHeader;
    const std::size_t list_end = list + Be16(data + at + 4);
    if (list_end > stop) return false;  // the entry claims more than its bucket holds
    at = list_end;
    if (name_code != coded.code) continue;

    std::size_t item = list;
    while (list_end - item >= kOrgHeader) {
      const std::uint32_t org = Be16(data + item);
      const std::uint32_t count = Be16(data + item + 2);
      const std::size_t suffixes = item + kOrgHeader;
      if (count * kSuffixItem > list_end - suffixes) break;  // runs past its list: absent
      if (count > greatest) {
        greatest = count;
        result.key = static_cast<std::uint16_t>(org);
      }
      for (std::uint32_t i = 0; i < count; ++i) {
        const std::uint8_t* suffix = data + suffixes + i * kSuffixItem;
        if (Be16(suffix) != checksum) continue;
        result.key = static_cast<std::uint16_t>(org);
        result.partial_flag = ((suffix[2] & 1) != 0 && dropped_labels) ? 1 : 0;
        result.other_suffix_flag = 0;
        return true;
      }
      item = suffixes + count * kSuffixItem;
    }
    result.other_suffix_flag = 1;
  }
  return false;
}

WhiteDomains::WhiteDomains(std::shared_ptr<ap::ReadableFileI> entry) : helper_(ReadImage(entry)) {}

WhiteDomains::WhiteDomains(std::vector<std::uint8_t> image) : helper_(std::move(image)) {}

DomainResult WhiteDomains::Lookup(const char* begin, const char* end) const {
  DomainResult result;
  if (begin == nullptr || begin >= end) return result;
  if (end[-1] == '.') --end;
  if (begin == end || *begin == '.') return result;
  const std::string_view host(begin, static_cast<std::size_t>(end - begin));
  std::size_t dot = host.rfind('.');
  if (dot == std::string_view::npos) return result;

  std::uint32_t greatest = 0;
  for (int round = 0; round < kMaxSuffixLabels; ++round) {
    const std::string_view suffix = host.substr(dot + 1);
    if (SuffixPasses(suffix)) {
      const std::uint16_t checksum = SuffixChecksum(suffix);
      const std::string_view before = host.substr(0, dot);
      // The names after each "." before the suffix, shortest last, then the whole text.
      for (std::size_t d = before.find('.');; d = before.find('.', d + 1)) {
        const bool whole = d == std::string_view::npos;
        const std::string_view name = whole ? before : before.substr(d + 1);
        if (helper_.Match(name, checksum, !whole, greatest, result)) return result;
        if (whole) break;
      }
    }
    if (dot == 0) break;
    const std::size_t previous = host.rfind('.', dot - 1);
    if (previous == std::string_view::npos) break;
    dot = previous;
  }
  return result;
}

}  // namespace wd
