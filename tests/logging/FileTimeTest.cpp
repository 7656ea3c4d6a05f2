// Time stamp to calendar conversion: fixed dates and a sweep against the C library's UTC calendar.
#include <gtest/gtest.h>

#include <cstdint>
#include <ctime>
#include <random>
#include <vector>

#include "logging/FileTime.h"

namespace nKV_DLL300 {
namespace {

constexpr uint64_t kTicksPerMs = 10'000;

struct DateCase {
  const char* name;
  uint64_t fileTime;
  CalendarTime expected;  // year, month, dayOfWeek, day, hour, minute, second, ms
};
void PrintTo(const DateCase& c, std::ostream* os) { *os << c.name; }

// The calendar rules themselves are swept below; here: the ends of the range and truncation.
const DateCase kDates[] = {
    {"Epoch1601IsMonday", 0, {1601, 1, 1, 1, 0, 0, 0, 0}},
    {"LastTickOfFirstDay", kFileTimeTicksPerDay - 1, {1601, 1, 1, 1, 23, 59, 59, 999}},
    {"MillisecondsTruncated", 133'604'103'030'429'999ull, {2024, 5, 5, 17, 9, 5, 3, 42}},
    {"LargestConvertible", 0x7FFF'FFFF'FFFF'FFFFull, {30828, 9, 4, 14, 2, 48, 5, 477}},
};

// year, month, dayOfWeek, day, hour, minute, second, ms
std::vector<int64_t> Fields(const CalendarTime& t) {
  return {t.year, t.month, t.dayOfWeek, t.day, t.hour, t.minute, t.second, t.milliseconds};
}

class FileTimeDates : public testing::TestWithParam<DateCase> {};

TEST_P(FileTimeDates, ConvertsToExpectedCalendarFields) {
  CalendarTime t{};
  ASSERT_TRUE(FileTimeToCalendarTime(GetParam().fileTime, t));
  EXPECT_EQ(Fields(t), Fields(GetParam().expected));
}

INSTANTIATE_TEST_SUITE_P(Dates, FileTimeDates, testing::ValuesIn(kDates),
                         [](const auto& info) { return std::string(info.param.name); });

TEST(FileTime, TopBitSetIsRefusedAndLeavesOutputAlone) {
  CalendarTime t{};
  t.year = 7;
  EXPECT_FALSE(FileTimeToCalendarTime(0x8000'0000'0000'0000ull, t));
  EXPECT_FALSE(FileTimeToCalendarTime(~0ull, t));
  EXPECT_EQ(t.year, 7);
}

TEST(FileTime, AgreesWithCLibraryUtcCalendarFrom1601To9999) {
  std::mt19937_64 random(20240517);
  const int64_t firstSecond = -11'644'473'600;  // 1601-01-01
  const int64_t lastSecond = 253'402'300'799;   // 9999-12-31 23:59:59
  std::uniform_int_distribution<int64_t> seconds(firstSecond, lastSecond);
  for (int i = 0; i < 20'000; ++i) {
    const int64_t unixSeconds = seconds(random);
    const uint64_t ms = random() % 1000;
    const uint64_t fileTime =
        static_cast<uint64_t>(unixSeconds - firstSecond) * kFileTimeTicksPerSecond +
        ms * kTicksPerMs;
    const time_t asTimeT = static_cast<time_t>(unixSeconds);
    std::tm tm{};
    ASSERT_NE(gmtime_r(&asTimeT, &tm), nullptr);
    CalendarTime t{};
    ASSERT_TRUE(FileTimeToCalendarTime(fileTime, t));
    ASSERT_EQ(Fields(t),
              (std::vector<int64_t>{tm.tm_year + 1900, tm.tm_mon + 1, tm.tm_wday, tm.tm_mday,
                                    tm.tm_hour, tm.tm_min, tm.tm_sec, static_cast<int64_t>(ms)}))
        << unixSeconds;
  }
}

}  // namespace
}  // namespace nKV_DLL300
