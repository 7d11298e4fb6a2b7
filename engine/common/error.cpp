#include "engine/common/error.h"

#include "platform/exception_notification.h"

namespace ap {

void ThrowError(const std::string& message) {
  platform::RaiseException(platform::kEngineErrorNotification, 0);
  throw Error(message);
}

}  // namespace ap
