// The monotonic counter that stands in for the controller's performance counter.
#pragma once

#include <cstdint>

namespace platform {

// Current reading of CLOCK_MONOTONIC in nanoseconds (the counter's ticks).
int64_t ReadPerformanceCounter();

// Ticks per second of ReadPerformanceCounter: always 10^9.
int64_t PerformanceCounterFrequency();

}  // namespace platform
