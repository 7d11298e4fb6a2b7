// The feature extractor's event recorder: events (a code 0..64 and a weight) by position in
// the page, summed at the end into three histograms, one per third of the page.
//
// The list is bounded: every kCapacity records it folds what it holds into the three
// segments' sums for the position reached so far; a later fold, or the end, cuts the page
// anew and shares each earlier segment's sums among the new segments in proportion to the
// positions it has on each side of a new boundary. Totals per code are kept exactly (up to
// float rounding) however long the page is.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace html_features {

inline constexpr std::size_t kEventCodes = 65;
inline constexpr std::size_t kSegments = 3;

class EventRecorder {
 public:
  static constexpr std::size_t kCapacity = 10000;

  using Histogram = std::array<float, kEventCodes>;
  struct Segments {
    std::array<Histogram, kSegments> bins{};
    std::array<std::uint32_t, kSegments> positions{};  // positions each segment spans
  };

  EventRecorder() { records_.reserve(kCapacity); }

  // The position advances by one per word of page or script text and per input element.
  void advance() {
    if (position_ != UINT32_MAX) ++position_;
  }
  std::uint32_t position() const { return position_; }

  void add(int code, float weight = 1.0f);
  // `base` + 0, 1 or 2 by the band of `w` (integer part up to 30, 31..65, 66 and more);
  // nothing for 0 or not a number.
  void addWeighted(int base, float w);

  // The three segments of everything recorded so far. The recorder is left as it was.
  Segments finish() const;

 private:
  struct Record {
    std::uint32_t position;
    std::uint32_t code;
    float weight;
  };
  struct Folded {
    std::uint32_t total = 0;  // the position the sums were cut for (0: nothing folded)
    std::array<Histogram, kSegments> bins{};
  };

  static void Fold(Folded& folded, const std::vector<Record>& records, std::uint32_t total);

  std::vector<Record> records_;
  Folded folded_;
  std::uint32_t position_ = 0;
};

// The first position of segment s of a page of `total` positions (s = 0..3).
std::uint32_t SegmentStart(std::uint32_t total, std::size_t s);

}  // namespace html_features
