// The runtime's socket error numbers and the mapping of system errors onto them.
#pragma once

#include <cstdint>

namespace platform::net {

// Socket error numbers as the runtime knows them (the Winsock numbering).
constexpr int32_t kErrorInterrupted = 10004;
constexpr int32_t kErrorBadSocket = 10009;
constexpr int32_t kErrorInvalidArgument = 10022;
constexpr int32_t kErrorTooManySockets = 10024;
constexpr int32_t kErrorWouldBlock = 10035;
constexpr int32_t kErrorNotSocket = 10038;
constexpr int32_t kErrorAddressInUse = 10048;
constexpr int32_t kErrorAddressNotAvailable = 10049;
constexpr int32_t kErrorConnectionAborted = 10053;
constexpr int32_t kErrorConnectionReset = 10054;
constexpr int32_t kErrorNoBuffers = 10055;
constexpr int32_t kErrorNotConnected = 10057;
constexpr int32_t kErrorShutDown = 10058;
constexpr int32_t kErrorTimedOut = 10060;
constexpr int32_t kErrorConnectionRefused = 10061;
constexpr int32_t kErrorSystemCallFailure = 10107;  // any system error without its own number

// The runtime's number for a system error number (errno).
int32_t MapSystemError(int systemError);

// The error number of the last failing socket operation of the calling thread (0 if none).
int32_t LastSocketError();

// Records the error of a failing operation for LastSocketError (calling thread only).
void SetLastSocketError(int32_t error);

}  // namespace platform::net
