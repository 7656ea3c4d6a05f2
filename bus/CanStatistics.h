// Counting CAN frames into the CAN bus statistics, and preparing them to be sent.
#pragma once

#include <cstdint>

#include "bus/BusStatistics.h"
#include "bus/CanFrameTimes.h"
#include "driver/RawFrame.h"

namespace nKV_DLL300 {

inline constexpr uint32_t kCanExtendedIdentifier = 0x20000000;
inline constexpr uint32_t kCanStateId = 0x00130010;  // 4-byte state word

// A frame that passed the identifier table's filters: remote (0x01) and bus-error (0x02) frames
// count as such, every other type is a standard or extended data frame by its identifier. Data
// frames add their durations to the bus time, except J1939 messages (0xC0), whose length may span
// several frames. inWindow: the statistics window is still open, so the frame also counts into the
// PerSecond field.
void countFrame(CanBusStatistics& statistics, CanFrameTimes& times,
                const driver::RawFrameHeader& frame, bool inWindow);

// Before a send, over the elapsed milliseconds since the last one: busLoad (and peakBusLoad when it
// is exceeded) from the bus time, and the four window counts turned into frames per second.
void PrepareToSend(CanBusStatistics& statistics, const CanFrameTimes& times, uint64_t elapsedMs);

// The driver's CAN state word (read with kCanStateId) and its fault code.
void DecodeState(CanBusStatistics& statistics, uint32_t state, uint32_t faultCode);

// When the window has passed: bus time, busLoad and the four PerSecond fields start from 0.
void EndWindow(CanBusStatistics& statistics, CanFrameTimes& times);

}  // namespace nKV_DLL300
