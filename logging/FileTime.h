// Conversion of driver time stamps (100 ns units since 1601-01-01 UTC) to UTC calendar fields.
#pragma once

#include <cstdint>

namespace nKV_DLL300 {

// The calendar fields of one instant in UTC, in the field order of the controller's system time.
struct CalendarTime {
  uint16_t year;          // 1601 to 30828
  uint16_t month;         // 1 to 12
  uint16_t dayOfWeek;     // 0 Sunday to 6 Saturday
  uint16_t day;           // 1 to 31
  uint16_t hour;          // 0 to 23
  uint16_t minute;        // 0 to 59
  uint16_t second;        // 0 to 59 (the time scale has no leap seconds)
  uint16_t milliseconds;  // 0 to 999; the sub-millisecond rest is dropped, not rounded
};

inline constexpr uint64_t kFileTimeTicksPerSecond = 10'000'000;
inline constexpr uint64_t kFileTimeTicksPerDay = 86'400 * kFileTimeTicksPerSecond;
// Ticks between 1601-01-01 and 1970-01-01 (the Unix epoch), both UTC.
inline constexpr uint64_t kFileTimeUnixEpoch = 116'444'736'000'000'000ull;

// Converts a time stamp to calendar fields as the controller's FileTimeToSystemTime does: pure
// arithmetic on the proleptic Gregorian calendar, no time zone. Values with the top bit set are
// refused (false, `out` untouched), exactly the values the controller cannot convert either.
bool FileTimeToCalendarTime(uint64_t fileTime, CalendarTime& out);

}  // namespace nKV_DLL300
