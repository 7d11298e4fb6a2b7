// The web checker contract: one page, fed in chunks, judged on request.
#pragma once

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

#include "engine/checkers/base_checker.h"
#include "engine/common/file_interfaces.h"

namespace ap::easy2 {

class WebCheckerI : public BaseChecker {
 public:
  // Fetches external data for the page: the host delivers it to `receiver`.
  class ExtHandlerI {
   public:
    virtual void Request(const std::string& url, std::shared_ptr<ExtDataReceiver> receiver) = 0;
    virtual ~ExtHandlerI() = default;
  };

  // Slots 0 and 1 are BaseChecker's: GetVerdict, destructor.
  virtual void SetParameter(const std::string& name, const std::string& value) = 0;  // slot 2
  virtual void AppendData(const char* data, std::size_t length) = 0;                 // slot 3
  virtual void AppendStream(std::shared_ptr<ReadableFileI> stream) = 0;              // slot 4
  // Not owned: the session keeps the handler alive as long as the checker.
  virtual void SetExtHandler(ExtHandlerI* handler) = 0;  // slot 5
  // Beyond the checker contract proper, for tools that study the model's input: the feature
  // vector the last GetVerdict judged. False when it judged none (a trusted page, or no
  // verdict asked yet).
  virtual bool LastFeatures(std::vector<float>& vector) const = 0;  // slot 6
};

}  // namespace ap::easy2
