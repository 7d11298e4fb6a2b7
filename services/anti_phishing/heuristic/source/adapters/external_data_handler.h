// Connects a checker's requests for external data to the host's external data source: each
// request gets a fresh sink that forwards what the host delivers to the checker's receiver.
#pragma once

#include <memory>
#include <string>

#include "engine/checkers/web_checker_i.h"
#include "framework/uvo/anti_phishing.h"
#include "framework/uvo/object.h"

namespace cf::services::anti_phishing::heuristic {

class ExternalDataHandler final : public ap::easy2::WebCheckerI::ExtHandlerI {
 public:
  // Holds one reference to each; both must be non-null.
  ExternalDataHandler(uvo::IServiceLocator* locator, IHttpExternalDataSource* source);

  // Creates a sink on `receiver` and asks the host source to deliver `url` into it. A failing
  // source result raises uvo::CheckResultFailedException.
  void Request(const std::string& url,
               std::shared_ptr<ap::easy2::ExtDataReceiver> receiver) override;

 private:
  uvo::Ptr<uvo::IServiceLocator> locator_;
  uvo::Ptr<IHttpExternalDataSource> source_;
};

}  // namespace cf::services::anti_phishing::heuristic
