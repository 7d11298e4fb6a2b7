#include "engine/common/trace.h"

#include <mutex>
#include <utility>

namespace ap {
namespace {

// A short lock around reading and replacing the slot; readers copy the pointer out.
std::mutex& SlotMutex() {
  static std::mutex mutex;
  return mutex;
}

std::shared_ptr<TraceLoggerI>& Slot() {
  static std::shared_ptr<TraceLoggerI> slot;
  return slot;
}

}  // namespace

void SetEngineLogger(std::shared_ptr<TraceLoggerI> logger) {
  std::shared_ptr<TraceLoggerI> previous;
  {
    std::lock_guard<std::mutex> lock(SlotMutex());
    previous = std::exchange(Slot(), std::move(logger));
  }
  // `previous` is released outside the lock.
}

std::shared_ptr<TraceLoggerI> EngineLogger() {
  std::lock_guard<std::mutex> lock(SlotMutex());
  return Slot();
}

TraceRecord::TraceRecord(int severity) : severity_(severity) {
  std::shared_ptr<TraceLoggerI> logger = EngineLogger();
  if (logger && logger->IsEnabled(severity)) logger_ = std::move(logger);
}

TraceRecord::~TraceRecord() {
  if (!logger_) return;
  try {
    logger_->Log(text_.str(), severity_);
  } catch (...) {
    // A trace line must never turn into a failure of the traced operation.
  }
}

}  // namespace ap
