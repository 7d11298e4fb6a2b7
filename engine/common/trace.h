// The engine's trace interface and the process-wide logger slot it writes through. Engine
// code composes a message only when the logger in the slot says its severity is enabled.
#pragma once

#include <memory>
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

// Replaces the logger in the slot; the previous one is released.
void SetEngineLogger(std::shared_ptr<TraceLoggerI> logger);
// The logger in the slot; empty until first set. Safe against a concurrent replacement.
std::shared_ptr<TraceLoggerI> EngineLogger();

// One engine trace line: keeps its own reference to the logger, collects text and logs it
// when it ends. Collects nothing when the severity is not enabled.
class TraceRecord {
 public:
  explicit TraceRecord(int severity);
  ~TraceRecord();
  TraceRecord(const TraceRecord&) = delete;
  TraceRecord& operator=(const TraceRecord&) = delete;

  bool Enabled() const { return logger_ != nullptr; }
  std::ostream& Stream() { return text_; }

 private:
  std::shared_ptr<TraceLoggerI> logger_;
  int severity_;
  std::ostringstream text_;
};

}  // namespace ap

// AP_TRACE(ap::kSeverityMessage) << "text" << value;  composes nothing when disabled.
#define AP_TRACE(severity)                                                         \
  if (::ap::TraceRecord ap_trace_record_{severity}; !ap_trace_record_.Enabled()) { \
  } else                                                                           \
    ap_trace_record_.Stream()
