// Time units, the picosecond clock read in any unit, and the millisecond sleep.
#pragma once

#include <cstdint>

// Ordered unit codes: neighbours differ by 1000 from picoseconds to seconds, by 60 above.
enum TimeUnit : int32_t {
  kPicoseconds = 0,
  kNanoseconds = 1,
  kMicroseconds = 2,
  kMilliseconds = 3,
  kSeconds = 4,
  kMinutes = 5,
  kHours = 6,
};

// `value` in unit `from` expressed in unit `to`, truncating at every step towards larger units
// and wrapping modulo 2^64 towards smaller ones. Codes outside 0..6 are taken as the nearest
// valid unit, so a stray code cannot make the conversion loop for billions of steps.
uint64_t ConvertTime(TimeUnit from, uint64_t value, TimeUnit to);

// The monotonic clock's current reading in `unit` (picoseconds modulo 2^64, then converted).
uint64_t NowIn(TimeUnit unit);

// Blocks the calling thread; only the low 32 bits are used, 0 yields the time slice.
void SleepFor(uint64_t milliseconds);
