#include "engine/checkers/check_factory_v3.h"

#include <stdexcept>

#include "engine/checkers/mail_checker_v3.h"
#include "engine/checkers/web_checker_v3.h"
#include "engine/common/trace.h"
#include "engine/kb/kb_loader.h"

namespace easy3_impl {

std::shared_ptr<const WebCheckerV3Data> CheckFactoryV3::Load(std::shared_ptr<ap::FileIO> file) {
  // The readers trace what they load at the host's level of now.
  ap::RefreshEngineTraceLevels();
  auto knowledge = std::make_shared<WebCheckerV3Data>();
  loaders_misc::load(*knowledge, std::move(file));
  return knowledge;
}

CheckFactoryV3::CheckFactoryV3(std::shared_ptr<ap::FileIO> file)
    : knowledge_(Load(std::move(file))), whiteDomains_(*knowledge_->whiteDomains) {}

std::shared_ptr<ap::easy2::WebCheckerI> CheckFactoryV3::CreateWebChecker(const std::string& url,
                                                                         int) {
  return std::make_shared<WebCheckerV3>(knowledge_, url);
}

std::shared_ptr<ap::easy2::MailCheckerI> CheckFactoryV3::CreateMailChecker(int) {
  return std::make_shared<MailCheckerV3>(knowledge_);
}

bool CheckFactoryV3::IsWhiteDomain(const std::string& domain) {
  return ap::IsWhite(whiteDomains_.Lookup(domain.data(), domain.data() + domain.size()));
}

}  // namespace easy3_impl
