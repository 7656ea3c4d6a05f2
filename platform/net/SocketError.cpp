// errno becomes the runtime's socket error number once, here.
#include "platform/net/SocketError.h"

#include <cerrno>

namespace platform::net {

namespace {

struct ErrorPair {
  int systemError;
  int32_t runtimeError;
};

constexpr ErrorPair kErrorPairs[] = {
    {EINTR, kErrorInterrupted},
    {EBADF, kErrorBadSocket},
    {EACCES, 10013},
    {EFAULT, 10014},
    {EINVAL, kErrorInvalidArgument},
    {EMFILE, kErrorTooManySockets},
    {ENFILE, kErrorTooManySockets},
    {EAGAIN, kErrorWouldBlock},
    {EINPROGRESS, 10036},
    {EALREADY, 10037},
    {ENOTSOCK, kErrorNotSocket},
    {EDESTADDRREQ, 10039},
    {EMSGSIZE, 10040},
    {EPROTOTYPE, 10041},
    {ENOPROTOOPT, 10042},
    {EPROTONOSUPPORT, 10043},
    {EOPNOTSUPP, 10045},
    {EAFNOSUPPORT, 10047},
    {EADDRINUSE, kErrorAddressInUse},
    {EADDRNOTAVAIL, kErrorAddressNotAvailable},
    {ENETDOWN, 10050},
    {ENETUNREACH, 10051},
    {ENETRESET, 10052},
    {ECONNABORTED, kErrorConnectionAborted},
    {ECONNRESET, kErrorConnectionReset},
    {ENOBUFS, kErrorNoBuffers},
    {ENOMEM, kErrorNoBuffers},
    {EISCONN, 10056},
    {ENOTCONN, kErrorNotConnected},
    {ESHUTDOWN, kErrorShutDown},
    {EPIPE, kErrorShutDown},  // sending after the connection was shut down
    {ETIMEDOUT, kErrorTimedOut},
    {ECONNREFUSED, kErrorConnectionRefused},
    {EHOSTDOWN, 10064},
    {EHOSTUNREACH, 10065},
};

thread_local int32_t lastError = 0;

}  // namespace

int32_t MapSystemError(int systemError) {
  for (const ErrorPair& pair : kErrorPairs) {
    if (pair.systemError == systemError) return pair.runtimeError;
  }
  return kErrorSystemCallFailure;
}

int32_t LastSocketError() { return lastError; }

void SetLastSocketError(int32_t error) { lastError = error; }

}  // namespace platform::net
