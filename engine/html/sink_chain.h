// The chain of text sinks that page text flows along. The head is the pipeline's receiver;
// an anchor, a title or a select appends its sink. Text and breaks go to the current node
// and every node after it, so sinks opened later see the page text too, while a node made
// current (a title, a select's later options) keeps text away from the nodes before it.
//
// Nodes belong to their owner (the HTML handler keeps one per role); the chain only links
// them. Sinks belong to the receiver.
#pragma once

#include <cstddef>

#include "engine/html/decrunch_interfaces.h"

namespace html_decrunch {

class SinkChain {
 public:
  using TextHandler = html::DecrunchInterfaces::TextHandler;

  class Node {
   public:
    Node() = default;
    Node(const Node&) = delete;
    Node& operator=(const Node&) = delete;

    bool linked() const { return linked_; }
    TextHandler* sink() const { return sink_; }

   private:
    friend class SinkChain;
    TextHandler* sink_ = nullptr;
    Node* prev_ = nullptr;
    Node* next_ = nullptr;
    bool linked_ = false;
  };

  explicit SinkChain(TextHandler& head);
  SinkChain(const SinkChain&) = delete;
  SinkChain& operator=(const SinkChain&) = delete;

  // Links an unlinked node at the tail; it does not become current.
  void append(Node& node, TextHandler& sink);
  // Takes a linked node out; when it was current the head becomes current.
  void unlink(Node& node);
  void moveToTail(Node& node);
  void makeCurrent(Node& node) { current_ = &node; }
  void makeHeadCurrent() { current_ = &head_; }
  bool isCurrent(const Node& node) const { return current_ == &node; }

  // To the current node and every node after it.
  void text(const char* data, std::size_t length);
  void breakText();
  // To `node` and every node after it.
  void breakTextFrom(Node& node);

 private:
  Node head_;
  Node* tail_;
  Node* current_;
};

}  // namespace html_decrunch
