#include "internal/helpers/tracer/tracer_socks.h"

#include <cstring>
#include <limits>
#include <new>

#include "framework/uvo/exception.h"
#include "framework/uvo/result.h"
#include "internal/helpers/exception/logic_error.h"
#include "internal/helpers/service_locator/locator_services.h"

namespace cf {

uvo::Ptr<uvo::ITracer> TracerSocks::Create(uvo::IServiceLocator* locator,
                                           const std::string& prefix) {
  if (prefix.empty()) {
    throw helpers::LogicError("What do you need these socks for without prefix?",
                              uvo::kErrInvalidArgument);
  }
  uvo::Ptr<uvo::ITracer> host = helpers::GetService<uvo::ITracer>(locator);
  if (!host) return nullptr;
  TracerSocks* socks = new (std::nothrow) TracerSocks(std::move(host), prefix);
  if (socks == nullptr) {
    throw uvo::SystemException(uvo::SourceBaseName(__FILE__), __LINE__, __func__,
                               uvo::kErrOutOfMemory,
                               u"TracerSocks:: Create() failed to create an object");
  }
  return uvo::Ptr<uvo::ITracer>::Adopt(socks);
}

TracerSocks::TracerSocks(uvo::Ptr<uvo::ITracer> host, std::string prefix)
    : host_(std::move(host)), prefix_(std::move(prefix)) {}

uvo::result_t TracerSocks::CreateRecord(int level, char** buffer, std::uint32_t size) {
  if (buffer == nullptr) return uvo::kErrInvalidArgument;
  const auto room = static_cast<std::uint32_t>(prefix_.size());
  if (size > std::numeric_limits<std::uint32_t>::max() - room) return uvo::kErrInvalidArgument;
  // A regrow passes back the buffer handed out earlier, which starts after the prefix room.
  char* hostBuffer = *buffer ? *buffer - room : nullptr;
  const uvo::result_t result = host_->CreateRecord(level, &hostBuffer, size + room);
  if (result == 0 && hostBuffer != nullptr) {
    *buffer = hostBuffer + room;
  } else if (result == 0) {
    *buffer = nullptr;
  }
  return result;
}

uvo::result_t TracerSocks::CommitRecord(char* buffer, std::uint32_t length) {
  if (buffer == nullptr) return uvo::kErrInvalidArgument;
  const auto room = static_cast<std::uint32_t>(prefix_.size());
  char* hostBuffer = buffer - room;
  std::memcpy(hostBuffer, prefix_.data(), room);
  return host_->CommitRecord(hostBuffer, length + room);
}

}  // namespace cf
