#include "engine/html/sink_chain.h"

namespace html_decrunch {

SinkChain::SinkChain(TextHandler& head) : tail_(&head_), current_(&head_) {
  head_.sink_ = &head;
  head_.linked_ = true;
}

void SinkChain::append(Node& node, TextHandler& sink) {
  node.sink_ = &sink;
  node.prev_ = tail_;
  node.next_ = nullptr;
  node.linked_ = true;
  tail_->next_ = &node;
  tail_ = &node;
}

void SinkChain::unlink(Node& node) {
  if (!node.linked_ || &node == &head_) return;
  if (current_ == &node) current_ = &head_;
  node.prev_->next_ = node.next_;
  if (node.next_ != nullptr) {
    node.next_->prev_ = node.prev_;
  } else {
    tail_ = node.prev_;
  }
  node.prev_ = node.next_ = nullptr;
  node.linked_ = false;
}

void SinkChain::moveToTail(Node& node) {
  if (!node.linked_ || &node == &head_ || tail_ == &node) return;
  TextHandler* sink = node.sink_;
  const bool wasCurrent = current_ == &node;
  unlink(node);
  append(node, *sink);
  if (wasCurrent) current_ = &node;
}

void SinkChain::text(const char* data, std::size_t length) {
  for (Node* node = current_; node != nullptr; node = node->next_) node->sink_->text(data, length);
}

void SinkChain::breakText() { breakTextFrom(*current_); }

void SinkChain::breakTextFrom(Node& node) {
  if (!node.linked_) return;
  for (Node* n = &node; n != nullptr; n = n->next_) n->sink_->breakText();
}

}  // namespace html_decrunch
