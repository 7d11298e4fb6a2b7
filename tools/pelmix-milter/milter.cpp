#include "tools/pelmix-milter/milter.h"

#include <libmilter/mfapi.h>

#include <atomic>
#include <memory>
#include <string>

#include "tools/pelmix-milter/decision.h"
#include "tools/pelmix-milter/message_collector.h"
#include "tools/pelmix/mail_scan.h"
#include "tools/pelmixd/log.h"

namespace pelmix::milter {
namespace {

using pelmixd::Log;

const Options* gOptions = nullptr;
const pelmixd::ServiceHolder* gServices = nullptr;
std::atomic<unsigned> gConnections{0};

// One SMTP connection: at most one message at a time, dropped at its end so that a large one
// does not keep its memory for the rest of the connection.
struct Connection {
  std::unique_ptr<MessageCollector> message;

  MessageCollector& Current() {
    if (!message) message = std::make_unique<MessageCollector>(gOptions->maxMessage);
    return *message;
  }
};

Connection* Of(SMFICTX* ctx) { return static_cast<Connection*>(smfi_getpriv(ctx)); }

// libmilter's API takes char* where it means const char*.
char* Text(const char* text) { return const_cast<char*>(text); }

std::string QueueId(SMFICTX* ctx) {
  const char* id = smfi_getsymval(ctx, Text("i"));
  return id != nullptr ? HeaderSafe(id, 64) : std::string("(no queue id)");
}

sfsistat OnConnect(SMFICTX* ctx, char*, _SOCK_ADDR*) {
  if (gConnections.fetch_add(1) >= gOptions->maxConnections) {
    gConnections.fetch_sub(1);
    Log("refused a connection: already serving " + std::to_string(gOptions->maxConnections));
    return SMFIS_TEMPFAIL;
  }
  smfi_setpriv(ctx, new Connection);
  return SMFIS_CONTINUE;
}

sfsistat OnEnvelopeFrom(SMFICTX* ctx, char**) {
  if (Connection* c = Of(ctx)) c->message.reset();
  return SMFIS_CONTINUE;
}

sfsistat OnHeader(SMFICTX* ctx, char* name, char* value) {
  Connection* c = Of(ctx);
  if (c == nullptr) return SMFIS_TEMPFAIL;
  c->Current().Header(name != nullptr ? name : "", value != nullptr ? value : "");
  return SMFIS_CONTINUE;
}

sfsistat OnEndOfHeaders(SMFICTX* ctx) {
  Connection* c = Of(ctx);
  if (c == nullptr) return SMFIS_TEMPFAIL;
  c->Current().EndOfHeaders();
  return SMFIS_CONTINUE;
}

sfsistat OnBody(SMFICTX* ctx, unsigned char* bytes, size_t size) {
  Connection* c = Of(ctx);
  if (c == nullptr) return SMFIS_TEMPFAIL;
  c->Current().Body({reinterpret_cast<const char*>(bytes), size});
  return SMFIS_CONTINUE;
}

sfsistat Answer(SMFICTX* ctx, const Decision& decision, std::size_t incomingVerdicts) {
  if (decision.reply == Reply::kReject) {
    smfi_setreply(ctx, Text(kRejectCode), Text(kRejectStatus), Text(kRejectText));
    return SMFIS_REJECT;
  }
  if (decision.reply == Reply::kTempfail) {
    smfi_setreply(ctx, Text(kTempfailCode), Text(kTempfailStatus), Text(kTempfailText));
    return SMFIS_TEMPFAIL;
  }
  // The sender's own verdict headers go first, the last first so that the indices of the
  // ones before it stay as they were.
  for (std::size_t i = incomingVerdicts; i >= 1; --i) {
    if (smfi_chgheader(ctx, Text(kVerdictHeader), static_cast<int>(i), nullptr) != MI_SUCCESS) {
      Log("the MTA did not let the incoming " + std::string(kVerdictHeader) + " go");
    }
  }
  if (!decision.header.empty() &&
      smfi_addheader(ctx, Text(kVerdictHeader), Text(decision.header.c_str())) != MI_SUCCESS) {
    Log("the MTA did not take the " + std::string(kVerdictHeader) + " header");
  }
  if (decision.quarantine) {
    const std::string reason = "pelmix: " + decision.reason;
    if (smfi_quarantine(ctx, Text(reason.c_str())) != MI_SUCCESS) {
      Log("the MTA did not quarantine " + QueueId(ctx));
    }
  }
  return SMFIS_ACCEPT;
}

sfsistat OnEndOfMessage(SMFICTX* ctx) {
  Connection* c = Of(ctx);
  if (c == nullptr) return SMFIS_TEMPFAIL;
  const std::unique_ptr<MessageCollector> message = std::move(c->message);
  if (message) message->Finish();
  MessageCollector empty(0);
  const MessageCollector& collected = message ? *message : empty;

  // The service current now judges the whole message, even when a reload swaps it meanwhile.
  const std::shared_ptr<const pelmixd::LoadedService> service = gServices->Current();
  cli::MailScanOptions scan;
  scan.level = gOptions->level;
  const cli::Judgement judgement =
      cli::ScanMessage(*service->mail.Get(), collected.message(), scan);
  const Decision decision = Decide(judgement, collected.message().cut, *gOptions);
  if (!decision.reason.empty()) {
    Log(QueueId(ctx) + ": " + decision.reason + " (" + std::to_string(collected.totalBytes()) +
        " bytes)");
  }
  return Answer(ctx, decision, collected.verdictHeaders());
}

sfsistat OnAbort(SMFICTX* ctx) {
  if (Connection* c = Of(ctx)) c->message.reset();
  return SMFIS_CONTINUE;
}

sfsistat OnClose(SMFICTX* ctx) {
  if (Connection* c = Of(ctx)) {
    delete c;
    smfi_setpriv(ctx, nullptr);
    gConnections.fetch_sub(1);
  }
  return SMFIS_CONTINUE;
}

}  // namespace

std::string Prepare(const Options& options, const pelmixd::ServiceHolder& services) {
  gOptions = &options;
  gServices = &services;
  smfiDesc description{};
  description.xxfi_name = Text("pelmix");
  description.xxfi_version = SMFI_VERSION;
  description.xxfi_flags = SMFIF_ADDHDRS | SMFIF_CHGHDRS | SMFIF_QUARANTINE;
  description.xxfi_connect = OnConnect;
  description.xxfi_envfrom = OnEnvelopeFrom;
  description.xxfi_header = OnHeader;
  description.xxfi_eoh = OnEndOfHeaders;
  description.xxfi_body = OnBody;
  description.xxfi_eom = OnEndOfMessage;
  description.xxfi_abort = OnAbort;
  description.xxfi_close = OnClose;

  // libmilter keeps the pointer it is given.
  static std::string socket;
  socket = options.socket;
  if (smfi_setconn(socket.data()) != MI_SUCCESS) return "bad socket " + options.socket;
  if (smfi_settimeout(options.timeout) != MI_SUCCESS) return "bad timeout";
  if (smfi_register(description) != MI_SUCCESS) return "libmilter refused the filter";
  if (smfi_opensocket(true) != MI_SUCCESS) return "cannot listen on " + options.socket;
  return {};
}

bool Serve() { return smfi_main() == MI_SUCCESS; }

}  // namespace pelmix::milter
