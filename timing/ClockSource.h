// The counter behind the picosecond clock, replaceable by a fake in tests.
#pragma once

#include <cstdint>

// A counter with a fixed frequency. The default source is the platform's monotonic counter.
class iClockSource {
 public:
  virtual ~iClockSource() = default;
  virtual uint64_t readCounter() = 0;
  virtual uint64_t counterFrequency() = 0;  // ticks per second, at least 1
};

// Makes `source` the clock of the whole process (nullptr restores the platform counter) and
// clears the clock state so that the next reading recomputes picoseconds per tick.
// `source` must outlive its installation. Meant for tests, before any other thread reads the clock.
void InstallClockSource(iClockSource* source);

// The current reading in picoseconds, modulo 2^64. Lazily initialised; any thread may call it.
uint64_t ReadClockPicoseconds();
