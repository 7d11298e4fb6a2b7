// Result codes shared by the module and its hosts, and their UTF-16 messages.
#pragma once

#include <cstdint>
#include <string_view>

#include "framework/uvo/interfaces.h"

namespace uvo {

inline constexpr result_t kOk = 0;
inline constexpr result_t kFalse = 1;
inline constexpr result_t kErrNoInterface = static_cast<result_t>(0x80000001);
inline constexpr result_t kErrUnexpected = static_cast<result_t>(0x80000040);
inline constexpr result_t kErrOutOfMemory = static_cast<result_t>(0x80000041);
inline constexpr result_t kErrNotSupported = static_cast<result_t>(0x80000042);
inline constexpr result_t kErrNotImplemented = static_cast<result_t>(0x80000043);
inline constexpr result_t kErrBufferTooSmall = static_cast<result_t>(0x80000044);
inline constexpr result_t kErrAccessDenied = static_cast<result_t>(0x80000045);
inline constexpr result_t kErrInvalidArgument = static_cast<result_t>(0x80000046);
inline constexpr result_t kErrNotMatched = static_cast<result_t>(0x8000004A);
inline constexpr result_t kErrUnspecified = static_cast<result_t>(0x8000004B);
inline constexpr result_t kErrNotFound = static_cast<result_t>(0x8000004C);
inline constexpr result_t kErrFound = static_cast<result_t>(0x8000004D);
inline constexpr result_t kErrLocked = static_cast<result_t>(0x8000004F);
inline constexpr result_t kErrNotLocked = static_cast<result_t>(0x80000050);
inline constexpr result_t kErrCancelled = static_cast<result_t>(0x80000051);
inline constexpr result_t kErrMethodNotFound = static_cast<result_t>(0x80000057);
inline constexpr result_t kErrStackEmpty = static_cast<result_t>(0x80000058);
inline constexpr result_t kErrMedia = static_cast<result_t>(0x80000059);
inline constexpr result_t kErrInvalidSignature = static_cast<result_t>(0x8000005A);
inline constexpr result_t kErrInvalidVersion = static_cast<result_t>(0x8000005B);
inline constexpr result_t kErrInvalidSize = static_cast<result_t>(0x8000005C);
inline constexpr result_t kErrInvalidType = static_cast<result_t>(0x8000005D);
inline constexpr result_t kErrInvalidIndex = static_cast<result_t>(0x8000005E);
inline constexpr result_t kErrOutOfSpace = static_cast<result_t>(0x80000062);
inline constexpr result_t kErrNotReady = static_cast<result_t>(0x80000063);
inline constexpr result_t kErrLessThan = static_cast<result_t>(0x80000064);
inline constexpr result_t kErrMoreThan = static_cast<result_t>(0x80000065);
inline constexpr result_t kErrProhibited = static_cast<result_t>(0x80000066);
inline constexpr result_t kErrAlreadyDone = static_cast<result_t>(0x80000067);
inline constexpr result_t kErrNeedReboot = static_cast<result_t>(0x80000068);
inline constexpr result_t kErrBasesCorrupted = static_cast<result_t>(0x80000069);
inline constexpr result_t kErrInvalidState = static_cast<result_t>(0x8000006A);
inline constexpr result_t kErrNotInitialized = static_cast<result_t>(0x8000006B);
inline constexpr result_t kErrInsufficientResources = static_cast<result_t>(0x8000006C);
inline constexpr result_t kErrInvalidResult = static_cast<result_t>(0x80000071);
inline constexpr result_t kErrUnknownException = static_cast<result_t>(0x80000072);
inline constexpr result_t kErrMetaInfoNotFound = static_cast<result_t>(0x80000076);
inline constexpr result_t kErrPropertyNotFound = static_cast<result_t>(0x80000180);
inline constexpr result_t kErrTimeout = static_cast<result_t>(0x80000221);

// Platform codes: bits 16..30 equal 1. Their messages are indexed from this base.
inline constexpr std::uint32_t kPlatformCodeBase = 0x80010100;

constexpr bool Succeeded(result_t code) { return code >= 0; }
constexpr bool Failed(result_t code) { return code < 0; }
constexpr bool IsPlatformCode(result_t code) {
  return (static_cast<std::uint32_t>(code) & 0x7FFF0000u) == 0x00010000u;
}

// The message of a result code (both tables), UTF-16 as the framework keeps them.
std::u16string_view ResultMessage(result_t code);

// Every general code that has a message of its own, in table order (for tests and tools).
struct ResultCodeEntry {
  result_t code;
  std::u16string_view message;
};
const ResultCodeEntry* ResultCodeTable(std::size_t* count);

}  // namespace uvo
