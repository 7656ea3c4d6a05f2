// Counting LIN frames into the LIN bus statistics, and preparing them to be sent.
#pragma once

#include <cstdint>

#include "bus/BusStatistics.h"

namespace nKV_DLL300 {

inline constexpr uint32_t kLinStateId = 0x00130030;  // 8-byte state, the low 32 bits are used

// A frame that passed the identifier table's filters: data (0x40), bus error (0x41), no response
// (0x42); other types count nowhere.
void countFrame(LinBusStatistics& statistics, uint8_t type, bool inWindow);

// The three window counts turned into frames per second over elapsedMs.
void PrepareToSend(LinBusStatistics& statistics, uint64_t elapsedMs);

// The driver's LIN state (read with kLinStateId) and its fault code; the high 32 bits are unused.
void DecodeState(LinBusStatistics& statistics, uint64_t state, uint32_t faultCode);

void EndWindow(LinBusStatistics& statistics);

}  // namespace nKV_DLL300
