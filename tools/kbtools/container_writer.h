// Writes packed knowledge-base containers: the one writer of the format that ap::PackedFile
// reads. Tests and the `pelmix kb pack` tool build containers with it.
//
// Output: the marker "PMK", total_length, body_crc, entry_count, the record table, then the
// records in name order, then the data of each entry in the same order. Names are sorted
// byte by byte, so the same entries always give the same bytes.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace pelmix::kbtools {

// The three leading bytes; readers skip them.
inline constexpr char kContainerMarker[3] = {'P', 'M', 'K'};
// Names are stored with a 16-bit length.
inline constexpr std::size_t kMaxEntryNameLength = 0xFFFF;
// Lengths and record positions are 32-bit: the whole container stays below 4 GiB.
inline constexpr std::uint64_t kMaxContainerSize = 0xFFFFFFFFull;

class ContainerWriter {
 public:
  // Adds one entry. Raises std::invalid_argument for a name longer than
  // kMaxEntryNameLength or one that was already added (a reader would only see the first).
  void Add(std::string name, std::string data);

  std::size_t entry_count() const { return entries_.size(); }

  // The container's bytes. Raises std::length_error when they would exceed
  // kMaxContainerSize.
  std::string Build() const;

 private:
  struct Entry {
    std::string name;
    std::string data;
  };
  std::vector<Entry> entries_;
};

}  // namespace pelmix::kbtools
