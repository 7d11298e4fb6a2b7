// The engine's trace interface and the process-wide logger slot it writes through. Engine
// code composes a message only when its severity is wanted.
//
// Whether a severity is wanted is kept beside the slot as a bit mask, so that a trace the
// host does not want costs one load and one test: no lock, no reference to the logger, no
// stream. The mask is taken from the logger when it is put into the slot and again at every
// RefreshEngineTraceLevels() (the engine calls it once per checked document, so a host that
// raises its level is heard from the next document on). A wanted severity is confirmed with
// the logger itself before the line is built, so a host that lowers its level is obeyed at
// once.
#pragma once

#include <atomic>
#include <memory>
#include <optional>
#include <sstream>
#include <string>

namespace ap {

class TraceLoggerI {
 public:
  virtual void Log(const std::string& text, int severity) = 0;  // slot 0
  virtual bool IsEnabled(int severity) = 0;                     // slot 1
  virtual ~TraceLoggerI() = default;                            // slot 2
};

// Severities the engine uses.
inline constexpr int kSeverityMessage = 0;  // host level 700
inline constexpr int kSeverityWarning = 1;  // host level 500
inline constexpr int kSeverityError = 2;    // host level 800
// Any other value is one more severity (host level 300); it is asked about as this one.
inline constexpr int kSeverityOther = 3;

// Replaces the logger in the slot; the previous one is released.
void SetEngineLogger(std::shared_ptr<TraceLoggerI> logger);
// The logger in the slot; empty until first set. Safe against a concurrent replacement.
std::shared_ptr<TraceLoggerI> EngineLogger();
// Asks the logger in the slot again which severities it wants.
void RefreshEngineTraceLevels();

namespace trace_gate {
// Bit s: severity s was wanted when the logger was last asked (bit 3 for any other value).
inline std::atomic<unsigned> gWanted{0};
constexpr unsigned Bit(int severity) {
  return 1u << (severity >= kSeverityMessage && severity <= kSeverityError ? severity
                                                                           : kSeverityOther);
}
}  // namespace trace_gate

// The whole cost of a trace nobody wants.
inline bool TraceWanted(int severity) {
  return (trace_gate::gWanted.load(std::memory_order_relaxed) & trace_gate::Bit(severity)) != 0;
}

// One engine trace line: keeps its own reference to the logger, collects text and logs it
// when it ends. Builds no stream when the severity is not enabled.
class TraceRecord {
 public:
  explicit TraceRecord(int severity);
  ~TraceRecord();
  TraceRecord(const TraceRecord&) = delete;
  TraceRecord& operator=(const TraceRecord&) = delete;

  bool Enabled() const { return logger_ != nullptr; }
  // Only while Enabled().
  std::ostream& Stream() { return *text_; }

 private:
  std::shared_ptr<TraceLoggerI> logger_;
  int severity_;
  std::optional<std::ostringstream> text_;
};

}  // namespace ap

// AP_TRACE(ap::kSeverityMessage) << "text" << value;  evaluates and composes nothing unless
// the severity is wanted.
#define AP_TRACE(severity)                                                                \
  if (!::ap::TraceWanted(severity)) {                                                     \
  } else if (::ap::TraceRecord ap_trace_record_{severity}; !ap_trace_record_.Enabled()) { \
  } else                                                                                  \
    ap_trace_record_.Stream()
