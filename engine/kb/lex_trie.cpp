#include "engine/kb/lex_trie.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <stdexcept>

namespace lex {

template <class Ch, class Stats>
Character<Ch, Stats>::Character() {
  std::fill(std::begin(free_runs_), std::end(free_runs_), kNoNode);
  std::fill(std::begin(root_), std::end(root_), kNoNode);
  nodes_.resize(1 + kRootRoom);
  nodes_[kRoot].first = 1;
}

template <class Ch, class Stats>
std::size_t Character<Ch, Stats>::Room(NodeId node) const {
  const std::size_t count = nodes_[node].count;
  const std::size_t room = count == 0 ? 0 : std::bit_ceil(count);
  return node == kRoot ? std::max(room, kRootRoom) : room;
}

template <class Ch, class Stats>
std::uint32_t Character<Ch, Stats>::AllocateRun(std::size_t room) {
  const int size_class = std::countr_zero(room);
  if (free_runs_[size_class] != kNoNode) {
    const std::uint32_t run = free_runs_[size_class];
    free_runs_[size_class] = nodes_[run].first;
    return run;
  }
  if (nodes_.size() + room > kMaxTrieNodes) throw std::length_error("vector<T> too long");
  const auto run = static_cast<std::uint32_t>(nodes_.size());
  nodes_.resize(nodes_.size() + room);
  return run;
}

template <class Ch, class Stats>
void Character<Ch, Stats>::UpdateMode(NodeId id) {
  Node& node = nodes_[id];
  Mode mode;
  if (node.count == 0) {
    mode = kLeaf;
  } else if (node.count == 1) {
    mode = kSingle;
  } else if (nodes_[node.first + node.count - 1].character - nodes_[node.first].character ==
             node.count - 1) {
    mode = kRun;
  } else if (node.count <= kFewChildren) {
    mode = kFew;
  } else {
    mode = kMany;
  }
  node.value = (node.value & ~0xFFu) | mode;
}

template <class Ch, class Stats>
typename Character<Ch, Stats>::NodeId Character<Ch, Stats>::AddChild(NodeId parent,
                                                                     std::uint8_t c) {
  const std::size_t count = nodes_[parent].count;
  const std::size_t room = Room(parent);
  std::uint32_t first = nodes_[parent].first;
  // Children stay sorted by character.
  std::size_t position = 0;
  while (position < count && nodes_[first + position].character < c) ++position;

  if (count == room) {
    const std::size_t new_room = room == 0 ? 1 : room * 2;
    const std::uint32_t run = AllocateRun(new_room);  // may move the table
    Node* nodes = nodes_.data();
    std::memcpy(nodes + run, nodes + first, position * sizeof(Node));
    std::memcpy(nodes + run + position + 1, nodes + first + position,
                (count - position) * sizeof(Node));
    if (room != 0) {
      nodes[first].first = free_runs_[std::countr_zero(room)];
      free_runs_[std::countr_zero(room)] = first;
    }
    first = run;
    nodes_[parent].first = run;
  } else {
    Node* nodes = nodes_.data();
    std::memmove(nodes + first + position + 1, nodes + first + position,
                 (count - position) * sizeof(Node));
  }
  Node& child = nodes_[first + position];
  child = Node{};
  child.character = c;
  ++nodes_[parent].count;
  UpdateMode(parent);
  if (parent == kRoot) UpdateRootTable();
  return static_cast<NodeId>(first + position);
}

template <class Ch, class Stats>
std::uint32_t Character<Ch, Stats>::Insert(std::string_view word, TermAllocator& allocator,
                                           const Stats& stats) {
  if (word.empty()) return 0;
  NodeId node = kRoot;
  for (const char c : word) {
    NodeId next = Child(node, static_cast<Ch>(c));
    if (next == kNoNode) next = AddChild(node, static_cast<std::uint8_t>(c));
    node = next;
  }
  std::uint32_t term = Term(node);
  if (term == 0) {
    term = allocator.NewTerm();
    nodes_[node].value = (term << 8) | (nodes_[node].value & 0xFF);
  }
  allocator.SetStats(term, stats);
  return term;
}

template <class Ch, class Stats>
typename Character<Ch, Stats>::NodeId Character<Ch, Stats>::Find(std::string_view word) const {
  NodeId node = kRoot;
  for (const char c : word) {
    node = Child(node, static_cast<Ch>(c));
    if (node == kNoNode) break;
  }
  return node;
}

template <class Ch, class Stats>
void Character<Ch, Stats>::UpdateRootTable() {
  std::fill(std::begin(root_), std::end(root_), kNoNode);
  const Node& root = nodes_[kRoot];
  for (std::uint32_t i = 0; i < root.count; ++i)
    root_[nodes_[root.first + i].character] = root.first + i;
}

template class Character<char, LexemeStats>;

}  // namespace lex
