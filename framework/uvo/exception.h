// The framework's exception classes. Inside the module failures travel as these (and as
// standard exceptions); at the host boundary cf::helpers::ExceptionDispatcher turns them
// into result codes.
#pragma once

#include <cstdint>
#include <exception>
#include <string>

#include "framework/uvo/interfaces.h"

namespace uvo {

class Exception : public std::exception {
 public:
  Exception(const char* file, int line, const char* function, std::u16string description = {},
            IObject* nested = nullptr);
  Exception(const Exception& other);
  Exception& operator=(const Exception&) = delete;
  ~Exception() override;

  const char* File() const { return file_; }
  int Line() const { return line_; }
  const char* Function() const { return function_; }
  IObject* Nested() const { return nested_; }

  // The framework's text for this exception; subclasses add to the base text.
  virtual std::u16string Description() const { return description_; }

 private:
  const char* file_;
  int line_;
  const char* function_;
  std::u16string description_;
  IObject* nested_;
};

class ResultCodeException : public Exception {
 public:
  ResultCodeException(const char* file, int line, const char* function, result_t code,
                      std::u16string description = {});
  const char* what() const noexcept override { return "ResultCodeException"; }
  result_t Code() const { return code_; }
  // Base text, ": " when it is not empty, then "0x%08x (message)".
  std::u16string Description() const override;

 private:
  result_t code_;
};

class SystemException : public ResultCodeException {
 public:
  using ResultCodeException::ResultCodeException;
  const char* what() const noexcept override { return "SystemException"; }
};

class GetInterfaceException : public ResultCodeException {
 public:
  GetInterfaceException(const char* file, int line, const char* function, iid_t iid, result_t code);
  const char* what() const noexcept override { return "GetInterfaceException"; }
  iid_t Iid() const { return iid_; }

 private:
  iid_t iid_;
};

class CheckResultFailedException : public ResultCodeException {
 public:
  CheckResultFailedException(const char* file, int line, result_t code)
      : ResultCodeException(file, line, "", code) {}
  const char* what() const noexcept override { return "CheckResultFailedException"; }
};

class CheckFailedException : public Exception {
 public:
  CheckFailedException(const char* file, int line) : Exception(file, line, "") {}
  const char* what() const noexcept override { return "CheckFailedException"; }
};

class RuntimeError : public Exception {
 public:
  using Exception::Exception;
  const char* what() const noexcept override { return "RuntimeError"; }
};

// The base name of a source path, as checks report it.
constexpr const char* SourceBaseName(const char* path) {
  const char* base = path;
  for (const char* p = path; *p; ++p) {
    if (*p == '/' || *p == '\\') base = p + 1;
  }
  return base;
}

}  // namespace uvo

// A failed precondition.
#define UVO_CHECK(condition)                                                        \
  do {                                                                              \
    if (!(condition))                                                               \
      throw ::uvo::CheckFailedException(::uvo::SourceBaseName(__FILE__), __LINE__); \
  } while (0)

// A host call whose result code must not be a failure.
#define UVO_CHECK_RESULT(expression)                                                     \
  do {                                                                                   \
    const ::uvo::result_t uvo_check_result_ = (expression);                              \
    if (uvo_check_result_ < 0)                                                           \
      throw ::uvo::CheckResultFailedException(::uvo::SourceBaseName(__FILE__), __LINE__, \
                                              uvo_check_result_);                        \
  } while (0)
