// The trace front end: one per module, bound to the console destination at load.
#pragma once

#include <mutex>

#include "qvapal/iTraceDestination.h"

namespace nQVAPAL000 {

// Serialises writes to its destination. The further display settings of the original front end
// are not carried: nothing in this runtime reads them.
class tTrace {
 public:
  explicit tTrace(iTraceDestination* destination) : traceDestination(destination) {}
  virtual ~tTrace() = default;
  tTrace(const tTrace&) = delete;
  tTrace& operator=(const tTrace&) = delete;

  // Writes text to the destination; nothing happens without one. Any thread may call it.
  void write(const char* text);
  iTraceDestination* destination() const { return traceDestination; }

 private:
  iTraceDestination* const traceDestination;  // not owned; set at construction
  std::mutex lock;                            // serialises writes to the destination
};

// The module's trace, bound to the module's console destination; made on first use.
tTrace& moduleTrace();

}  // namespace nQVAPAL000
