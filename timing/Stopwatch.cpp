// Stopwatch over the picosecond clock; differences stay right across the 2^64 wrap.
#include "timing/Stopwatch.h"

#include "timing/ClockSource.h"
#include "timing/Time.h"

void Stopwatch::Restart() {
  startPs = 0;
  accumulatedPs = 0;
  isRunning = false;
  startPs = ReadClockPicoseconds();
  isRunning = true;
}

uint64_t Stopwatch::ElapsedMilliseconds() const {
  uint64_t total = accumulatedPs;
  if (isRunning) total += ReadClockPicoseconds() - startPs;
  return ConvertTime(kPicoseconds, total, kMilliseconds);
}
