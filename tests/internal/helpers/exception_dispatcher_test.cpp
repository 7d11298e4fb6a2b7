#include "internal/helpers/exception/exception_dispatcher.h"

#include <gtest/gtest.h>

#include <functional>
#include <new>
#include <stdexcept>

#include "engine/common/error.h"
#include "framework/uvo/exception.h"
#include "host/tracer.h"
#include "internal/helpers/exception/logic_error.h"

namespace {

using cf::helpers::ExceptionDispatcher;

constexpr char kPlace[] = "cf::services::anti_phishing::heuristic::AntiPhishing::CreateSession";

struct Outcome {
  uvo::result_t code;
  std::vector<pelmix::host::TraceLine> lines;
};

Outcome DispatchThrown(const std::function<void()>& thrower) {
  auto tracer = pelmix::host::Tracer::Create(1000);
  ExceptionDispatcher dispatcher(tracer.Get());
  uvo::result_t code = 0;
  try {
    thrower();
  } catch (...) {
    code = dispatcher.Dispatch(kPlace);
  }
  return {code, tracer->Lines()};
}

void ExpectRow(const std::function<void()>& thrower, std::uint32_t code, const std::string& text) {
  const Outcome outcome = DispatchThrown(thrower);
  EXPECT_EQ(static_cast<std::uint32_t>(outcome.code), code);
  ASSERT_EQ(outcome.lines.size(), 1u);
  EXPECT_EQ(outcome.lines[0].level, 300);
  EXPECT_EQ(outcome.lines[0].text, std::string(kPlace) + ": " + text);
}

TEST(ExceptionDispatcher, LogicErrorWithAndWithoutCode) {
  ExpectRow([] { throw cf::helpers::LogicError("bad socks", uvo::kErrInvalidArgument); },
            0x80000046, "bad socks");
  ExpectRow([] { throw cf::helpers::LogicError("no code"); }, 0x80000040, "no code");
}

TEST(ExceptionDispatcher, ResultCodeExceptionsKeepTheirCode) {
  ExpectRow([] { throw uvo::ResultCodeException("f.cpp", 1, "", uvo::kErrNotImplemented); },
            0x80000043, "uvo::ResultCodeException 0x80000043 (Not implemented)");
  ExpectRow([] { throw uvo::CheckResultFailedException("f.cpp", 1, uvo::kErrAccessDenied); },
            0x80000045, "uvo::ResultCodeException 0x80000045 (Access denied)");
  ExpectRow([] { throw uvo::GetInterfaceException("f.cpp", 1, "", 0x9CCA5603, uvo::kErrNotFound); },
            0x8000004C, "uvo::ResultCodeException iid = 0x9cca5603: 0x8000004c (Not found)");
  ExpectRow(
      [] { throw uvo::SystemException("f.cpp", 1, "", uvo::kErrOutOfMemory, u"TracerSocks"); },
      0x80000041, "uvo::ResultCodeException TracerSocks: 0x80000041 (Out of memory)");
}

TEST(ExceptionDispatcher, FrameworkExceptions) {
  ExpectRow([] { throw uvo::RuntimeError("f.cpp", 1, "", u"broken"); }, 0x80000040,
            "uvo::RuntimeError broken");
  // A failed precondition has an empty description: the line ends with the blank.
  ExpectRow([] { throw uvo::CheckFailedException("f.cpp", 1); }, 0x80000040, "uvo::Exception ");
  ExpectRow([] { throw uvo::Exception("f.cpp", 1, "", u"plain"); }, 0x80000040,
            "uvo::Exception plain");
}

TEST(ExceptionDispatcher, StandardExceptions) {
  ExpectRow([] { throw std::bad_alloc(); }, 0x80000041, "Not enough memory std::bad_alloc");
  ExpectRow([] { throw std::invalid_argument("TraceLogger::TraceLogger: tracer is null"); },
            0x80000046, "Invalid argument TraceLogger::TraceLogger: tracer is null");
  ExpectRow([] { throw std::runtime_error("Can't create web checker"); }, 0x8000004B,
            "Can't create web checker");
  ExpectRow([] { ap::ThrowError("Control summ is invalid"); }, 0x8000004B,
            "Control summ is invalid");
}

TEST(ExceptionDispatcher, ForeignExceptionsDoNotEscape) {
  ExpectRow([] { throw 42; }, 0x80000072, "Unknown exception");
}

TEST(ExceptionDispatcher, RefusedTraceStillGivesTheCode) {
  auto tracer = pelmix::host::Tracer::Create(1000);
  tracer->SetRefuseRecords(true);
  ExceptionDispatcher dispatcher(tracer.Get());
  uvo::result_t code = 0;
  try {
    throw std::invalid_argument("x");
  } catch (...) {
    code = dispatcher.Dispatch(kPlace);
  }
  EXPECT_EQ(code, uvo::kErrInvalidArgument);
  EXPECT_TRUE(tracer->Lines().empty());
}

TEST(ExceptionDispatcher, NullTracerIsRefused) {
  try {
    ExceptionDispatcher dispatcher(nullptr);
    FAIL() << "built without a tracer";
  } catch (const cf::helpers::LogicError& e) {
    EXPECT_STREQ(e.what(), "Null tracer parameter");
    ASSERT_NE(e.Code(), nullptr);
    EXPECT_EQ(*e.Code(), uvo::kErrInvalidArgument);
  }
}

}  // namespace
