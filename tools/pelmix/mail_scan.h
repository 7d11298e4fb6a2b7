// One mail message through the module's mail-session ABI, as a mail filter would hand it
// over: the MIME walk (tools/mail) reports the subject, text parts, images, attachments and
// plain-text links, each of which goes to the session; then the verdict and the details.
#pragma once

#include <cstdint>

#include "framework/uvo/anti_phishing.h"
#include "tools/mail/message_buffer.h"
#include "tools/pelmix/judging.h"

namespace pelmix::cli {

struct MailScanOptions {
  std::int32_t level = 2;
  bool features = false;
};

Judgement ScanMessage(cf::services::anti_phishing::IMailSessionFactory& sessions,
                      const mail::MessageBuffer& message, const MailScanOptions& options);

}  // namespace pelmix::cli
