// Virtual time of the simulated hardware: the monotonic clock, and its mapping to driver time
// stamps.
#pragma once

#include <cstdint>

namespace tarvix {

// Nanoseconds of the monotonic clock; the simulation's time line follows it.
int64_t NowNs();

// Driver time stamp (100 ns units since 1601-01-01 UTC) of a moment on the monotonic time line.
// The mapping is fixed once per process from the real-time clock, so stamps never go backwards.
uint64_t TimestampAt(int64_t monotonicNs);

// Seconds and microseconds since 1970-01-01 UTC of a driver time stamp (for candump -l lines).
void UnixTimeOf(uint64_t timestamp, uint64_t& seconds, uint32_t& microseconds);

// The monotonic deadline of a time-out in seconds from `nowNs`; a negative, endless or huge
// time-out waits without limit (INT64_MAX).
int64_t DeadlineOf(double timeoutS, int64_t nowNs);

// Sleeps the calling thread for up to `ns` nanoseconds (used by waiting reads and kxWait).
void SleepNs(int64_t ns);

}  // namespace tarvix
