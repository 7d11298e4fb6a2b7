// The engine's entry object: loads the knowledge base once, hands out checkers that share
// it, and answers white-domain questions through its own cache.
#pragma once

#include <memory>

#include "engine/checkers/cached_white_domains.h"
#include "engine/checkers/check_factory_i.h"
#include "engine/common/file_interfaces.h"
#include "engine/kb/web_checker_v3_data.h"

namespace easy3_impl {

class CheckFactoryV3 final : public ap::easy2::CheckFactoryI {
 public:
  // Loads every knowledge base from `file`; any fault propagates and no factory is made.
  explicit CheckFactoryV3(std::shared_ptr<ap::FileIO> file);

  // A new web checker on the shared knowledge; `confidence` is not used.
  std::shared_ptr<ap::easy2::WebCheckerI> CreateWebChecker(const std::string& url,
                                                           int confidence) override;
  // A new mail checker on the shared knowledge; `confidence` is not used.
  std::shared_ptr<ap::easy2::MailCheckerI> CreateMailChecker(int confidence) override;
  std::shared_ptr<ap::easy2::ExtraCheckerI> CreateExtraChecker() override { return nullptr; }
  // Listed, and neither flag restricts the listing.
  bool IsWhiteDomain(const std::string& domain) override;

  const std::shared_ptr<const WebCheckerV3Data>& knowledge() const { return knowledge_; }

 private:
  static std::shared_ptr<const WebCheckerV3Data> Load(std::shared_ptr<ap::FileIO> file);

  std::shared_ptr<const WebCheckerV3Data> knowledge_;
  CachedWhiteDomains whiteDomains_;
};

}  // namespace easy3_impl
