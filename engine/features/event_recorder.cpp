#include "engine/features/event_recorder.h"

#include <algorithm>
#include <cmath>

namespace html_features {

std::uint32_t SegmentStart(std::uint32_t total, std::size_t s) {
  return static_cast<std::uint32_t>(std::uint64_t{total} * s / kSegments);
}

namespace {

std::size_t SegmentOf(std::uint32_t total, std::uint32_t position) {
  if (position < SegmentStart(total, 1)) return 0;
  if (position < SegmentStart(total, 2)) return 1;
  return 2;
}

}  // namespace

void EventRecorder::add(int code, float weight) {
  if (code < 0 || code >= static_cast<int>(kEventCodes)) return;
  if (records_.size() == kCapacity) {
    Fold(folded_, records_, position_);
    records_.clear();
  }
  records_.push_back(Record{position_, static_cast<std::uint32_t>(code), weight});
}

void EventRecorder::addWeighted(int base, float w) {
  if (w == 0.0f || std::isnan(w)) return;
  const double whole = std::trunc(static_cast<double>(w));
  add(base + (whole <= 30 ? 0 : whole <= 65 ? 1 : 2), w);
}

// Re-cuts the folded sums for `total` and adds `records` by position. An earlier segment
// [a, b) is shared among the new segments by the positions it has in each; an empty one
// goes whole to the segment of its start.
void EventRecorder::Fold(Folded& folded, const std::vector<Record>& records, std::uint32_t total) {
  std::array<Histogram, kSegments> bins{};
  if (folded.total != 0 || folded.bins != bins) {
    for (std::size_t s = 0; s < kSegments; ++s) {
      const double a = SegmentStart(folded.total, s);
      // The last segment also holds the events at the folded position itself.
      const double b = s + 1 < kSegments ? SegmentStart(folded.total, s + 1)
                                         : std::max<double>(folded.total, a) + 1;
      if (b <= a) {
        const std::size_t t = SegmentOf(total, static_cast<std::uint32_t>(a));
        for (std::size_t c = 0; c < kEventCodes; ++c) bins[t][c] += folded.bins[s][c];
        continue;
      }
      for (std::size_t t = 0; t < kSegments; ++t) {
        const double c0 = t == 0 ? 0.0 : SegmentStart(total, t);
        const double c1 = t + 1 < kSegments ? SegmentStart(total, t + 1) : HUGE_VAL;
        const double overlap = std::min(b, c1) - std::max(a, c0);
        if (overlap <= 0) continue;
        const double share = overlap / (b - a);
        for (std::size_t c = 0; c < kEventCodes; ++c)
          bins[t][c] += static_cast<float>(folded.bins[s][c] * share);
      }
    }
  }
  for (const Record& r : records) bins[SegmentOf(total, r.position)][r.code] += r.weight;
  folded.bins = bins;
  folded.total = total;
}

EventRecorder::Segments EventRecorder::finish() const {
  Folded copy = folded_;
  Fold(copy, records_, position_);
  Segments out;
  out.bins = copy.bins;
  for (std::size_t s = 0; s < kSegments; ++s)
    out.positions[s] = SegmentStart(position_, s + 1) - SegmentStart(position_, s);
  return out;
}

}  // namespace html_features
