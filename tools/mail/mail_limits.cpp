#include "tools/mail/mail_limits.h"

namespace pelmix::mail {

std::string_view LimitName(Limit limit) {
  switch (limit) {
    case Limit::kMessageSize:
      return "message size";
    case Limit::kHeaderLines:
      return "header lines";
    case Limit::kHeaderBytes:
      return "header bytes";
    case Limit::kHeaderParams:
      return "header parameters";
    case Limit::kDelimiterLines:
      return "delimiter lines";
    case Limit::kParts:
      return "parts";
    case Limit::kDepth:
      return "depth";
    case Limit::kPartSize:
      return "part size";
    case Limit::kSubjectSize:
      return "subject size";
    case Limit::kLinks:
      return "links";
    case Limit::kLinkSize:
      return "link size";
  }
  return "unknown";
}

}  // namespace pelmix::mail
