// Turns the exception being handled into a level-300 trace line and a result code. Every
// operation the host can call ends in a catch-all that asks the dispatcher for its result.
#pragma once

#include <string>
#include <string_view>

#include "framework/uvo/interfaces.h"
#include "framework/uvo/object.h"

namespace cf::helpers {

// What the dispatcher makes of the exception being handled.
struct DispatchedException {
  uvo::result_t code;
  std::string text;  // the trace text after "place: "
};

// Must be called inside a catch block. Exceptions of no standard type, which the framework
// would let escape, become 0x80000072 ("Unknown exception") so that nothing crosses the host
// boundary.
DispatchedException ClassifyCurrentException();

class ExceptionDispatcher {
 public:
  static constexpr int kTraceLevel = 300;

  // A null tracer raises LogicError "Null tracer parameter" (0x80000046).
  explicit ExceptionDispatcher(uvo::ITracer* tracer);

  // Must be called inside a catch block; `place` is the operation's full name.
  uvo::result_t Dispatch(std::string_view place) const noexcept;

 private:
  uvo::Ptr<uvo::ITracer> tracer_;
};

}  // namespace cf::helpers
