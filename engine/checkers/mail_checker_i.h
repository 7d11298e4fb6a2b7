// The mail checker contract: a message handed over part by part, judged on request.
#pragma once

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

#include "engine/checkers/base_checker.h"
#include "engine/common/file_interfaces.h"

namespace ap::easy2 {

class MailCheckerI : public BaseChecker {
 public:
  // Slots 0 and 1 are BaseChecker's: GetVerdict, destructor.
  virtual void AddText(const char* data, std::size_t length) = 0;   // slot 2
  virtual void AddText(std::shared_ptr<ReadableFileI> stream) = 0;  // slot 3
  virtual void SetSubject(const std::string& subject) = 0;          // slot 4
  // True when the link adds nothing (a white link, or the link budget is spent).
  virtual bool AddUrl(const std::string& url) = 0;                                   // slot 5
  virtual void SetParameter(const std::string& name, const std::string& value) = 0;  // slot 6
  virtual void AddImage(std::shared_ptr<logo::ImageDataProviderI> image) = 0;        // slot 7
  virtual void AddAttachment(const std::string& name, const std::string& contentType,
                             const char* data, std::size_t length) = 0;  // slot 8
  virtual void AddAttachment(const std::string& name, const std::string& contentType,
                             std::shared_ptr<ReadableFileI> stream) = 0;  // slot 9
  // Accepted and ignored by this engine's mail checker.
  virtual void AddLogo(int value, std::shared_ptr<logo::ImageDataProviderI> image) = 0;  // slot 10
  // The vector the last verdict judged (page features, then the link block); false when the
  // last verdict judged none.
  virtual bool LastFeatures(std::vector<float>& vector) const = 0;  // slot 11
};

}  // namespace ap::easy2
