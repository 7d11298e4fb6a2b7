// What the mail walk hands on, in the order the parts appear in the message. A mail session
// takes exactly these: the subject, the readable text parts, the images, the attachments and
// the links of the plain-text parts. Views are valid only during the call.
#pragma once

#include <string_view>

namespace pelmix::mail {

struct PartInfo {
  std::string_view contentType;  // bare "type/subtype", lower case, no parameters
  std::string_view charset;      // the declared charset (text parts), empty when none
  bool converted = false;        // the text was converted from `charset` to UTF-8
  bool cut = false;              // the data was cut at the part budget
  int depth = 0;                 // nesting: 0 for the body of the top-level message
};

class MessageSink {
 public:
  virtual ~MessageSink() = default;
  // The subject, RFC 2047 words decoded, in UTF-8. Embedded (forwarded) messages report
  // theirs too, with the depth of their message/rfc822 part plus one.
  virtual void Subject(std::string_view subject, int depth) = 0;
  // A text/* part that is not an attachment: transfer-decoded and, when its charset is declared
  // and known, converted to UTF-8; otherwise the decoded bytes as they are.
  virtual void Text(std::string_view data, const PartInfo& part) = 0;
  // An image/* part, transfer-decoded. One with a file name is an attachment as well.
  virtual void Image(std::string_view data, const PartInfo& part) = 0;
  // A part with a file name or "Content-Disposition: attachment": the decoded name (RFC 2047
  // and RFC 2231, UTF-8; empty when there is none) and the transfer-decoded data.
  virtual void Attachment(std::string_view name, std::string_view data, const PartInfo& part) = 0;
  // A link of a text/plain part, once per message, after the text part it was found in.
  virtual void Url(std::string_view url) = 0;
};

}  // namespace pelmix::mail
