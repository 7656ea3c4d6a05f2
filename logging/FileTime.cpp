// Conversion of driver time stamps to calendar fields: days to a civil date, rest to the clock.
#include "logging/FileTime.h"

namespace nKV_DLL300 {
namespace {

// Days from 0000-03-01 to 1601-01-01 in the proleptic Gregorian calendar: dates counted from a
// March 1st put the leap day at the end of the (400-year) era, which makes the arithmetic linear.
constexpr int64_t kDaysFromMarch0To1601 = 584'694;
constexpr uint64_t kLargestConvertible = 0x7FFF'FFFF'FFFF'FFFFull;

void CivilFromDays(int64_t daysSince1601, CalendarTime& out) {
  const int64_t z = daysSince1601 + kDaysFromMarch0To1601;
  const int64_t era = z / 146'097;             // z is never negative here
  const int64_t dayOfEra = z - era * 146'097;  // [0, 146096]
  const int64_t yearOfEra =
      (dayOfEra - dayOfEra / 1'460 + dayOfEra / 36'524 - dayOfEra / 146'096) / 365;  // [0, 399]
  const int64_t dayOfYear = dayOfEra - (365 * yearOfEra + yearOfEra / 4 - yearOfEra / 100);
  const int64_t monthFromMarch = (5 * dayOfYear + 2) / 153;  // 0 = March ... 11 = February
  const int64_t month = monthFromMarch < 10 ? monthFromMarch + 3 : monthFromMarch - 9;
  out.year = static_cast<uint16_t>(yearOfEra + era * 400 + (month <= 2 ? 1 : 0));
  out.month = static_cast<uint16_t>(month);
  out.day = static_cast<uint16_t>(dayOfYear - (153 * monthFromMarch + 2) / 5 + 1);
  // 1601-01-01 was a Monday.
  out.dayOfWeek = static_cast<uint16_t>((daysSince1601 + 1) % 7);
}

}  // namespace

bool FileTimeToCalendarTime(uint64_t fileTime, CalendarTime& out) {
  if (fileTime > kLargestConvertible) return false;
  const uint64_t days = fileTime / kFileTimeTicksPerDay;
  const uint64_t ticksOfDay = fileTime - days * kFileTimeTicksPerDay;
  const uint64_t millisOfDay = ticksOfDay / 10'000;
  CivilFromDays(static_cast<int64_t>(days), out);
  out.milliseconds = static_cast<uint16_t>(millisOfDay % 1'000);
  const uint64_t secondsOfDay = millisOfDay / 1'000;
  out.second = static_cast<uint16_t>(secondsOfDay % 60);
  out.minute = static_cast<uint16_t>(secondsOfDay / 60 % 60);
  out.hour = static_cast<uint16_t>(secondsOfDay / 3'600);
  return true;
}

}  // namespace nKV_DLL300
