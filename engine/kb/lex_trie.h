// The character trie of the lexeme database: from a normalised word, byte by byte, to its
// term id.
//
// Nodes are 12 bytes and live in one table, addressed by index, so the table can grow
// without a pointer to fix. A node's children lie side by side in the table, sorted by
// character; the run has room for a power of two of them (the root for at least 128) and
// moves to a larger run when full, the old run going to a free list for its size. Node ids
// are therefore stable only once loading is over, which is when readers take them. Every
// insertion keeps the node's look-up mode up to date, so the trie can be read at any time:
//   leaf      no children
//   single    one child
//   run       the children's characters are contiguous: index by character
//   few       up to kFewChildren children: linear scan
//   many      more: binary search
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>
#include <vector>

#include "engine/kb/lexeme_stats.h"

namespace lex {

// Term ids have 24 bits; node values keep them above the 8-bit mode.
inline constexpr std::uint32_t kTermBits = 24;
// The trie refuses to grow beyond this many nodes (12 bytes each).
inline constexpr std::size_t kMaxTrieNodes = std::size_t{1} << 24;

template <class Ch, class Stats>
class Character {
 public:
  using NodeId = std::uint32_t;
  static constexpr NodeId kRoot = 0;
  static constexpr NodeId kNoNode = 0xFFFFFFFFu;
  static constexpr std::size_t kRootRoom = 128;
  static constexpr std::uint16_t kFewChildren = 9;

  enum Mode : std::uint8_t { kLeaf, kSingle, kRun, kFew, kMany };

  struct Node {
    std::uint32_t value = 0;     // term id << 8 | mode
    std::uint32_t first = 0;     // index of the first child
    std::uint16_t count = 0;     // children
    std::uint8_t character = 0;  // the byte that leads here from the parent
    std::uint8_t unused = 0;
  };
  static_assert(sizeof(Node) == 12);

  // Hands out term ids for new lexemes and stores their statistics.
  class TermAllocator {
   public:
    virtual std::uint32_t NewTerm() = 0;
    virtual void SetStats(std::uint32_t term, const Stats& stats) = 0;
    virtual ~TermAllocator() = default;
  };

  Character();

  // Makes the path of `word` and gives its end a term if it has none, then stores `stats`
  // for that term. Returns the term; an empty word (the root) gets none and returns 0.
  // Raises std::length_error "vector<T> too
  // long" past kMaxTrieNodes.
  std::uint32_t Insert(std::string_view word, TermAllocator& allocator, const Stats& stats);

  // The node reached by `word`, or kNoNode.
  NodeId Find(std::string_view word) const;
  // The child of `node` for `c`, or kNoNode. Inline: the word finder takes one step per
  // byte of text.
  NodeId Child(NodeId node, Ch c) const {
    const auto byte = static_cast<std::uint8_t>(c);
    if (node == kRoot) return root_[byte];
    return ChildOf(nodes_[node], byte);
  }
  // The term id of a node; 0 when no lexeme ends there.
  std::uint32_t Term(NodeId node) const { return nodes_[node].value >> 8; }
  Mode ModeOf(NodeId node) const { return static_cast<Mode>(nodes_[node].value & 0xFF); }
  const Node& node(NodeId id) const { return nodes_[id]; }

  // Table slots in use, nodes and free room alike.
  std::size_t node_count() const { return nodes_.size(); }
  void Reserve(std::size_t nodes) { nodes_.reserve(nodes); }

 private:
  static constexpr int kSizeClasses = 9;  // runs of 1, 2, 4 ... 256 nodes

  NodeId AddChild(NodeId parent, std::uint8_t c);
  std::uint32_t AllocateRun(std::size_t room);
  std::size_t Room(NodeId node) const;
  void UpdateMode(NodeId node);
  void UpdateRootTable();

  NodeId ChildOf(const Node& node, std::uint8_t byte) const {
    const Node* children = nodes_.data() + node.first;
    switch (static_cast<Mode>(node.value & 0xFF)) {
      case kLeaf:
        return kNoNode;
      case kSingle:
        return children[0].character == byte ? node.first : kNoNode;
      case kRun: {
        const unsigned index = static_cast<unsigned>(byte) - children[0].character;
        return index < node.count ? node.first + index : kNoNode;
      }
      case kFew:
        for (std::uint32_t i = 0; i < node.count; ++i) {
          if (children[i].character == byte) return node.first + i;
        }
        return kNoNode;
      case kMany: {
        std::uint32_t lo = 0, hi = node.count;
        while (lo < hi) {
          const std::uint32_t mid = (lo + hi) / 2;
          if (children[mid].character < byte) {
            lo = mid + 1;
          } else {
            hi = mid;
          }
        }
        return lo < node.count && children[lo].character == byte ? node.first + lo : kNoNode;
      }
    }
    return kNoNode;
  }

  std::vector<Node> nodes_;
  // The root's children by byte: every word starts there. Rebuilt whenever the root gains
  // a child (its children's ids shift then).
  NodeId root_[256];
  std::uint32_t free_runs_[kSizeClasses];  // heads of the free lists, linked through `first`
};

}  // namespace lex
