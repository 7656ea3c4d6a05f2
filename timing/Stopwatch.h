// Elapsed milliseconds since the last restart, read from the picosecond clock.
#pragma once

#include <cstdint>

// A plain value owned by one object and used by its thread (or under its lock). A default
// (all zero) stopwatch reports 0 ms; Restart is the only way to start it.
struct Stopwatch {
  uint64_t startPs = 0;        // clock reading when last restarted
  uint64_t accumulatedPs = 0;  // picoseconds from earlier runs; nothing pauses, so always 0
  bool isRunning = false;

  void Restart();
  uint64_t ElapsedMilliseconds() const;
};
