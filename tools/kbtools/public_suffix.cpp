#include "tools/kbtools/public_suffix.h"

#include <libpsl.h>

#include <stdexcept>

namespace pelmix::kbtools {

struct PublicSuffixList::Context {
  const psl_ctx_t* list = nullptr;
  psl_ctx_t* owned = nullptr;  // a list loaded from the file, freed with the context
  ~Context() {
    if (owned != nullptr) psl_free(owned);
  }
};

PublicSuffixList::PublicSuffixList() : context_(std::make_unique<Context>()) {
  context_->list = psl_builtin();
  if (context_->list == nullptr) {
    context_->owned = psl_load_file(kSystemSuffixList);
    context_->list = context_->owned;
  }
  if (context_->list == nullptr) {
    throw std::runtime_error(std::string("no public suffix list: libpsl has none built in and ") +
                             kSystemSuffixList + " cannot be read");
  }
}

PublicSuffixList::~PublicSuffixList() = default;

std::string PublicSuffixList::SuffixOf(std::string_view domain) const {
  const std::string text(domain);
  const char* suffix = psl_unregistrable_domain(context_->list, text.c_str());
  return suffix == nullptr ? std::string() : std::string(suffix);
}

}  // namespace pelmix::kbtools
