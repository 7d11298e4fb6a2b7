#include "framework/uvo/result.h"

#include <array>
#include <iterator>

namespace uvo {
namespace {

constexpr ResultCodeEntry kGeneral[] = {
    {kOk, u"No error"},
    {kFalse, u"False"},
    {kErrNoInterface, u"Interface not supported"},
    {kErrUnexpected, u"Unexpected"},
    {kErrOutOfMemory, u"Out of memory"},
    {kErrNotSupported, u"Not supported"},
    {kErrNotImplemented, u"Not implemented"},
    {kErrBufferTooSmall, u"Buffer too small"},
    {kErrAccessDenied, u"Access denied"},
    {kErrInvalidArgument, u"Invalid argument"},
    {kErrNotMatched, u"Not matched"},
    {kErrUnspecified, u"Unspecified error"},
    {kErrNotFound, u"Not found"},
    {kErrFound, u"Found"},
    {kErrLocked, u"Locked"},
    {kErrNotLocked, u"Not locked"},
    {kErrCancelled, u"Operation cancelled"},
    {kErrMethodNotFound, u"Method not found"},
    {kErrStackEmpty, u"Stack is empty"},
    {kErrMedia, u"Media error"},
    {kErrInvalidSignature, u"Invalid signature"},
    {kErrInvalidVersion, u"Invalid version"},
    {kErrInvalidSize, u"Invalid size"},
    {kErrInvalidType, u"Invalid type"},
    {kErrInvalidIndex, u"Invalid index"},
    {kErrOutOfSpace, u"Out of space"},
    {kErrNotReady, u"Not ready"},
    {kErrLessThan, u"Less than"},
    {kErrMoreThan, u"More than"},
    {kErrProhibited, u"Prohibited"},
    {kErrAlreadyDone, u"Already done"},
    {kErrNeedReboot, u"Need reboot"},
    {kErrBasesCorrupted, u"Bases corrupted"},
    {kErrInvalidState, u"Invalid state"},
    {kErrNotInitialized, u"Not initialized"},
    {kErrInsufficientResources, u"Insufficient resources"},
    {kErrInvalidResult, u"Invalid result"},
    {kErrUnknownException, u"Unknown exception"},
    {kErrMetaInfoNotFound, u"Meta information not found"},
    {kErrPropertyNotFound, u"Property not found"},
    {kErrTimeout, u"Operation timeout"},
};

// Indexed by code - kPlatformCodeBase; empty slots have no message of their own.
constexpr std::array<std::u16string_view, 20> kPlatform = {
    u"Unspecified platform error",
    u"Invalid handle",
    u"File not found",
    u"Path not found",
    u"Sharing violation",
    u"Already exists",
    u"Wait abandoned",
    u"Symbol not found",
    u"Sxs is incorrect",
    u"Invalid path name",
    u"",
    u"",
    u"",
    u"",
    u"",
    u"",
    u"Cannot open an anonymous level security token",
    u"Password is invalid",
    u"Module not found",
    u"System image bad signature",
};

}  // namespace

std::u16string_view ResultMessage(result_t code) {
  if (IsPlatformCode(code)) {
    const std::uint32_t raw = static_cast<std::uint32_t>(code);
    if (raw >= kPlatformCodeBase && raw - kPlatformCodeBase < kPlatform.size() &&
        !kPlatform[raw - kPlatformCodeBase].empty()) {
      return kPlatform[raw - kPlatformCodeBase];
    }
    return u"Unknown platform result code";
  }
  for (const auto& entry : kGeneral) {
    if (entry.code == code) return entry.message;
  }
  return u"Unknown result code";
}

const ResultCodeEntry* ResultCodeTable(std::size_t* count) {
  *count = std::size(kGeneral);
  return kGeneral;
}

}  // namespace uvo
