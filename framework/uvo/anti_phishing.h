// Host-facing interfaces of the anti-phishing module and the module's class identifier.
#pragma once

#include <cstdint>

#include "framework/uvo/interfaces.h"

namespace cf::services::anti_phishing {

// Class identifier the host passes to uvoGetObjectFactory.
inline constexpr std::uint32_t kAntiPhishingClassId = 0xD0FFBC1E;

// Passed by the host when it creates a session.
struct SessionSettings {
  std::int32_t protectionLevel;  // 1, 2 or 3
};

// A name/value pair of zero-terminated 8-bit strings.
struct SessionParam {
  const char* name;
  const char* value;
};

// A contiguous range of parameters, [begin, end).
struct SessionParamList {
  const SessionParam* begin;
  const SessionParam* end;
};

class IHttpSession;
class IMailSession;
class IHttpExternalSink;

// A host object that can fetch further data for a page into a sink.
class IHttpExternalDataSource : public uvo::IObject {
 public:
  virtual uvo::result_t Request(const char* url, IHttpExternalSink* sink) = 0;  // slot 3

 protected:
  ~IHttpExternalDataSource() = default;
};

class IHttpSessionFactory : public uvo::IObject {
 public:
  static constexpr uvo::iid_t kIid = 0x6C5E6D58;
  virtual uvo::result_t CreateSession(const SessionSettings* settings, const char* url,
                                      const SessionParamList* params,
                                      IHttpSession** out) = 0;  // slot 3
  virtual uvo::result_t CreateSessionWithExternalDataSource(const SessionSettings* settings,
                                                            const char* url,
                                                            const SessionParamList* params,
                                                            IHttpExternalDataSource* source,
                                                            IHttpSession** out) = 0;  // slot 4

 protected:
  ~IHttpSessionFactory() = default;
};

class IMailSessionFactory : public uvo::IObject {
 public:
  static constexpr uvo::iid_t kIid = 0x85A13322;
  virtual uvo::result_t CreateSession(const SessionSettings* settings,
                                      IMailSession** out) = 0;  // slot 3

 protected:
  ~IMailSessionFactory() = default;
};

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
