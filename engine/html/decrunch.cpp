#include "engine/html/decrunch.h"

#include "engine/common/trace.h"

namespace html {

// A document starts: the host may have changed its trace level since the last one.
Decrunch::Decrunch(Handler& receiver, bool nested)
    : handler_(receiver, nested ? 1 : 0), tokenizer_(handler_) {
  if (!nested) ap::RefreshEngineTraceLevels();
}

Decrunch::Decrunch(Handler& receiver, NestedIn parent)
    : handler_(receiver, parent.parentDepth + 1, !parent.announced), tokenizer_(handler_) {}

// Members go in reverse order: the tokenizer's states, then the handler (which finishes an
// open script and ends a nested pipeline), then the JSON validator.
Decrunch::~Decrunch() = default;

// The counter and the validator, which call nobody, take the chunk before the tokenizer,
// whose receiver may fail: a failure then cannot leave them behind the tokenizer (a page
// whose markup the validator never saw would still pass for JSON).
void Decrunch::feed(const char* data, std::size_t length) {
  bytes_ = addByteCount(bytes_, length);
  // Once the validator has rejected the document it swallows every byte for ever, so the
  // rest of the page need not pass through it.
  if (!jsonRejected_) {
    json_.feed(data, length);
    jsonRejected_ = !json_.accepted();
  }
  tokenizer_.feed(data, length);
}

}  // namespace html
