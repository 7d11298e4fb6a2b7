// Keeps the engine logger slot connected to a host tracer for as long as any service or
// session needs it. At most one holder lives in the process; later factories share it.
#pragma once

#include <memory>

#include "framework/uvo/interfaces.h"
#include "framework/uvo/object.h"

namespace cf::services::anti_phishing::heuristic {

class TracerHolder {
 public:
  // Shares the live holder, or makes one on `tracer` (which must not be null) and installs an
  // ApTraceLogger on it in the engine logger slot.
  static std::shared_ptr<TracerHolder> Acquire(uvo::ITracer* tracer);

  explicit TracerHolder(uvo::ITracer* tracer);
  // Puts a NullLogger into the engine logger slot, then lets the tracer go.
  ~TracerHolder();
  TracerHolder(const TracerHolder&) = delete;
  TracerHolder& operator=(const TracerHolder&) = delete;

  uvo::ITracer* Tracer() const { return tracer_.Get(); }

 private:
  uvo::Ptr<uvo::ITracer> tracer_;
};

}  // namespace cf::services::anti_phishing::heuristic
