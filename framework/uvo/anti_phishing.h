// Host-facing interfaces of the anti-phishing module and the module's class identifier.
#pragma once

#include <cstdint>

#include "framework/uvo/interfaces.h"
#include "framework/uvo/string8.h"

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

// A web-session parameter of this engine's own: with the value "1", GetHeuristicVerdictInfo
// also traces (level 700) the feature vector the model judged: the session prefix, the
// operation's full name, ": features:" and each float (%.9g) after a blank.
inline constexpr char kTraceFeaturesParameter[] = "pelmix.trace_features";

// A contiguous range of parameters, [begin, end).
struct SessionParamList {
  const SessionParam* begin;
  const SessionParam* end;
};

// A byte range [begin, end): the HTML a host appends, the data a host delivers to a sink.
struct ByteRange {
  const char* begin;
  const char* end;
};

// What GetVerdict answers.
struct Verdict {
  bool phishingDetected;
  bool confirmedVerdict;  // never set by this engine
};

// What GetHeuristicVerdictInfo answers. The host owns the record; the module fills `target`
// with memory from the host allocator that the string gives back when it is destroyed or
// reassigned (framework/uvo/string8.h).
struct HeuristicVerdictInfo {
  bool quiet;               // the details below are not meant to be reported
  std::uint8_t confidence;  // 0..2, from the session's protection level
  double weight;
  uvo::String8 target;   // what the page imitates, annotations joined by '|'
  std::int64_t dbstamp;  // the knowledge base's release stamp
};

// A web session: the host appends a page's HTML, then asks for the verdict.
class IHttpSession : public uvo::IObject {
 public:
  static constexpr uvo::iid_t kIid = 0xAE565BA6;
  // An empty range answers 1 ("False") and does nothing.
  virtual uvo::result_t AppendHtml(ByteRange html) = 0;                          // slot 3
  virtual uvo::result_t GetVerdict(Verdict* out) = 0;                            // slot 4
  virtual uvo::result_t GetHeuristicVerdictInfo(HeuristicVerdictInfo* out) = 0;  // slot 5

 protected:
  ~IHttpSession() = default;
};

// A mail session: the host hands over the message's parts, then asks for the verdict.
class IMailSession : public uvo::IObject {
 public:
  static constexpr uvo::iid_t kIid = 0x681D3C0A;
  virtual uvo::result_t AddText(uvo::IStream* stream) = 0;   // slot 3
  virtual uvo::result_t AddImage(uvo::IStream* stream) = 0;  // slot 4
  virtual uvo::result_t AddAttachment(const char* name, const char* contentType,
                                      uvo::IStream* stream) = 0;     // slot 5
  virtual uvo::result_t AddUrl(const char* url, bool* out) = 0;      // slot 6
  virtual uvo::result_t Reserved() = 0;                              // slot 7: no effect
  virtual uvo::result_t SetMessageSubject(const char* subject) = 0;  // slot 8
  virtual uvo::result_t GetVerdict(Verdict* out) = 0;                // slot 9
  virtual uvo::result_t GetHeuristicVerdictInfo(HeuristicVerdictInfo* out) = 0;  // slot 10

 protected:
  ~IMailSession() = default;
};

// Where a host's external data source delivers what it fetched for a page.
class IHttpExternalSink : public uvo::IObject {
 public:
  static constexpr uvo::iid_t kIid = 0x532F97F5;
  virtual uvo::result_t SetSessionParams(const SessionParamList* params) = 0;  // slot 3
  virtual uvo::result_t AppendData(ByteRange data) = 0;                        // slot 4
  // Ends the delivery: later calls of the other two reach nothing.
  virtual uvo::result_t Close() = 0;  // slot 5

 protected:
  ~IHttpExternalSink() = default;
};

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
