// The trace hooks and the fixed-buffer formatted output.
#include "qvapal/TraceOutput.h"

#include <cstdio>

#include "platform/Console.h"

namespace nQVAPAL000 {

namespace {
constexpr size_t kTraceBufferSize = 256;
}

int defaultFormat(char* buffer, size_t size, const char* format, va_list arguments) {
  if (buffer == nullptr || size == 0 || format == nullptr) return -1;
  return std::vsnprintf(buffer, size, format, arguments);
}

void defaultConsoleOutput(const char* text) {
  if (platform::EtsCheckISRPriority()) return;
  platform::EtsDisplayMessage("%s", text);
}

FormatHook formatHook = defaultFormat;
ConsoleOutputHook consoleOutputHook = defaultConsoleOutput;

void tracePrintf(const char* format, ...) {
  char buffer[kTraceBufferSize] = {};
  va_list arguments;
  va_start(arguments, format);
  formatHook(buffer, sizeof buffer, format, arguments);
  va_end(arguments);
  buffer[kTraceBufferSize - 1] = '\0';
  consoleOutputHook(buffer);
}

int traceFormat(char* buffer, size_t size, const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  const int result = formatHook(buffer, size, format, arguments);
  va_end(arguments);
  return result;
}

}  // namespace nQVAPAL000
