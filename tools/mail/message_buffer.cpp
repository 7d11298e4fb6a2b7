#include "tools/mail/message_buffer.h"

#include <glib.h>

#include <algorithm>

namespace pelmix::mail {

MessageBuffer::MessageBuffer() : array_(g_byte_array_new()) {}

MessageBuffer::~MessageBuffer() { g_byte_array_unref(array_); }

void MessageBuffer::Append(std::string_view bytes) {
  if (bytes.empty()) return;
  g_byte_array_append(array_, reinterpret_cast<const guint8*>(bytes.data()),
                      static_cast<guint>(bytes.size()));
}

void MessageBuffer::DropBack(std::size_t count) {
  g_byte_array_set_size(array_, static_cast<guint>(size() - std::min(count, size())));
}

void MessageBuffer::Clear() {
  g_byte_array_set_size(array_, 0);
  index = 0;
  inputBytes = 0;
  cut = false;
}

std::string_view MessageBuffer::bytes() const {
  if (array_->len == 0) return {};
  return {reinterpret_cast<const char*>(array_->data), array_->len};
}

std::size_t MessageBuffer::size() const { return array_->len; }

}  // namespace pelmix::mail
