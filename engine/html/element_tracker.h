// Which elements of a page are open, as far as their tags say: a stack of open elements
// without a tree. Closing an element closes everything opened after it; a listener hears
// each element that closes, in the order they were opened. Void elements are never pushed
// and close as soon as their start tag ends. The a, button and select elements are tracked:
// opening one closes the one of its kind that is still open, so at most one of each is open.
//
// Trusts nothing: the stack keeps at most kMaxOpenElements records and
// kMaxOpenElementNameBytes of names; past that the oldest records are forgotten, not
// closed. An end tag of an element that is not open costs one lookup.
//
// Every tag passes here, so names of up to seven bytes (nearly all of them) are handled as
// their packed 64-bit keys: one packing per tag, counted in a small open-addressing table,
// compared as integers. Longer names go through a string-keyed map.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace html_decrunch {

// How many open elements have each packed name key (never 0). A key whose count falls to
// zero keeps its slot while few are idle, so the usual elements cost no table change.
class PackedNameCounts {
 public:
  std::size_t count(std::uint64_t key) const;
  void add(std::uint64_t key);
  void remove(std::uint64_t key);  // the key must have been added
  std::size_t entries() const { return used_; }

 private:
  struct Slot {
    std::uint64_t key = 0;  // 0: empty
    std::size_t count = 0;
  };
  std::size_t home(std::uint64_t key) const {
    return static_cast<std::size_t>((key * 0x9E3779B97F4A7C15ull) >> shift_);
  }
  std::size_t find(std::uint64_t key) const;  // its slot, or the empty slot it would take
  void grow();
  void eraseAt(std::size_t index);

  std::vector<Slot> slots_;
  unsigned shift_ = 64;
  std::size_t used_ = 0;
  std::size_t idle_ = 0;
};

class ElementTracker {
 public:
  class Listener {
   public:
    virtual void elementClosed(std::string_view name) = 0;

   protected:
    ~Listener() = default;
  };

  explicit ElementTracker(Listener& listener) : listener_(listener) {}
  ElementTracker(const ElementTracker&) = delete;
  ElementTracker& operator=(const ElementTracker&) = delete;

  // A start tag's name.
  void open(std::string_view name);
  // The start tag's '>': a void element just opened closes now.
  void startTagEnded();
  // An end tag: closes from the topmost open element of that name, if any.
  void close(std::string_view name);

  // The names of the open elements, oldest first (for tests and tools).
  std::vector<std::string> openNames() const;

 private:
  static constexpr std::int64_t kNone = -1;

  struct Record {
    std::uint64_t key;   // packed name, or 0 for a name too long to pack
    std::size_t nameAt;  // in names_
    std::size_t nameSize;
    int kind;  // tracked kind, or -1
  };

  std::string_view nameOf(const Record& record) const {
    return std::string_view(names_.data() + record.nameAt, record.nameSize);
  }
  std::size_t liveRecords() const { return records_.size() - head_; }

  // Records are numbered from the first ever pushed, so numbers survive forgetting old ones.
  std::int64_t topmost(std::string_view name, std::uint64_t key) const;
  void closeFrom(std::int64_t number);
  void push(std::string_view name, std::uint64_t key, int kind);
  void forgetOldest();
  void compact();
  void removeName(const Record& record);

  Listener& listener_;
  // The open records are records_[head_..]; forgotten ones before head_ are dropped in bulk.
  std::vector<Record> records_;
  std::size_t head_ = 0;
  std::string names_;             // the records' names, in push order
  std::int64_t firstNumber_ = 0;  // number of records_[head_]
  std::size_t nameBytes_ = 0;     // of the open records
  PackedNameCounts packedCounts_;
  // Long names: looked up by string_view without building a string.
  struct NameHash {
    using is_transparent = void;
    std::size_t operator()(std::string_view name) const {
      return std::hash<std::string_view>{}(name);
    }
  };
  std::unordered_map<std::string, std::size_t, NameHash, std::equal_to<>> longCounts_;
  std::size_t idleLongNames_ = 0;                    // entries whose count is zero
  std::int64_t tracked_[3] = {kNone, kNone, kNone};  // a, button, select
  bool voidJustOpened_ = false;
  std::string voidName_;
};

}  // namespace html_decrunch
