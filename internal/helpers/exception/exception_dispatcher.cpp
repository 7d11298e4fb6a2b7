#include "internal/helpers/exception/exception_dispatcher.h"

#include <new>
#include <stdexcept>

#include "framework/uvo/exception.h"
#include "framework/uvo/result.h"
#include "framework/uvo/text.h"
#include "internal/helpers/exception/logic_error.h"
#include "internal/helpers/tracer/trace_writer.h"

namespace cf::helpers {

DispatchedException ClassifyCurrentException() {
  try {
    throw;
  } catch (const LogicError& e) {
    const uvo::result_t* code = e.Code();
    return {code ? *code : uvo::kErrUnexpected, e.what()};
  } catch (const uvo::ResultCodeException& e) {
    return {e.Code(), "uvo::ResultCodeException " + uvo::ToUtf8(e.Description())};
  } catch (const uvo::RuntimeError& e) {
    return {uvo::kErrUnexpected, "uvo::RuntimeError " + uvo::ToUtf8(e.Description())};
  } catch (const uvo::Exception& e) {
    return {uvo::kErrUnexpected, "uvo::Exception " + uvo::ToUtf8(e.Description())};
  } catch (const std::bad_alloc& e) {
    return {uvo::kErrOutOfMemory, std::string("Not enough memory ") + e.what()};
  } catch (const std::invalid_argument& e) {
    return {uvo::kErrInvalidArgument, std::string("Invalid argument ") + e.what()};
  } catch (const std::exception& e) {
    return {uvo::kErrUnspecified, e.what()};
  } catch (...) {
    return {uvo::kErrUnknownException, "Unknown exception"};
  }
}

ExceptionDispatcher::ExceptionDispatcher(uvo::ITracer* tracer) {
  if (tracer == nullptr) throw LogicError("Null tracer parameter", uvo::kErrInvalidArgument);
  tracer_ = uvo::Ptr<uvo::ITracer>::Share(tracer);
}

uvo::result_t ExceptionDispatcher::Dispatch(std::string_view place) const noexcept {
  DispatchedException caught{uvo::kErrUnknownException, {}};
  try {
    caught = ClassifyCurrentException();
    std::string line;
    line.reserve(place.size() + 2 + caught.text.size());
    line.append(place).append(": ").append(caught.text);
    Trace(tracer_.Get(), kTraceLevel, line);
  } catch (...) {
    // Out of memory while composing the line: the code is still known.
  }
  return caught.code;
}

}  // namespace cf::helpers
