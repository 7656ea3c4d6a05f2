// The bus-statistics blocks of the three buses, sent as they are held in messages of type 6.
#pragma once

#include <cstddef>
#include <cstdint>

namespace nKV_DLL300 {

inline constexpr uint8_t kStatisticsMessageType = 6;

// CAN: 68 bytes, 17 little-endian unsigned 32-bit fields. Totals count frames since the table was
// last emptied; a PerSecond field counts frames of the current window until the send turns it into
// frames per second. busLoad and peakBusLoad are in 0.01 % units (at most 10000). The state fields
// are bit fields of the driver's CAN state word, named by their bit positions.
struct CanBusStatistics {
  uint32_t standardFrames;
  uint32_t standardFramesPerSecond;
  uint32_t extendedFrames;
  uint32_t extendedFramesPerSecond;
  uint32_t remoteFrames;
  uint32_t remoteFramesPerSecond;
  uint32_t errorFrames;
  uint32_t errorFramesPerSecond;
  uint32_t busLoad;
  uint32_t peakBusLoad;
  uint32_t faultCode;
  uint32_t stateBits0to3;
  uint32_t stateBits8to11;
  uint32_t stateBits24to31;
  uint32_t stateBits16to23;
  uint32_t stateBit4;
  uint32_t stateBit5;
};
static_assert(sizeof(CanBusStatistics) == 68);
static_assert(offsetof(CanBusStatistics, busLoad) == 32);
static_assert(offsetof(CanBusStatistics, faultCode) == 40);
static_assert(offsetof(CanBusStatistics, stateBit5) == 64);

// LIN: 60 bytes, 15 unsigned 32-bit fields; the state fields come from the driver's LIN state word.
struct LinBusStatistics {
  uint32_t dataFrames;
  uint32_t dataFramesPerSecond;
  uint32_t errorFrames;
  uint32_t errorFramesPerSecond;
  uint32_t noResponseFrames;
  uint32_t noResponseFramesPerSecond;
  uint32_t faultCode;
  uint32_t stateBit1;
  uint32_t stateBits2to3;
  uint32_t stateBits4to7;
  uint32_t stateBits8to15;
  uint32_t stateBits16to23;
  uint32_t stateBits24to29;
  uint32_t stateBit31;
  uint32_t stateBits0to7;
};
static_assert(sizeof(LinBusStatistics) == 60);
static_assert(offsetof(LinBusStatistics, faultCode) == 24);
static_assert(offsetof(LinBusStatistics, stateBits0to7) == 56);

// FlexRay: 72 bytes, 18 unsigned 32-bit fields: counters, the fault code, a reserved word that is
// always 0, the bit fields of the communication state word, the six words of the driver's
// statistics state and its one further state word.
struct FlexRayBusStatistics {
  uint32_t dataFrames;
  uint32_t dataFramesPerSecond;
  uint32_t nullFrames;
  uint32_t nullFramesPerSecond;
  uint32_t faultCode;
  uint32_t reserved;
  uint32_t stateBits0to3;
  uint32_t stateBits4to7;
  uint32_t stateBits8to12;
  uint32_t stateBit13;
  uint32_t stateBit14;
  uint32_t statisticsWords[6];
  uint32_t lastStateWord;
};
static_assert(sizeof(FlexRayBusStatistics) == 72);
static_assert(offsetof(FlexRayBusStatistics, reserved) == 20);
static_assert(offsetof(FlexRayBusStatistics, statisticsWords) == 44);
static_assert(offsetof(FlexRayBusStatistics, lastStateWord) == 68);

}  // namespace nKV_DLL300
