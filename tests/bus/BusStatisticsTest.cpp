// Frame counting, per-second rates and driver state fields of the three statistics blocks.
#include <gtest/gtest.h>

#include <cstring>

#include "bus/CanStatistics.h"
#include "bus/FlexRayStatistics.h"
#include "bus/FramesPerSecond.h"
#include "bus/LinStatistics.h"

namespace nKV_DLL300 {
namespace {

constexpr bool kInWindow = true;
constexpr bool kWindowOver = false;

driver::RawFrameHeader CanFrame(uint32_t identifier, uint8_t type, uint8_t length) {
  return driver::RawFrameHeader{0, identifier, type, 0, 0, length};
}

TEST(CanStatistics, EachFrameTypeCountsIntoItsOwnFields) {
  const struct {
    driver::RawFrameHeader frame;
    uint32_t CanBusStatistics::*total;
    uint32_t CanBusStatistics::*perSecond;
  } rows[] = {
      {CanFrame(0x100, 0x00, 8), &CanBusStatistics::standardFrames,
       &CanBusStatistics::standardFramesPerSecond},
      {CanFrame(0x200, 0x18, 64), &CanBusStatistics::standardFrames,
       &CanBusStatistics::standardFramesPerSecond},
      {CanFrame(0x20000100, 0x00, 8), &CanBusStatistics::extendedFrames,
       &CanBusStatistics::extendedFramesPerSecond},
      {CanFrame(0x321, 0x01, 0), &CanBusStatistics::remoteFrames,
       &CanBusStatistics::remoteFramesPerSecond},
      {CanFrame(0, 0x02, 0), &CanBusStatistics::errorFrames,
       &CanBusStatistics::errorFramesPerSecond},
  };
  for (const auto& row : rows) {
    CanBusStatistics s{};
    CanFrameTimes times;
    countFrame(s, times, row.frame, kInWindow);
    countFrame(s, times, row.frame, kWindowOver);
    EXPECT_EQ(s.*row.total, 2u) << std::hex << row.frame.identifier;
    EXPECT_EQ(s.*row.perSecond, 1u) << std::hex << row.frame.identifier;
    CanBusStatistics others = s;
    others.*row.total = others.*row.perSecond = 0;
    const CanBusStatistics zero{};
    EXPECT_EQ(std::memcmp(&others, &zero, sizeof others), 0);
  }
}

TEST(CanStatistics, OnlyDataFramesAddBusTimeAndJ1939CountsAsExtendedWithout) {
  CanBusStatistics s{};
  CanFrameTimes times;
  times.buildFrameTimeTables({0, 0, 500000, 0});
  countFrame(s, times, CanFrame(0x321, 0x01, 0), kInWindow);
  countFrame(s, times, CanFrame(0, 0x02, 0), kInWindow);
  countFrame(s, times, CanFrame(0x38FEF100, driver::kFrameJ1939, 8), kInWindow);
  EXPECT_EQ(times.busTimeMax(), 0.0);
  EXPECT_EQ(s.extendedFrames, 1u);
  EXPECT_EQ(s.standardFrames, 0u);
  countFrame(s, times, CanFrame(0x20000100, 0x00, 8), kInWindow);
  EXPECT_DOUBLE_EQ(times.busTimeMax(), 308.0);
}

TEST(CanStatistics, SendTurnsWindowCountsIntoRatesAndKeepsThePeakLoad) {
  CanBusStatistics s{};
  CanFrameTimes times;
  times.buildFrameTimeTables({0, 0, 500000, 0});
  for (int i = 0; i < 100; ++i) countFrame(s, times, CanFrame(0x100, 0, 8), kInWindow);
  PrepareToSend(s, times, 1000);
  EXPECT_EQ(s.standardFramesPerSecond, 100u);
  EXPECT_EQ(s.busLoad, 240u);
  EXPECT_EQ(s.peakBusLoad, 240u);
  EndWindow(s, times);
  EXPECT_EQ(s.busLoad, 0u);
  EXPECT_EQ(s.standardFramesPerSecond, 0u);
  EXPECT_EQ(s.standardFrames, 100u);
  countFrame(s, times, CanFrame(0x100, 0, 8), kInWindow);
  PrepareToSend(s, times, 1000);
  EXPECT_EQ(s.busLoad, 0u);  // 0.241 per mille truncates to 0
  EXPECT_EQ(s.peakBusLoad, 240u);
}

TEST(FramesPerSecond, RoundsAndSurvivesLongWindowsAndZeroTime) {
  EXPECT_EQ(FramesPerSecond(3, 1000), 3u);
  EXPECT_EQ(FramesPerSecond(2, 1500), 1u);  // 1.33
  EXPECT_EQ(FramesPerSecond(5, 3000), 1u);  // 1.67, half a frame added
  EXPECT_EQ(FramesPerSecond(1, 3000), 0u);
  EXPECT_EQ(FramesPerSecond(36000000, 3600000), 10000u);  // an hour at 10 000 frames/s
  EXPECT_EQ(FramesPerSecond(7, 0), 7500u);
}

TEST(CanStatistics, StateWordFillsItsBitFields) {
  CanBusStatistics s{};
  DecodeState(s, 0xA5C3F6E7u, 0x1234);
  EXPECT_EQ(s.faultCode, 0x1234u);
  EXPECT_EQ(s.stateBits0to3, 0x7u);
  EXPECT_EQ(s.stateBit4, 0u);
  EXPECT_EQ(s.stateBit5, 1u);
  EXPECT_EQ(s.stateBits8to11, 0x6u);
  EXPECT_EQ(s.stateBits16to23, 0xC3u);
  EXPECT_EQ(s.stateBits24to31, 0xA5u);
}

TEST(LinStatistics, CountsByTypeAndConvertsRates) {
  LinBusStatistics s{};
  for (uint8_t type : {0x40, 0x40, 0x41, 0x42, 0x43}) countFrame(s, type, kInWindow);
  countFrame(s, 0x40, kWindowOver);
  EXPECT_EQ(s.dataFrames, 3u);
  EXPECT_EQ(s.errorFrames, 1u);
  EXPECT_EQ(s.noResponseFrames, 1u);
  PrepareToSend(s, 500);
  EXPECT_EQ(s.dataFramesPerSecond, 5u);  // 2 frames in half a second, rounded: 4.5 -> 5
  EXPECT_EQ(s.errorFramesPerSecond, 3u);
  EndWindow(s);
  EXPECT_EQ(s.dataFramesPerSecond + s.errorFramesPerSecond + s.noResponseFramesPerSecond, 0u);
}

TEST(LinStatistics, StateUsesTheLow32BitsOnly) {
  LinBusStatistics s{};
  DecodeState(s, 0xFFFFFFFF'BF5A3C96ull, 9);
  EXPECT_EQ(s.faultCode, 9u);
  EXPECT_EQ(s.stateBits0to7, 0x96u);
  EXPECT_EQ(s.stateBit1, 1u);
  EXPECT_EQ(s.stateBits2to3, 1u);
  EXPECT_EQ(s.stateBits4to7, 0x9u);
  EXPECT_EQ(s.stateBits8to15, 0x3Cu);
  EXPECT_EQ(s.stateBits16to23, 0x5Au);
  EXPECT_EQ(s.stateBits24to29, 0x3Fu);
  EXPECT_EQ(s.stateBit31, 1u);
}

TEST(FlexRayStatistics, CountsDataAndNullFramesAndStoresTheThreeStates) {
  FlexRayBusStatistics s{};
  for (uint8_t type : {0x20, 0x21, 0x21, 0x22}) countFrame(s, type, kInWindow);
  EXPECT_EQ(s.dataFrames, 1u);
  EXPECT_EQ(s.nullFrames, 2u);
  PrepareToSend(s, 2000);
  EXPECT_EQ(s.nullFramesPerSecond, 1u);
  DecodeState(s, 0x7ABCu, 1);
  EXPECT_EQ(s.stateBits0to3, 0xCu);
  EXPECT_EQ(s.stateBits4to7, 0xBu);
  EXPECT_EQ(s.stateBits8to12, 0x1Au);
  EXPECT_EQ(s.stateBit13, 1u);
  EXPECT_EQ(s.stateBit14, 1u);
  StoreStatisticsWords(s, {1, 2, 3, 4, 5, 6}, 2);
  StoreLastStateWord(s, 77, 3);
  EXPECT_EQ(s.statisticsWords[5], 6u);
  EXPECT_EQ(s.lastStateWord, 77u);
  EXPECT_EQ(s.faultCode, 3u);
  EXPECT_EQ(s.reserved, 0u);
}

}  // namespace
}  // namespace nKV_DLL300
