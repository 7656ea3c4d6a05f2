// Console output on standard error and the per-thread signal-handler depth.
#include "platform/Console.h"

#include <signal.h>
#include <unistd.h>

#include <cstdarg>
#include <cstdio>

namespace platform {

namespace {

constexpr size_t kMessageLimit = 1024;
thread_local volatile sig_atomic_t signalHandlerDepth = 0;  // this thread only

}  // namespace

void EtsDisplayMessage(const char* format, ...) {
  if (format == nullptr) return;
  char message[kMessageLimit];
  va_list arguments;
  va_start(arguments, format);
  const int length = std::vsnprintf(message, sizeof message, format, arguments);
  va_end(arguments);
  if (length <= 0) return;
  const size_t size = static_cast<size_t>(length) < sizeof message ? static_cast<size_t>(length)
                                                                   : sizeof message - 1;
  const ssize_t written = write(STDERR_FILENO, message, size);
  (void)written;  // nowhere to report a failing console
}

bool EtsCheckISRPriority() { return signalHandlerDepth > 0; }

SignalHandlerScope::SignalHandlerScope() { signalHandlerDepth = signalHandlerDepth + 1; }

SignalHandlerScope::~SignalHandlerScope() { signalHandlerDepth = signalHandlerDepth - 1; }

}  // namespace platform
