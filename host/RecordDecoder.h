// Decoding the identifier records (types 0, 1, 2) and bus statistics (type 6) a session sends.
#pragma once

#include <cstdint>
#include <optional>
#include <vector>

namespace kvhost {

// One identifier of a CAN (type 0) or FlexRay (type 2) record message, or a LIN record (type 1).
// Wire records (little-endian): CAN 28 bytes then payloadLength payload bytes; FlexRay 32 bytes
// then payloadLength payload bytes; LIN 40 bytes with the payload inside (see the fields below).
struct IdentifierRecord {
  uint32_t identifier = 0;  // CAN: bit 29 marks an extended identifier; FlexRay: the slot
  uint32_t count = 0;
  uint64_t lastTimestamp = 0;  // 100 ns units since 1601-01-01 UTC
  uint64_t previousTimestamp = 0;
  uint8_t type = 0;
  uint8_t echo = 0;  // 0x80: the last frame was sent by this interface
  uint32_t payloadLength = 0;
  std::vector<uint8_t> payload;  // payloadLength bytes
  // LIN only.
  uint8_t flag = 0;
  uint32_t checksum = 0;
  // FlexRay only.
  uint8_t startup = 0, sync = 0, preamble = 0, channel = 0, cycle = 0;
};

// The records of a message payload; nullopt when the bytes do not hold exactly `recordCount`
// whole records (header bytes 12 to 15 give the count).
std::optional<std::vector<IdentifierRecord>> DecodeCanRecords(const std::vector<uint8_t>& payload,
                                                              uint32_t recordCount);
std::optional<std::vector<IdentifierRecord>> DecodeLinRecords(const std::vector<uint8_t>& payload,
                                                              uint32_t recordCount);
std::optional<std::vector<IdentifierRecord>> DecodeFlexRayRecords(
    const std::vector<uint8_t>& payload, uint32_t recordCount);

// CAN statistics: 68 bytes, 17 unsigned 32-bit fields in this order.
struct CanStatisticsView {
  uint32_t standardFrames, standardFramesPerSecond, extendedFrames, extendedFramesPerSecond;
  uint32_t remoteFrames, remoteFramesPerSecond, errorFrames, errorFramesPerSecond;
  uint32_t busLoad, peakBusLoad;  // 0.01 % units
  uint32_t faultCode, stateBits0to3, stateBits8to11, stateBits24to31, stateBits16to23;
  uint32_t stateBit4, stateBit5;
};
// LIN statistics: 60 bytes, 15 unsigned 32-bit fields in this order.
struct LinStatisticsView {
  uint32_t dataFrames, dataFramesPerSecond, errorFrames, errorFramesPerSecond;
  uint32_t noResponseFrames, noResponseFramesPerSecond, faultCode, stateBit1, stateBits2to3;
  uint32_t stateBits4to7, stateBits8to15, stateBits16to23, stateBits24to29, stateBit31;
  uint32_t stateBits0to7;
};
// FlexRay statistics: 72 bytes, 18 unsigned 32-bit fields in this order.
struct FlexRayStatisticsView {
  uint32_t dataFrames, dataFramesPerSecond, nullFrames, nullFramesPerSecond, faultCode, reserved;
  uint32_t stateBits0to3, stateBits4to7, stateBits8to12, stateBit13, stateBit14;
  uint32_t statisticsWords[6];
  uint32_t lastStateWord;
};

// nullopt when the payload is not exactly the block's size.
std::optional<CanStatisticsView> DecodeCanStatistics(const std::vector<uint8_t>& payload);
std::optional<LinStatisticsView> DecodeLinStatistics(const std::vector<uint8_t>& payload);
std::optional<FlexRayStatisticsView> DecodeFlexRayStatistics(const std::vector<uint8_t>& payload);

}  // namespace kvhost
