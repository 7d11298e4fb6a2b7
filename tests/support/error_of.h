// What a call raises, as text, so that tests can compare exact error messages.
#pragma once

#include <string>

#include "engine/common/error.h"

namespace pelmix::testing {

// The message of the `Raised` error `call` raises, or "no error". Any other exception
// passes through and fails the test.
template <class Raised = ap::Error, class Call>
std::string ErrorOf(Call&& call) {
  try {
    call();
  } catch (const Raised& e) {
    return e.what();
  }
  return "no error";
}

}  // namespace pelmix::testing
