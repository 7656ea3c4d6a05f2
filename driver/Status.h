// Status codes of the bus-interface driver: 0 success, negative error, positive warning.
#pragma once

#include <cstdint>

namespace driver {

// The driver's codes are written as their 32-bit patterns; a status is the signed 32-bit value.
constexpr int32_t StatusCode(uint32_t pattern) { return static_cast<int32_t>(pattern); }

inline constexpr int32_t kSuccess = 0;

// Time-outs.
inline constexpr int32_t kReadTimeout =
    StatusCode(0xBFF6300A);  // kxReadFrame found nothing to read
inline constexpr int32_t kWaitTimeout = StatusCode(0xBFF6300B);   // kxWait condition not reached
inline constexpr int32_t kWriteTimeout = StatusCode(0xBFF6300C);  // transmit queue stayed full

// Resources and caller buffers.
inline constexpr int32_t kOutOfMemory = StatusCode(0xBFF63010);
inline constexpr int32_t kBufferTooSmall = StatusCode(0xBFF63258);
inline constexpr int32_t kBufferMissing = StatusCode(0xBFF63259);

// References and objects.
inline constexpr int32_t kInvalidReference = StatusCode(0xBFF63020);  // unknown or closed reference
inline constexpr int32_t kWrongObjectKind =
    StatusCode(0xBFF63021);  // e.g. a device where a session is due
inline constexpr int32_t kInvalidName = StatusCode(0xBFF63022);  // missing, empty or too long name

// Properties and states.
inline constexpr int32_t kUnknownProperty = StatusCode(0xBFF63030);
inline constexpr int32_t kWrongPropertySize = StatusCode(0xBFF63031);
inline constexpr int32_t kPropertyReadOnly = StatusCode(0xBFF63032);
inline constexpr int32_t kInvalidPropertyValue = StatusCode(0xBFF63033);
inline constexpr int32_t kPropertyWhileRunning =
    StatusCode(0xBFF63034);  // interface setting on a started session
inline constexpr int32_t kSubordinateReadOnly =
    StatusCode(0xBFF63035);  // interface setting on a subordinate session
inline constexpr int32_t kUnknownState = StatusCode(0xBFF63036);
inline constexpr int32_t kWrongStateSize = StatusCode(0xBFF63037);

// Session creation.
inline constexpr int32_t kInterfaceNotFound = StatusCode(0xBFF63040);
inline constexpr int32_t kDatabaseNotFound = StatusCode(0xBFF63041);
inline constexpr int32_t kClusterNotFound = StatusCode(0xBFF63042);
inline constexpr int32_t kFrameNotFound = StatusCode(0xBFF63043);
inline constexpr int32_t kProtocolMismatch =
    StatusCode(0xBFF63044);  // database protocol vs interface
inline constexpr int32_t kInterfaceNotCapable =
    StatusCode(0xBFF63045);  // CAN FD on a classic interface
inline constexpr int32_t kInvalidMode = StatusCode(0xBFF63046);

// Session operations.
inline constexpr int32_t kWrongSessionMode =
    StatusCode(0xBFF63047);  // read on output, write on receive
inline constexpr int32_t kInvalidFrame = StatusCode(0xBFF63048);  // malformed frame record
inline constexpr int32_t kInvalidCondition = StatusCode(0xBFF6304A);
inline constexpr int32_t kInvalidScope = StatusCode(0xBFF6304B);
inline constexpr int32_t kListenOnly = StatusCode(0xBFF6304C);  // write on a listen-only interface

// J1939.
inline constexpr int32_t kAddressClaimFailed = StatusCode(0xBFF6320A);

// Warnings (positive): the operation did its work, with a remark.
// A receive queue overflowed since the last read: the oldest frames were dropped, and this read
// delivers the frames that remained.
inline constexpr int32_t kWarnReceiveQueueOverflow = StatusCode(0x3FF63050);

constexpr bool IsError(int32_t status) { return status < 0; }
constexpr bool IsWarning(int32_t status) { return status > 0; }

}  // namespace driver
