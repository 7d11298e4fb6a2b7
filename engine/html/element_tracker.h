// Which elements of a page are open, as far as their tags say: a stack of open elements
// without a tree. Closing an element closes everything opened after it; a listener hears
// each element that closes, in the order they were opened. Void elements are never pushed
// and close as soon as their start tag ends. The a, button and select elements are tracked:
// opening one closes the one of its kind that is still open, so at most one of each is open.
//
// Trusts nothing: the stack keeps at most kMaxOpenElements records and
// kMaxOpenElementNameBytes of names; past that the oldest records are forgotten, not
// closed. An end tag of an element that is not open costs one lookup.
#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>
#include <functional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace html_decrunch {

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
    std::string name;
    int kind;  // tracked kind, or -1
  };

  // Records are numbered from the first ever pushed, so numbers survive forgetting old ones.
  std::int64_t topmost(std::string_view name) const;
  void closeFrom(std::int64_t number);
  void push(std::string_view name, int kind);
  void forgetOldest();
  void removeName(const std::string& name);

  Listener& listener_;
  std::deque<Record> records_;
  std::int64_t firstNumber_ = 0;  // number of records_.front()
  std::size_t nameBytes_ = 0;
  // Looked up by string_view without building a string.
  struct NameHash {
    using is_transparent = void;
    std::size_t operator()(std::string_view name) const {
      return std::hash<std::string_view>{}(name);
    }
  };
  // Names open, and idle ones.
  std::unordered_map<std::string, std::size_t, NameHash, std::equal_to<>> openCount_;
  std::size_t idleNames_ = 0;                        // entries whose count is zero
  std::int64_t tracked_[3] = {kNone, kNone, kNone};  // a, button, select
  bool voidJustOpened_ = false;
  std::string voidName_;
};

}  // namespace html_decrunch
