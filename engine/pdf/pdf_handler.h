// The receiver of what a PDF attachment shows: the strings of its text operators and the
// targets of its /URI entries. The mail checker implements it; the PDF scanner calls it.
#pragma once

#include <string>

namespace ap {

class PdfHandler {
 public:
  virtual void text(const std::string& s) = 0;  // slot 0: a string shown by a text operator
  virtual void link(const std::string& u) = 0;  // slot 1: the target of a /URI entry
  virtual ~PdfHandler() = default;
};

}  // namespace ap
