#include "services/anti_phishing/heuristic/source/adapters/external_data_handler.h"

#include "framework/uvo/exception.h"
#include "services/anti_phishing/heuristic/source/adapters/http_external_sink.h"

namespace cf::services::anti_phishing::heuristic {

ExternalDataHandler::ExternalDataHandler(uvo::IServiceLocator* locator,
                                         IHttpExternalDataSource* source)
    : locator_(uvo::Ptr<uvo::IServiceLocator>::Share(locator)),
      source_(uvo::Ptr<IHttpExternalDataSource>::Share(source)) {
  UVO_CHECK(locator_);
  UVO_CHECK(source_);
}

void ExternalDataHandler::Request(const std::string& url,
                                  std::shared_ptr<ap::easy2::ExtDataReceiver> receiver) {
  UVO_CHECK(locator_);
  UVO_CHECK(receiver != nullptr);
  // The host keeps its own reference if it delivers later; ours goes at the end.
  const auto sink = uvo::Ptr<HttpExternalSink>::Adopt(
      HttpExternalSink::Create(locator_.Get(), std::move(receiver)));
  UVO_CHECK_RESULT(source_->Request(url.c_str(), sink.Get()));
}

}  // namespace cf::services::anti_phishing::heuristic
