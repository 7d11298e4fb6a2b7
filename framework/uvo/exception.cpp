#include "framework/uvo/exception.h"

#include "framework/uvo/result.h"
#include "framework/uvo/text.h"

namespace uvo {

Exception::Exception(const char* file, int line, const char* function, std::u16string description,
                     IObject* nested)
    : file_(file ? file : ""),
      line_(line),
      function_(function ? function : ""),
      description_(std::move(description)),
      nested_(nested) {
  if (nested_) nested_->AddRef();
}

Exception::Exception(const Exception& other)
    : std::exception(other),
      file_(other.file_),
      line_(other.line_),
      function_(other.function_),
      description_(other.description_),
      nested_(other.nested_) {
  if (nested_) nested_->AddRef();
}

Exception::~Exception() {
  if (nested_) nested_->Release();
}

ResultCodeException::ResultCodeException(const char* file, int line, const char* function,
                                         result_t code, std::u16string description)
    : Exception(file, line, function, std::move(description)), code_(code) {}

std::u16string ResultCodeException::Description() const {
  std::u16string text = Exception::Description();
  if (!text.empty()) text += u": ";
  text += Widen(HexCode(static_cast<std::uint32_t>(code_)));
  text += u" (";
  text += ResultMessage(code_);
  text += u")";
  return text;
}

GetInterfaceException::GetInterfaceException(const char* file, int line, const char* function,
                                             iid_t iid, result_t code)
    : ResultCodeException(file, line, function, code, u"iid = " + Widen(HexCode(iid))), iid_(iid) {}

}  // namespace uvo
