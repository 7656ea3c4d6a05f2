// The trace front end and the module's one instance.
#include "qvapal/tTrace.h"

#include "qvapal/tConsoleTraceDestination.h"

namespace nQVAPAL000 {

void tTrace::write(const char* text) {
  if (traceDestination == nullptr || text == nullptr) return;
  std::lock_guard<std::mutex> guard(lock);
  traceDestination->writeText(text);
}

tTrace& moduleTrace() {
  static tConsoleTraceDestination console;
  static tTrace trace(&console);
  return trace;
}

}  // namespace nQVAPAL000
