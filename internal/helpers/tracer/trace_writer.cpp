#include "internal/helpers/tracer/trace_writer.h"

#include <algorithm>
#include <cstring>
#include <limits>

namespace cf::helpers {

TraceWriter::TraceWriter(uvo::ITracer* tracer, int level) {
  if (tracer == nullptr) return;
  tracer_ = uvo::Ptr<uvo::ITracer>::Share(tracer);
  char* buffer = nullptr;
  if (tracer->CreateRecord(level, &buffer, kInitialRecordSize) == 0 && buffer != nullptr) {
    buffer_ = buffer;
    capacity_ = kInitialRecordSize;
  } else {
    tracer_.Reset();
  }
}

TraceWriter::~TraceWriter() { Commit(); }

bool TraceWriter::Grow(std::uint32_t needed) {
  const std::uint64_t doubled = std::uint64_t{capacity_} * 2;
  const std::uint32_t size = static_cast<std::uint32_t>(std::min<std::uint64_t>(
      std::max<std::uint64_t>(needed, doubled), std::numeric_limits<std::uint32_t>::max()));
  char* buffer = buffer_;
  if (tracer_->CreateRecord(uvo::ITracer::kRegrowLevel, &buffer, size) != 0 || buffer == nullptr) {
    // The tracer could not regrow the record: the text is dropped.
    buffer_ = nullptr;
    length_ = capacity_ = 0;
    tracer_.Reset();
    return false;
  }
  buffer_ = buffer;
  capacity_ = size;
  return true;
}

TraceWriter& TraceWriter::Append(std::string_view text) {
  if (buffer_ == nullptr || text.empty()) return *this;
  const std::uint64_t needed = std::uint64_t{length_} + text.size();
  if (needed > std::numeric_limits<std::uint32_t>::max()) return *this;
  if (needed > capacity_ && !Grow(static_cast<std::uint32_t>(needed))) return *this;
  std::memcpy(buffer_ + length_, text.data(), text.size());
  length_ = static_cast<std::uint32_t>(needed);
  return *this;
}

void TraceWriter::Commit() {
  if (buffer_ != nullptr) tracer_->CommitRecord(buffer_, length_);
  buffer_ = nullptr;
  length_ = capacity_ = 0;
  tracer_.Reset();
}

void Trace(uvo::ITracer* tracer, int level, std::string_view text) {
  TraceWriter writer(tracer, level);
  writer.Append(text);
}

}  // namespace cf::helpers
