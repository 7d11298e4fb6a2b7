// The engine's entry interface: made once per service on the knowledge-base file, it hands
// out web and mail checkers that share the loaded knowledge and answers white-domain
// questions.
#pragma once

#include <memory>
#include <string>

namespace ap::easy2 {

class WebCheckerI;
class MailCheckerI;
class ExtraCheckerI;

class CheckFactoryI {
 public:
  virtual std::shared_ptr<WebCheckerI> CreateWebChecker(const std::string& url, int confidence) = 0;
  virtual std::shared_ptr<MailCheckerI> CreateMailChecker(int confidence) = 0;
  // This engine makes no third kind of checker: always empty.
  virtual std::shared_ptr<ExtraCheckerI> CreateExtraChecker() = 0;
  // Not thread-safe: it updates the factory's white-domain cache.
  virtual bool IsWhiteDomain(const std::string& domain) = 0;
  virtual ~CheckFactoryI() = default;
};

}  // namespace ap::easy2
