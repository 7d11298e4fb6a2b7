// What the milter does with a judged message: the X-Pelmix-Verdict it adds and the answer to
// the MTA. Kept apart from libmilter so that every case can be tested as a plain function.
#pragma once

#include <string>

#include "tools/pelmix-milter/options.h"
#include "tools/pelmix/judging.h"

namespace pelmix::milter {

// A target longer than this is cut in the header (the knowledge base's names are short).
inline constexpr std::size_t kMaxTargetBytes = 256;

enum class Reply {
  kAccept,    // after the header changes (and the quarantine, when asked)
  kReject,    // 550 5.7.1
  kTempfail,  // 451 4.7.1
};

struct Decision {
  Reply reply = Reply::kAccept;
  // The value of the X-Pelmix-Verdict added; incoming ones are removed whenever it is added.
  std::string header;
  bool quarantine = false;
  std::string reason;   // why: the quarantine reason and the log line, one line of ASCII
  bool judged = false;  // false when the engine gave no verdict on the message
};

// `cut`: bytes past --max-message were not judged. A phishing verdict on the bytes that were
// judged stands; a clean one does not speak for the rest, so the message is "unchecked".
Decision Decide(const cli::Judgement& judgement, bool cut, const Options& options);

// "clean" or "phishing; weight=W; target=T". T is printable ASCII: bytes outside it and the
// characters ';', '%' and '"' are written %XX, and it is cut at kMaxTargetBytes.
std::string VerdictValue(const cli::Judgement& judgement);

// `text` as printable ASCII with other bytes written %XX, at most `limit` bytes of input.
std::string HeaderSafe(const std::string& text, std::size_t limit);

inline constexpr char kRejectCode[] = "550";
inline constexpr char kRejectStatus[] = "5.7.1";
inline constexpr char kRejectText[] = "Message refused: it was judged to be phishing";
inline constexpr char kTempfailCode[] = "451";
inline constexpr char kTempfailStatus[] = "4.7.1";
inline constexpr char kTempfailText[] = "Message could not be checked, please try again later";

}  // namespace pelmix::milter
