#include "services/anti_phishing/heuristic/source/trace_logger.h"

#include <stdexcept>

#include "internal/helpers/tracer/trace_writer.h"

namespace cf::services {

ApTraceLogger::ApTraceLogger(uvo::ITracer* tracer) {
  if (tracer == nullptr) throw std::invalid_argument("TraceLogger::TraceLogger: tracer is null");
  tracer_ = uvo::Ptr<uvo::ITracer>::Share(tracer);
  if (tracer->QueryInterface(uvo::ITraceLevelSource::kIid, levelSource_.ReceiveVoid()) != 0) {
    levelSource_.Reset();
  }
}

int ApTraceLogger::HostLevel(int severity) {
  switch (severity) {
    case 0:
      return 700;
    case 1:
      return 500;
    case 2:
      return 800;
    default:
      return 300;
  }
}

bool ApTraceLogger::IsEnabled(int severity) {
  int level = 0;
  if (levelSource_ && levelSource_->GetTraceLevel(&level) != 0) level = 0;
  return level >= HostLevel(severity);
}

void ApTraceLogger::Log(const std::string& text, int severity) {
  helpers::Trace(tracer_.Get(), HostLevel(severity), text);
}

}  // namespace cf::services
