// The element tracker against a plain reference: a stack of names searched from the top,
// the oldest dropped past the limits. Random tag sequences over usual, tracked, void, long
// and ever new names must close the same elements in the same order and leave the same
// elements open.
#include "engine/html/element_tracker.h"

#include <gtest/gtest.h>

#include <deque>
#include <map>
#include <random>
#include <string>
#include <vector>

#include "engine/html/char_class.h"
#include "engine/html/decrunch_limits.h"

namespace {

using html_decrunch::ElementTracker;

class Log : public ElementTracker::Listener {
 public:
  void elementClosed(std::string_view name) override { closed.emplace_back(name); }
  std::vector<std::string> closed;
};

class ReferenceTracker {
 public:
  explicit ReferenceTracker(std::vector<std::string>& closed) : closed_(closed) {}

  void open(const std::string& name) {
    if (name == "body") {
      closeTopmost("head");
    } else if (name == "a" || name == "button" || name == "select") {
      closeTopmost(name);
    }
    voidOpen_ = isVoid(name);
    if (voidOpen_) {
      voidName_ = name;
      return;
    }
    stack_.push_back(name);
    bytes_ += name.size();
    while (stack_.size() > html_decrunch::kMaxOpenElements ||
           bytes_ > html_decrunch::kMaxOpenElementNameBytes) {
      bytes_ -= stack_.front().size();
      stack_.pop_front();
    }
  }
  void startTagEnded() {
    if (voidOpen_) closed_.push_back(voidName_);
    voidOpen_ = false;
  }
  void close(const std::string& name) {
    if (!isVoid(name)) closeTopmost(name);
  }
  std::vector<std::string> open() const { return {stack_.begin(), stack_.end()}; }

 private:
  static bool isVoid(const std::string& name) {
    for (const char* v : {"area", "base", "br", "col", "command", "embed", "hr", "img", "input",
                          "keygen", "link", "meta", "param", "source", "track", "wbr"}) {
      if (name == v) return true;
    }
    return false;
  }
  void closeTopmost(const std::string& name) {
    for (std::size_t i = stack_.size(); i-- > 0;) {
      if (stack_[i] != name) continue;
      for (std::size_t j = i; j < stack_.size(); ++j) closed_.push_back(stack_[j]);
      while (stack_.size() > i) {
        bytes_ -= stack_.back().size();
        stack_.pop_back();
      }
      return;
    }
  }

  std::vector<std::string>& closed_;
  std::deque<std::string> stack_;
  std::size_t bytes_ = 0;
  bool voidOpen_ = false;
  std::string voidName_;
};

// Names a page might use: most short, some long, the tracked and void ones, and now and
// then one never seen before (short or long) or a very long one.
std::string RandomName(std::mt19937& random) {
  static const std::vector<std::string> usual = {
      "html",   "head",       "body",     "title",    "a",         "button",     "select",
      "option", "div",        "p",        "span",     "table",     "tr",         "td",
      "br",     "img",        "input",    "meta",     "script",    "b",          "li",
      "",       "blockquote", "noscript", "textarea", "my-widget", "figcaption", "abcdefgh"};
  const std::uint32_t pick = random() % 100;
  if (pick < 90) return usual[random() % usual.size()];
  if (pick < 95) return "n" + std::to_string(random() % 100000);  // short, often new
  if (pick < 99) return "long-name-" + std::to_string(random() % 3000);
  return std::string(500 + random() % 3000, static_cast<char>('p' + random() % 3));
}

void RunRandom(std::uint32_t seed, int steps, int closePercent) {
  std::mt19937 random(seed);
  Log log;
  ElementTracker tracker(log);
  std::vector<std::string> expected;
  ReferenceTracker reference(expected);
  for (int step = 0; step < steps; ++step) {
    const std::string name = RandomName(random);
    const std::uint32_t op = random() % 100;
    if (op < static_cast<std::uint32_t>(closePercent)) {
      tracker.close(name);
      reference.close(name);
    } else {
      tracker.open(name);
      reference.open(name);
      if (random() % 8 != 0) {
        tracker.startTagEnded();
        reference.startTagEnded();
      }
    }
    if (step % 997 == 0) {
      ASSERT_EQ(tracker.openNames(), reference.open()) << "seed " << seed << " step " << step;
    }
  }
  ASSERT_EQ(log.closed, expected) << "seed " << seed;
  ASSERT_EQ(tracker.openNames(), reference.open()) << "seed " << seed;
}

TEST(ElementTracker, MatchesTheReferenceOnRandomTags) {
  // Balanced pages, pages that mostly open (past the limits) and pages of stray end tags.
  for (std::uint32_t seed = 1; seed <= 6; ++seed) RunRandom(seed, 30000, 45);
  for (std::uint32_t seed = 11; seed <= 13; ++seed) RunRandom(seed, 40000, 8);
  RunRandom(21, 20000, 80);
}

TEST(ElementTracker, PackedNameCountsMatchAMap) {
  std::mt19937 random(7);
  html_decrunch::PackedNameCounts counts;
  std::map<std::uint64_t, std::size_t> expected;
  std::vector<std::uint64_t> held;
  for (int step = 0; step < 200000; ++step) {
    // Few distinct keys at first, then many: the table grows, keys go idle and are erased
    // out of the middle of probe runs.
    const std::uint64_t range = step < 50000 ? 40 : 20000;
    if (held.empty() || random() % 100 < 55) {
      const std::string name = "k" + std::to_string(random() % range);
      const std::uint64_t key = html::packName(name);
      ASSERT_NE(key, 0u);
      counts.add(key);
      ++expected[key];
      held.push_back(key);
    } else {
      const std::size_t at = random() % held.size();
      const std::uint64_t key = held[at];
      held[at] = held.back();
      held.pop_back();
      counts.remove(key);
      --expected[key];
    }
    if (step % 1009 == 0) {
      for (const auto& [key, count] : expected) {
        ASSERT_EQ(counts.count(key), count) << "step " << step;
      }
      ASSERT_EQ(counts.count(html::packName("absent")), 0u);
    }
  }
  // Entries: the keys held plus at most the idle allowance.
  std::size_t live = 0;
  for (const auto& entry : expected) live += entry.second != 0 ? 1 : 0;
  EXPECT_LE(counts.entries(), live + html_decrunch::kMaxIdleElementNames);
  EXPECT_GE(counts.entries(), live);
}

}  // namespace
