// CLOCK_MONOTONIC as the performance counter, one tick per nanosecond.
#include "platform/Clock.h"

#include <time.h>

namespace platform {

namespace {
constexpr int64_t kNanosecondsPerSecond = 1000000000;
}

int64_t ReadPerformanceCounter() {
  timespec now{};
  clock_gettime(CLOCK_MONOTONIC, &now);
  return static_cast<int64_t>(now.tv_sec) * kNanosecondsPerSecond + now.tv_nsec;
}

int64_t PerformanceCounterFrequency() { return kNanosecondsPerSecond; }

}  // namespace platform
