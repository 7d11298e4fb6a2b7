// The engine logger used while no service holds a host tracer: traces go nowhere.
#pragma once

#include "engine/common/trace.h"

namespace trace_impl {

class NullLogger : public ap::TraceLoggerI {
 public:
  void Log(const std::string&, int) override {}
  bool IsEnabled(int) override { return false; }
};

}  // namespace trace_impl
