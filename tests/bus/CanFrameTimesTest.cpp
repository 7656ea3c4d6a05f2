// Frame-time tables, bus time and bus load of CAN.
#include <gtest/gtest.h>

#include "bus/CanFrameTimes.h"

namespace nKV_DLL300 {
namespace {

constexpr uint64_t kClassicRate = 500000;
constexpr uint64_t kDataRate = 2000000;
constexpr uint32_t kStandard = 0, kExtended = 1;

TEST(CanFrameTimes, LengthsMapToTheirIndexAndOthersToNone) {
  const struct {
    uint32_t length, index;
  } rows[] = {{0, 0},
              {8, 8},
              {9, CanFrameTimes::kNoIndex},
              {12, 9},
              {16, 10},
              {20, 11},
              {24, 12},
              {32, 13},
              {48, 14},
              {64, 15},
              {63, CanFrameTimes::kNoIndex},
              {2047, CanFrameTimes::kNoIndex}};
  for (const auto& row : rows)
    EXPECT_EQ(CanFrameTimes::indexOf(row.length), row.index) << row.length;
}

TEST(CanFrameTimes, ClassicTablesCountStuffBitsOnlyInTheMaximum) {
  CanFrameTimes times;
  times.buildFrameTimeTables({0, 0, kClassicRate, 0});
  // 8 bytes standard: 111 bits, 19 stuff bits; extended: 131 bits, 23 stuff bits. 2 us per bit.
  EXPECT_DOUBLE_EQ(times.frameTimeMin(kStandard, 8), 222.0);
  EXPECT_DOUBLE_EQ(times.frameTimeMax(kStandard, 8), 260.0);
  EXPECT_DOUBLE_EQ(times.frameTimeMin(kExtended, 0), 134.0);
  EXPECT_DOUBLE_EQ(times.frameTimeMax(kExtended, 8), 308.0);
  EXPECT_TRUE(times.hasFrameTime(8));
  EXPECT_FALSE(times.hasFrameTime(9));
}

TEST(CanFrameTimes, FdTablesUseTheDataRateOfTheMode) {
  CanFrameTimes switching;
  switching.buildFrameTimeTables({2, 0, kClassicRate, kDataRate});
  // 64 bytes standard: 38 (34) bits at 500 kbit/s plus 643 (541) bits at 2 Mbit/s.
  EXPECT_DOUBLE_EQ(switching.frameTimeMax(kStandard, 15), 76.0 + 321.5);
  EXPECT_DOUBLE_EQ(switching.frameTimeMin(kStandard, 15), 68.0 + 270.5);
  // 16 bytes extended, no switching: 61 (53) + 177 (152) bits, all at 500 kbit/s.
  CanFrameTimes plain;
  plain.buildFrameTimeTables({1, 0, kClassicRate, kDataRate});
  EXPECT_DOUBLE_EQ(plain.frameTimeMax(kExtended, 10), 2.0 * (61 + 177));
  EXPECT_DOUBLE_EQ(plain.frameTimeMin(kExtended, 10), 2.0 * (53 + 152));
}

TEST(CanFrameTimes, SettingsWithoutUsableDurationsBuildNoTable) {
  const CanFrameTimeSettings rows[] = {
      {0, 1, kClassicRate, 0},  // J1939 on a classic interface
      {3, 0, kClassicRate, kDataRate},
      {0, 0, 0, 0},             // no bit rate known: durations would be infinite
      {2, 0, kClassicRate, 0},  // switching without a data rate
  };
  for (const auto& settings : rows) {
    CanFrameTimes times;
    times.buildFrameTimeTables(settings);
    times.addFrame(false, 8);
    EXPECT_FALSE(times.hasFrameTime(0));
    EXPECT_EQ(times.busLoad(1000), 0u);
  }
}

TEST(CanFrameTimes, LengthsWithoutIndexAddNoBusTime) {
  CanFrameTimes times;
  times.buildFrameTimeTables({0, 0, kClassicRate, 0});
  times.addFrame(false, 12);  // an FD length on a classic table
  times.addFrame(true, 300);
  EXPECT_EQ(times.busTimeMax(), 0.0);
  times.addFrame(false, 8);
  EXPECT_DOUBLE_EQ(times.busTimeMax(), 260.0);
  EXPECT_DOUBLE_EQ(times.busTimeMin(), 222.0);
}

TEST(CanFrameTimes, BusLoadIsTruncatedPerMilleTimesTenAndCapped) {
  CanFrameTimes times;
  times.buildFrameTimeTables({0, 0, kClassicRate, 0});
  for (int i = 0; i < 100; ++i) times.addFrame(false, 8);  // mean 241 us each
  EXPECT_EQ(times.busLoad(1000), 240u);                    // 24.1 per mille
  EXPECT_EQ(times.busLoad(24), 10000u);                    // more bus time than time
  EXPECT_EQ(times.busLoad(0), 10000u);
  times.clearBusTime();
  EXPECT_EQ(times.busLoad(1000), 0u);
}

}  // namespace
}  // namespace nKV_DLL300
