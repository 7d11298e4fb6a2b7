// Writes one trace line into a record of a uvo tracer: asks for a 512-byte record at the
// line's level, regrows it through level 1000 when the text outgrows it, and commits it.
#pragma once

#include <cstdint>
#include <string_view>

#include "framework/uvo/interfaces.h"
#include "framework/uvo/object.h"

namespace cf::helpers {

class TraceWriter {
 public:
  static constexpr std::uint32_t kInitialRecordSize = 512;

  // Holds a reference to `tracer` (null is allowed: nothing is written) until it commits.
  TraceWriter(uvo::ITracer* tracer, int level);
  ~TraceWriter();
  TraceWriter(const TraceWriter&) = delete;
  TraceWriter& operator=(const TraceWriter&) = delete;

  // Whether the tracer accepted the level (and the text has not been dropped).
  bool Accepted() const { return buffer_ != nullptr; }
  TraceWriter& Append(std::string_view text);
  // Hands the record over and releases the tracer; later appends are ignored.
  void Commit();

 private:
  bool Grow(std::uint32_t needed);

  uvo::Ptr<uvo::ITracer> tracer_;
  char* buffer_ = nullptr;
  std::uint32_t length_ = 0;
  std::uint32_t capacity_ = 0;
};

// Traces one line at `level`.
void Trace(uvo::ITracer* tracer, int level, std::string_view text);

}  // namespace cf::helpers
