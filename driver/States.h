// State identifiers of kxReadState, with the bit fields of the state words (docs/tarvix.md).
#pragma once

#include <cstdint>

namespace driver {

inline constexpr uint32_t kStateCan = 0x00130010;      // 4 bytes, CAN state word
inline constexpr uint32_t kStateLin = 0x00130030;      // 8 bytes, LIN state (low word used)
inline constexpr uint32_t kStateFlexRay = 0x00130020;  // 4 bytes, FlexRay protocol state word
inline constexpr uint32_t kStateFlexRayCounters = 0x08130021;  // 24 bytes, six counters
inline constexpr uint32_t kStateFlexRayChannels = 0x00130004;  // 4 bytes, channel status word

inline constexpr uint32_t kStateCanSize = 4;
inline constexpr uint32_t kStateLinSize = 8;
inline constexpr uint32_t kStateFlexRaySize = 4;
inline constexpr uint32_t kStateFlexRayCountersSize = 24;
inline constexpr uint32_t kStateFlexRayChannelsSize = 4;

// CAN state word: bits 0-3 communication state, 4 transceiver fault, 5 sleep, 8-11 last error,
// 16-23 transmit error counter, 24-31 receive error counter.
inline constexpr uint32_t kCanCommErrorActive = 0;
inline constexpr uint32_t kCanCommErrorPassive = 1;
inline constexpr uint32_t kCanCommBusOff = 2;
inline constexpr uint32_t kCanCommStopped = 3;
inline constexpr uint32_t kCanLastErrorNone = 0;
inline constexpr uint32_t kCanLastErrorStuff = 1;
inline constexpr uint32_t kCanLastErrorForm = 2;
inline constexpr uint32_t kCanLastErrorAck = 3;

// LIN state word (low 32 bits): bit 0 communicating, 1 sleep, 2-3 communication state, 4-7 last
// error, 8-15 identifier of the last error, 16-23 frames since start (mod 256), 24-29 schedule
// slot, 31 the interface is stopped.
inline constexpr uint32_t kLinCommIdle = 0;
inline constexpr uint32_t kLinCommActive = 1;
inline constexpr uint32_t kLinCommInactive = 2;
inline constexpr uint32_t kLinLastErrorNone = 0;
inline constexpr uint32_t kLinLastErrorBitRate = 1;
inline constexpr uint32_t kLinLastErrorNoResponse = 2;

// FlexRay state word: bits 0-3 protocol state, 4-7 wakeup status, 8-12 sync frames seen in the last
// cycle, 13 clock correction failed, 14 controller frozen.
inline constexpr uint32_t kFlexRayStateConfig = 0;
inline constexpr uint32_t kFlexRayStateReady = 1;
inline constexpr uint32_t kFlexRayStateNormalActive = 2;
inline constexpr uint32_t kFlexRayStateNormalPassive = 3;
inline constexpr uint32_t kFlexRayStateHalt = 4;
inline constexpr uint32_t kFlexRayStateStartup = 6;

// FlexRay counters (six 32-bit words, in order).
inline constexpr uint32_t kFlexRayCounterCycles = 0;
inline constexpr uint32_t kFlexRayCounterDataFrames = 1;
inline constexpr uint32_t kFlexRayCounterNullFrames = 2;
inline constexpr uint32_t kFlexRayCounterSyntaxErrors = 3;
inline constexpr uint32_t kFlexRayCounterContentErrors = 4;
inline constexpr uint32_t kFlexRayCounterCurrentCycle = 5;

// FlexRay channel status word: bit 0 channel A active, bit 1 channel B active, bits 8-15 frames
// with errors on A, bits 16-23 on B.
inline constexpr uint32_t kFlexRayChannelA = 0x1;
inline constexpr uint32_t kFlexRayChannelB = 0x2;

}  // namespace driver
