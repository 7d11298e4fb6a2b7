// The white-domain set, container entry "wdb": the domains of the organisations that
// phishing imitates, answering for a host which organisation owns it.
//
// No domain is stored as text. A listed domain is split into a name and a public suffix;
// the name is coded by wd::HuffmanSpooky and found by its key in the bucket of its coded
// length, the suffix is reduced to its Fletcher-16 checksum. Layout (integers big-endian):
//   0        1      M, the largest coded length present
//   1        4 * M  offset from the file start of the bucket of coded length k = 1 .. M;
//                   bucket k ends where bucket k + 1 starts, bucket M at the end of the file
//   buckets: name entries of name_code (4), n (2) and n bytes of organisation items; an
//   item is the organisation (2), a count c (2) and c suffix items of checksum (2) and
//   flag (1). Flag bit 0: the domain is white only when written without extra labels.
//
// The image is read whole at construction and used in place. Nothing in it is trusted:
// every read is checked against the image, and a bucket, entry or item that does not fit
// where it claims to be is treated as absent (it answers "not found"), never read beyond.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string_view>
#include <vector>

#include "engine/common/file_interfaces.h"
#include "engine/kb/huffman_spooky.h"
#include "engine/kb/white_domain_i.h"

namespace wd {

inline constexpr char kWhiteDomainsEntry[] = "wdb";
// At most this many suffix lengths are tried for one host.
inline constexpr int kMaxSuffixLabels = 3;
// A "." of an acceptable suffix stands at most this many characters from its start.
inline constexpr std::size_t kMaxSuffixDotPosition = 6;
// The image is held in memory; real sets are a few megabytes.
inline constexpr std::uint64_t kMaxImageSize = std::uint64_t{64} << 20;

struct DomainResult {
  std::uint16_t key = 0;  // organisation id; 0: not found
  std::uint8_t partial_flag = 0;
  std::uint8_t other_suffix_flag = 0;
};

// Whether a suffix may be looked up: only letters, digits, "-" and "."; every "." at most
// kMaxSuffixDotPosition characters from the start; no digit before a ".". Empty passes.
bool SuffixPasses(std::string_view suffix);

// Fletcher-16 of the suffix with its ASCII letters lower-cased.
std::uint16_t SuffixChecksum(std::string_view suffix);

class WhiteDomains {
 public:
  // The image and the bucket scan.
  class Helper {
   public:
    explicit Helper(std::vector<std::uint8_t> image);
    // Scans the bucket of `name` for entries keyed like it. Keeps the fallback organisation
    // (the one with the most suffixes seen so far, `greatest`) in `result`; returns true
    // with `result` complete on a suffix match.
    bool Match(std::string_view name, std::uint16_t checksum, bool dropped_labels,
               std::uint32_t& greatest, DomainResult& result) const;
    std::size_t size() const { return image_.size(); }

   private:
    std::vector<std::uint8_t> image_;
  };

  // Reads the whole entry. A null entry raises std::runtime_error "null pointer to readable
  // in WhiteDomains"; an entry above kMaxImageSize raises ap::Error "WhiteDomains: entry is
  // too large", one that cannot be read whole "WhiteDomains: entry read failed".
  explicit WhiteDomains(std::shared_ptr<ap::ReadableFileI> entry);
  // Uses bytes already in memory.
  explicit WhiteDomains(std::vector<std::uint8_t> image);

  // The organisation of the host in [begin, end). Upper and lower case give the same answer.
  DomainResult Lookup(const char* begin, const char* end) const;
  DomainResult Lookup(std::string_view host) const {
    return Lookup(host.data(), host.data() + host.size());
  }

  std::size_t image_size() const { return helper_.size(); }

 private:
  Helper helper_;
};

}  // namespace wd
