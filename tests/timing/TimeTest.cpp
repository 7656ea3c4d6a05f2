// Unit conversion edges, the clock read in units, and the sleep.
#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <ostream>

#include "tests/timing/FakeClock.h"
#include "timing/Time.h"

namespace {

constexpr uint64_t kMax = std::numeric_limits<uint64_t>::max();

struct Conversion {
  TimeUnit from;
  uint64_t value;
  TimeUnit to;
  uint64_t expected;
};

void PrintTo(const Conversion& c, std::ostream* out) {
  *out << c.value << " unit " << c.from << " to unit " << c.to;
}

class ConvertTimeTest : public ::testing::TestWithParam<Conversion> {};

TEST_P(ConvertTimeTest, GivesTruncatedOrWrappedValue) {
  const Conversion& c = GetParam();
  EXPECT_EQ(ConvertTime(c.from, c.value, c.to), c.expected);
}

INSTANTIATE_TEST_SUITE_P(
    Edges, ConvertTimeTest,
    ::testing::Values(
        Conversion{kMilliseconds, 0, kMilliseconds, 0},
        Conversion{kPicoseconds, kMax, kPicoseconds, kMax}, Conversion{kHours, kMax, kHours, kMax},
        Conversion{kSeconds, 1, kMilliseconds, 1000}, Conversion{kHours, 1, kMilliseconds, 3600000},
        Conversion{kMilliseconds, 59999, kMinutes, 0},
        Conversion{kMilliseconds, 60000, kMinutes, 1},
        Conversion{kPicoseconds, 1999, kMilliseconds, 0},
        Conversion{kPicoseconds, 1999999999, kMilliseconds, 1},
        // truncation at every step: 999 ps + 999 ns is still 0 us after the first step
        Conversion{kPicoseconds, 999999, kMicroseconds, 0},
        Conversion{kHours, 1, kPicoseconds, 3600000000000000ULL},
        // 10 000 hours in picoseconds overflows 2^64 and wraps
        Conversion{kHours, 10000, kPicoseconds, 10000ULL * 3600000000000000ULL},
        Conversion{kMinutes, 90, kHours, 1}, Conversion{kNanoseconds, 1000000000, kSeconds, 1}));

TEST(ConvertTimeTest, OutOfRangeUnitCodesActAsNearestUnit) {
  EXPECT_EQ(ConvertTime(static_cast<TimeUnit>(-5), 1000, kNanoseconds), 1u);
  EXPECT_EQ(ConvertTime(kMinutes, 2, static_cast<TimeUnit>(99)), 0u);
  EXPECT_EQ(ConvertTime(static_cast<TimeUnit>(INT32_MIN), 7, static_cast<TimeUnit>(INT32_MAX)), 0u);
}

// The counter reading goes through picoseconds per tick, truncated; a zero frequency is taken as
// one tick per second instead of a division by zero.
TEST(NowInTest, ConvertsCounterReadingThroughPicoseconds) {
  const struct {
    uint64_t frequency, ticks;
    TimeUnit unit;
    uint64_t expected;
  } rows[] = {{1000000000ULL, 2500000000ULL, kMilliseconds, 2500},
              {1000000000ULL, 2500000000ULL, kSeconds, 2},
              {3, 3, kPicoseconds, 999999999999ULL},
              {0, 1, kSeconds, 1}};
  for (const auto& row : rows) {
    FakeClock clock(row.frequency);
    clock.ticks = row.ticks;
    EXPECT_EQ(NowIn(row.unit), row.expected) << row.frequency << " Hz, " << row.ticks;
  }
}

TEST(SleepForTest, SleepsAtLeastTheRequestedTime) {
  constexpr uint64_t kRequestedMs = 20;
  const uint64_t before = NowIn(kMilliseconds);
  SleepFor(kRequestedMs);
  EXPECT_GE(NowIn(kMilliseconds) - before, kRequestedMs);
}

}  // namespace
