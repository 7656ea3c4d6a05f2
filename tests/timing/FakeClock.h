// A clock source whose counter moves only when a test says so.
#pragma once

#include "timing/ClockSource.h"

class FakeClock final : public iClockSource {
 public:
  explicit FakeClock(uint64_t frequency = 1000000000ULL) : frequency(frequency) {
    InstallClockSource(this);
  }
  ~FakeClock() override { InstallClockSource(nullptr); }
  uint64_t readCounter() override { return ticks; }
  uint64_t counterFrequency() override { return frequency; }

  uint64_t ticks = 0;
  uint64_t frequency;
};
