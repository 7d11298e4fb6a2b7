// The shell helpers' own error: a text and, optionally, the result code it should become.
#pragma once

#include <boost/exception/exception.hpp>
#include <boost/exception/get_error_info.hpp>
#include <boost/exception/info.hpp>
#include <stdexcept>
#include <string>

#include "framework/uvo/interfaces.h"

namespace cf::helpers {

using ResultCodeInfo = boost::error_info<struct ResultCodeTag, uvo::result_t>;

class LogicError : public std::logic_error, public boost::exception {
 public:
  explicit LogicError(const std::string& text) : std::logic_error(text) {}
  LogicError(const std::string& text, uvo::result_t code) : std::logic_error(text) {
    *this << ResultCodeInfo(code);
  }
  // The attached result code, or null when none is attached.
  const uvo::result_t* Code() const { return boost::get_error_info<ResultCodeInfo>(*this); }
};

}  // namespace cf::helpers
