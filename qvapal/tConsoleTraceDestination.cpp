// Console destination: length-limited printing and its fixed argument text.
#include "qvapal/tConsoleTraceDestination.h"

#include <cstdio>

#include "qvapal/TraceOutput.h"

namespace nQVAPAL000 {

namespace {
constexpr char kArguments[] = " --destination apal";
}

void tConsoleTraceDestination::writeTextN(const char* text, uint32_t length) {
  char format[16];
  std::snprintf(format, sizeof format, "%%.%us", length);  // "%.<length>s"
  tracePrintf(format, text);
}

void tConsoleTraceDestination::writeText(const char* text) { tracePrintf("%s", text); }

void tConsoleTraceDestination::getDestinationArguments(char* buffer, uint32_t size,
                                                       uint32_t* needed) {
  if (buffer != nullptr) {
    for (uint32_t i = 0; i < size && i < sizeof kArguments; ++i) buffer[i] = kArguments[i];
    if (size > 0) buffer[size - 1] = '\0';
  }
  if (needed != nullptr) *needed = sizeof kArguments;
}

}  // namespace nQVAPAL000
