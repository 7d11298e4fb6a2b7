#include "engine/html/element_tracker.h"

#include "engine/html/char_class.h"
#include "engine/html/decrunch_limits.h"
#include "engine/html/void_elements.h"

namespace html_decrunch {
namespace {

constexpr std::uint64_t kA = html::packName("a");
constexpr std::uint64_t kButton = html::packName("button");
constexpr std::uint64_t kSelect = html::packName("select");
constexpr std::uint64_t kBody = html::packName("body");
constexpr std::uint64_t kHead = html::packName("head");

int trackedKind(std::uint64_t key) {
  if (key == kA) return 0;
  if (key == kButton) return 1;
  if (key == kSelect) return 2;
  return -1;
}

// Forgotten records are dropped from the front of the stack once this many have piled up
// and they outnumber the open ones, so dropping costs O(1) per record.
constexpr std::size_t kCompactAfter = 64;

}  // namespace

std::size_t PackedNameCounts::find(std::uint64_t key) const {
  const std::size_t mask = slots_.size() - 1;
  std::size_t i = home(key);
  while (slots_[i].key != 0 && slots_[i].key != key) i = (i + 1) & mask;
  return i;
}

std::size_t PackedNameCounts::count(std::uint64_t key) const {
  if (slots_.empty()) return 0;
  const Slot& slot = slots_[find(key)];
  return slot.key == key ? slot.count : 0;
}

void PackedNameCounts::add(std::uint64_t key) {
  if (slots_.empty() || 2 * (used_ + 1) > slots_.size()) grow();
  Slot& slot = slots_[find(key)];
  if (slot.key == 0) {
    slot.key = key;
    ++used_;
  } else if (slot.count == 0) {
    --idle_;
  }
  ++slot.count;
}

void PackedNameCounts::remove(std::uint64_t key) {
  const std::size_t i = find(key);
  if (slots_[i].key != key || --slots_[i].count != 0) return;
  if (idle_ < kMaxIdleElementNames) {
    ++idle_;
  } else {
    eraseAt(i);
  }
}

void PackedNameCounts::grow() {
  std::vector<Slot> old = std::move(slots_);
  const std::size_t size = old.empty() ? 64 : 2 * old.size();
  slots_.assign(size, Slot{});
  shift_ = 64;
  for (std::size_t s = size; s > 1; s >>= 1) --shift_;
  for (const Slot& slot : old) {
    if (slot.key != 0) slots_[find(slot.key)] = slot;
  }
}

// Linear probing without tombstones: every later entry of the probe run that may not sit
// past the gap moves into it.
void PackedNameCounts::eraseAt(std::size_t index) {
  const std::size_t mask = slots_.size() - 1;
  std::size_t gap = index;
  for (std::size_t j = (gap + 1) & mask; slots_[j].key != 0; j = (j + 1) & mask) {
    const std::size_t from = home(slots_[j].key);
    if (((j - from) & mask) >= ((j - gap) & mask)) {
      slots_[gap] = slots_[j];
      gap = j;
    }
  }
  slots_[gap] = Slot{};
  --used_;
}

void ElementTracker::open(std::string_view name) {
  const std::uint64_t key = html::packName(name);
  const int kind = trackedKind(key);
  if (key == kBody) {
    const std::int64_t head = topmost("head", kHead);
    if (head != kNone) closeFrom(head);
  } else if (kind >= 0 && tracked_[kind] != kNone) {
    closeFrom(tracked_[kind]);
  }
  if (html::isVoidKey(key)) {
    voidJustOpened_ = true;
    voidName_.assign(name);
    return;
  }
  voidJustOpened_ = false;
  push(name, key, kind);
}

void ElementTracker::startTagEnded() {
  if (!voidJustOpened_) return;
  voidJustOpened_ = false;
  listener_.elementClosed(voidName_);
}

void ElementTracker::close(std::string_view name) {
  const std::uint64_t key = html::packName(name);
  if (html::isVoidKey(key)) return;
  const std::int64_t number = topmost(name, key);
  if (number != kNone) closeFrom(number);
}

std::vector<std::string> ElementTracker::openNames() const {
  std::vector<std::string> names;
  for (std::size_t i = head_; i < records_.size(); ++i) names.emplace_back(nameOf(records_[i]));
  return names;
}

std::int64_t ElementTracker::topmost(std::string_view name, std::uint64_t key) const {
  if (key != 0) {
    // A packed key is the name itself.
    if (packedCounts_.count(key) == 0) return kNone;
    for (std::size_t i = records_.size(); i-- > head_;) {
      if (records_[i].key == key) return firstNumber_ + static_cast<std::int64_t>(i - head_);
    }
    return kNone;
  }
  const auto it = longCounts_.find(name);
  if (it == longCounts_.end() || it->second == 0) return kNone;
  for (std::size_t i = records_.size(); i-- > head_;) {
    const Record& record = records_[i];
    if (record.key == 0 && nameOf(record) == name) {
      return firstNumber_ + static_cast<std::int64_t>(i - head_);
    }
  }
  return kNone;
}

void ElementTracker::closeFrom(std::int64_t number) {
  const std::size_t from = head_ + static_cast<std::size_t>(number - firstNumber_);
  for (std::size_t i = from; i < records_.size(); ++i) {
    const Record record = records_[i];
    const std::int64_t n = firstNumber_ + static_cast<std::int64_t>(i - head_);
    if (record.kind >= 0 && tracked_[record.kind] == n) tracked_[record.kind] = kNone;
    listener_.elementClosed(nameOf(record));
  }
  while (records_.size() > from) {
    removeName(records_.back());
    names_.resize(records_.back().nameAt);
    records_.pop_back();
  }
  if (records_.size() == head_) compact();
}

void ElementTracker::push(std::string_view name, std::uint64_t key, int kind) {
  if (kind >= 0) tracked_[kind] = firstNumber_ + static_cast<std::int64_t>(liveRecords());
  records_.push_back(Record{key, names_.size(), name.size(), kind});
  names_.append(name);
  nameBytes_ += name.size();
  if (key != 0) {
    packedCounts_.add(key);
  } else {
    auto it = longCounts_.find(name);
    if (it == longCounts_.end()) {
      it = longCounts_.emplace(std::string(name), 0).first;
    } else if (it->second == 0) {
      --idleLongNames_;
    }
    ++it->second;
  }
  while (liveRecords() > kMaxOpenElements || nameBytes_ > kMaxOpenElementNameBytes) {
    forgetOldest();
  }
}

void ElementTracker::forgetOldest() {
  const Record& oldest = records_[head_];
  if (oldest.kind >= 0 && tracked_[oldest.kind] == firstNumber_) tracked_[oldest.kind] = kNone;
  removeName(oldest);
  ++head_;
  ++firstNumber_;
  if (head_ == records_.size() || (head_ >= kCompactAfter && head_ >= liveRecords())) compact();
}

// Drops the forgotten records and their names' bytes.
void ElementTracker::compact() {
  if (head_ == records_.size()) {
    records_.clear();
    names_.clear();
    head_ = 0;
    return;
  }
  const std::size_t base = records_[head_].nameAt;
  records_.erase(records_.begin(), records_.begin() + static_cast<std::ptrdiff_t>(head_));
  head_ = 0;
  names_.erase(0, base);
  for (Record& record : records_) record.nameAt -= base;
}

// A long name whose count falls to zero keeps its entry while there are few, so that
// opening and closing the same elements over and over allocates nothing; a page of ever
// new names still holds no more entries than names open plus kMaxIdleElementNames.
void ElementTracker::removeName(const Record& record) {
  nameBytes_ -= record.nameSize;
  if (record.key != 0) {
    packedCounts_.remove(record.key);
    return;
  }
  const auto it = longCounts_.find(nameOf(record));
  if (it == longCounts_.end() || --it->second != 0) return;
  if (idleLongNames_ < kMaxIdleElementNames) {
    ++idleLongNames_;
  } else {
    longCounts_.erase(it);
  }
}

}  // namespace html_decrunch
