// The stopwatch: zero states, elapsed time and the wrap of the picosecond product.
#include <gtest/gtest.h>

#include "tests/timing/FakeClock.h"
#include "timing/Stopwatch.h"
#include "timing/Time.h"

namespace {

constexpr uint64_t kTicksPerMs = 1000000;  // nanosecond counter

TEST(StopwatchTest, NeverRestartedOrJustRestartedReportsZero) {
  FakeClock clock;
  clock.ticks = 123456789;
  Stopwatch watch;
  EXPECT_EQ(watch.ElapsedMilliseconds(), 0u);
  watch.Restart();
  EXPECT_EQ(watch.ElapsedMilliseconds(), 0u);
}

TEST(StopwatchTest, ReportsWholeMillisecondsSinceRestart) {
  FakeClock clock;
  Stopwatch watch;
  watch.Restart();
  clock.ticks += 10000 * kTicksPerMs + kTicksPerMs - 1;
  EXPECT_EQ(watch.ElapsedMilliseconds(), 10000u);
  clock.ticks += 1;
  EXPECT_EQ(watch.ElapsedMilliseconds(), 10001u);
}

TEST(StopwatchTest, RestartBeginsAgainFromNow) {
  FakeClock clock;
  Stopwatch watch;
  watch.Restart();
  clock.ticks += 700 * kTicksPerMs;
  watch.Restart();
  clock.ticks += 5 * kTicksPerMs;
  EXPECT_EQ(watch.ElapsedMilliseconds(), 5u);
}

TEST(StopwatchTest, ElapsedStaysRightAcrossPicosecondWrap) {
  FakeClock clock;
  // 1000 ps per tick: place the start 2 ms before the product wraps at 2^64.
  clock.ticks = (UINT64_MAX / 1000) - 2 * kTicksPerMs;
  Stopwatch watch;
  watch.Restart();
  clock.ticks += 3 * kTicksPerMs;
  EXPECT_EQ(watch.ElapsedMilliseconds(), 3u);
}

TEST(StopwatchTest, MeasuresRealTimePassing) {
  Stopwatch watch;
  watch.Restart();
  const uint64_t deadline = NowIn(kMilliseconds) + 5;
  while (NowIn(kMilliseconds) < deadline) SleepFor(1);
  EXPECT_GE(watch.ElapsedMilliseconds(), 4u);
}

}  // namespace
