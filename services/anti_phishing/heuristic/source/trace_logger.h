// Forwards engine traces to the host tracer. Severity 0 goes out at level 700, 1 at 500,
// 2 at 800, anything else at 300; a severity is enabled when the tracer's current level
// (from its level source, 0 without one) reaches that host level.
#pragma once

#include "engine/common/trace.h"
#include "framework/uvo/interfaces.h"
#include "framework/uvo/object.h"

namespace cf::services {

class ApTraceLogger : public ap::TraceLoggerI {
 public:
  // A null tracer raises std::invalid_argument "TraceLogger::TraceLogger: tracer is null".
  explicit ApTraceLogger(uvo::ITracer* tracer);

  static int HostLevel(int severity);

  void Log(const std::string& text, int severity) override;
  bool IsEnabled(int severity) override;

 private:
  uvo::Ptr<uvo::ITracer> tracer_;
  uvo::Ptr<uvo::ITraceLevelSource> levelSource_;  // may be null
};

}  // namespace cf::services
