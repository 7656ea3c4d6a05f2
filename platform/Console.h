// The kernel console: messages to standard error, and whether we are at interrupt level.
#pragma once

namespace platform {

// printf-style message to standard error, written with one call so lines do not interleave.
void EtsDisplayMessage(const char* format, ...) __attribute__((format(printf, 1, 2)));

// True only while the calling thread runs inside one of our signal handlers (the stand-in for
// interrupt priority), where console output must not happen.
bool EtsCheckISRPriority();

// Our signal handlers hold one of these for their duration. Async-signal-safe.
class SignalHandlerScope {
 public:
  SignalHandlerScope();
  ~SignalHandlerScope();
  SignalHandlerScope(const SignalHandlerScope&) = delete;
  SignalHandlerScope& operator=(const SignalHandlerScope&) = delete;
};

}  // namespace platform
