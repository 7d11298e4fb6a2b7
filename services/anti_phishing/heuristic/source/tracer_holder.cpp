#include "services/anti_phishing/heuristic/source/tracer_holder.h"

#include "engine/checkers/null_logger.h"
#include "framework/uvo/exception.h"
#include "platform/critical_section.h"
#include "services/anti_phishing/heuristic/source/trace_logger.h"

namespace cf::services::anti_phishing::heuristic {
namespace {

platform::CriticalSection& HolderLock() {
  static platform::CriticalSection section;
  return section;
}

std::weak_ptr<TracerHolder>& CurrentHolder() {
  static std::weak_ptr<TracerHolder> current;
  return current;
}

}  // namespace

std::shared_ptr<TracerHolder> TracerHolder::Acquire(uvo::ITracer* tracer) {
  platform::CriticalSectionLock lock(HolderLock());
  if (std::shared_ptr<TracerHolder> live = CurrentHolder().lock()) return live;
  UVO_CHECK(tracer != nullptr);
  auto holder = std::make_shared<TracerHolder>(tracer);
  ap::SetEngineLogger(std::make_shared<ApTraceLogger>(tracer));
  CurrentHolder() = holder;
  return holder;
}

TracerHolder::TracerHolder(uvo::ITracer* tracer) : tracer_(uvo::Ptr<uvo::ITracer>::Share(tracer)) {}

TracerHolder::~TracerHolder() {
  platform::CriticalSectionLock lock(HolderLock());
  // A holder made while this one was dying owns the slot now.
  if (CurrentHolder().lock()) return;
  try {
    ap::SetEngineLogger(std::make_shared<trace_impl::NullLogger>());
  } catch (...) {
    ap::SetEngineLogger(nullptr);
  }
}

}  // namespace cf::services::anti_phishing::heuristic
