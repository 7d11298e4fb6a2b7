// Host-facing interfaces of the anti-phishing module and the module's class identifier.
#pragma once

#include <cstdint>

#include "framework/uvo/interfaces.h"

namespace cf::services::anti_phishing {

// Class identifier the host passes to uvoGetObjectFactory.
inline constexpr std::uint32_t kAntiPhishingClassId = 0xD0FFBC1E;

class IHttpSessionFactory;
class IMailSessionFactory;

class IAntiPhishingService : public uvo::IObject {
 public:
  static constexpr uvo::iid_t kIid = 0x6906D2F3;
  virtual uvo::result_t GetHttpSessionFactory(IHttpSessionFactory** out) = 0;  // slot 3
  virtual uvo::result_t GetMailSessionFactory(IMailSessionFactory** out) = 0;  // slot 4
  virtual uvo::result_t IsDomainWhite(const char* domain, bool* out) = 0;      // slot 5

 protected:
  ~IAntiPhishingService() = default;
};

class IAntiPhishingServiceFactory : public uvo::IObject {
 public:
  static constexpr uvo::iid_t kIid = 0xF785F72C;
  // knowledgeFile is the host file holding the packed knowledge bases.
  virtual uvo::result_t CreateAntiPhishingService(uvo::IStream* knowledgeFile,
                                                  IAntiPhishingService** out) = 0;  // slot 3

 protected:
  ~IAntiPhishingServiceFactory() = default;
};

}  // namespace cf::services::anti_phishing
