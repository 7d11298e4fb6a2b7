#include "engine/html/element_tracker.h"

#include "engine/html/decrunch_limits.h"
#include "engine/html/void_elements.h"

namespace html_decrunch {
namespace {

int trackedKind(std::string_view name) {
  if (name == "a") return 0;
  if (name == "button") return 1;
  if (name == "select") return 2;
  return -1;
}

}  // namespace

void ElementTracker::open(std::string_view name) {
  const int kind = trackedKind(name);
  if (name == "body") {
    const std::int64_t head = topmost("head");
    if (head != kNone) closeFrom(head);
  } else if (kind >= 0 && tracked_[kind] != kNone) {
    closeFrom(tracked_[kind]);
  }
  if (html::isVoidElement(name)) {
    voidJustOpened_ = true;
    voidName_.assign(name);
    return;
  }
  voidJustOpened_ = false;
  push(name, kind);
}

void ElementTracker::startTagEnded() {
  if (!voidJustOpened_) return;
  voidJustOpened_ = false;
  listener_.elementClosed(voidName_);
}

void ElementTracker::close(std::string_view name) {
  if (html::isVoidElement(name)) return;
  const std::int64_t number = topmost(name);
  if (number != kNone) closeFrom(number);
}

std::vector<std::string> ElementTracker::openNames() const {
  std::vector<std::string> names;
  for (const Record& record : records_) names.push_back(record.name);
  return names;
}

std::int64_t ElementTracker::topmost(std::string_view name) const {
  const auto it = openCount_.find(name);
  if (it == openCount_.end() || it->second == 0) return kNone;
  for (std::size_t i = records_.size(); i-- > 0;) {
    if (records_[i].name == name) return firstNumber_ + static_cast<std::int64_t>(i);
  }
  return kNone;
}

void ElementTracker::closeFrom(std::int64_t number) {
  const std::size_t from = static_cast<std::size_t>(number - firstNumber_);
  for (std::size_t i = from; i < records_.size(); ++i) {
    const Record& record = records_[i];
    const std::int64_t n = firstNumber_ + static_cast<std::int64_t>(i);
    if (record.kind >= 0 && tracked_[record.kind] == n) tracked_[record.kind] = kNone;
    listener_.elementClosed(record.name);
  }
  while (records_.size() > from) {
    removeName(records_.back().name);
    records_.pop_back();
  }
}

void ElementTracker::push(std::string_view name, int kind) {
  if (kind >= 0) tracked_[kind] = firstNumber_ + static_cast<std::int64_t>(records_.size());
  records_.push_back(Record{std::string(name), kind});
  nameBytes_ += name.size();
  auto it = openCount_.find(name);
  if (it == openCount_.end()) {
    it = openCount_.emplace(std::string(name), 0).first;
  } else if (it->second == 0) {
    --idleNames_;
  }
  ++it->second;
  while (records_.size() > kMaxOpenElements || nameBytes_ > kMaxOpenElementNameBytes) {
    forgetOldest();
  }
}

void ElementTracker::forgetOldest() {
  const Record& oldest = records_.front();
  if (oldest.kind >= 0 && tracked_[oldest.kind] == firstNumber_) tracked_[oldest.kind] = kNone;
  removeName(oldest.name);
  records_.pop_front();
  ++firstNumber_;
}

// A name whose count falls to zero keeps its entry while there are few, so that opening
// and closing the same elements over and over allocates nothing; a page of ever new names
// still holds no more entries than names open plus kMaxIdleElementNames.
void ElementTracker::removeName(const std::string& name) {
  nameBytes_ -= name.size();
  const auto it = openCount_.find(name);
  if (it == openCount_.end() || --it->second != 0) return;
  if (idleNames_ < kMaxIdleElementNames) {
    ++idleNames_;
  } else {
    openCount_.erase(it);
  }
}

}  // namespace html_decrunch
