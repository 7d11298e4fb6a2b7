#include "engine/common/trace.h"

#include <mutex>
#include <utility>

namespace ap {
namespace {

// A short lock around reading and replacing the slot; readers copy the pointer out. Never
// taken for a severity nobody wants.
std::mutex& SlotMutex() {
  static std::mutex mutex;
  return mutex;
}

std::shared_ptr<TraceLoggerI>& Slot() {
  static std::shared_ptr<TraceLoggerI> slot;
  return slot;
}

unsigned WantedBy(TraceLoggerI* logger) {
  if (logger == nullptr) return 0;
  unsigned wanted = 0;
  for (int severity = kSeverityMessage; severity <= kSeverityOther; ++severity) {
    if (logger->IsEnabled(severity)) wanted |= trace_gate::Bit(severity);
  }
  return wanted;
}

}  // namespace

void SetEngineLogger(std::shared_ptr<TraceLoggerI> logger) {
  const unsigned wanted = WantedBy(logger.get());
  std::shared_ptr<TraceLoggerI> previous;
  {
    std::lock_guard<std::mutex> lock(SlotMutex());
    previous = std::exchange(Slot(), std::move(logger));
    trace_gate::gWanted.store(wanted, std::memory_order_relaxed);
  }
  // `previous` is released outside the lock.
}

std::shared_ptr<TraceLoggerI> EngineLogger() {
  std::lock_guard<std::mutex> lock(SlotMutex());
  return Slot();
}

void RefreshEngineTraceLevels() {
  const std::shared_ptr<TraceLoggerI> logger = EngineLogger();
  // The host is asked outside the lock; the answer is kept only if the logger is still the
  // one in the slot.
  const unsigned wanted = WantedBy(logger.get());
  std::lock_guard<std::mutex> lock(SlotMutex());
  if (Slot() == logger) trace_gate::gWanted.store(wanted, std::memory_order_relaxed);
}

TraceRecord::TraceRecord(int severity) : severity_(severity) {
  if (!TraceWanted(severity)) return;
  std::shared_ptr<TraceLoggerI> logger = EngineLogger();
  if (logger && logger->IsEnabled(severity)) {
    logger_ = std::move(logger);
    text_.emplace();
  }
}

TraceRecord::~TraceRecord() {
  if (!logger_) return;
  try {
    logger_->Log(text_->str(), severity_);
  } catch (...) {
    // A trace line must never turn into a failure of the traced operation.
  }
}

}  // namespace ap
