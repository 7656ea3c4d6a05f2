// Unit conversion one step at a time, the clock read in a unit, and the sleep.
#include "timing/Time.h"

#include "platform/Thread.h"
#include "timing/ClockSource.h"

namespace {

constexpr uint64_t kSubSecondFactor = 1000;
constexpr uint64_t kClockFactor = 60;

int32_t ClampUnit(TimeUnit unit) {
  if (unit < kPicoseconds) return kPicoseconds;
  if (unit > kHours) return kHours;
  return unit;
}

}  // namespace

uint64_t ConvertTime(TimeUnit fromUnit, uint64_t value, TimeUnit toUnit) {
  int32_t from = ClampUnit(fromUnit);
  const int32_t to = ClampUnit(toUnit);
  while (from < to) {
    value /= (from < kSeconds) ? kSubSecondFactor : kClockFactor;
    ++from;
  }
  while (from > to) {
    value *= (from <= kSeconds) ? kSubSecondFactor : kClockFactor;
    --from;
  }
  return value;
}

uint64_t NowIn(TimeUnit unit) { return ConvertTime(kPicoseconds, ReadClockPicoseconds(), unit); }

void SleepFor(uint64_t milliseconds) {
  platform::SleepMilliseconds(static_cast<uint32_t>(milliseconds));
}
