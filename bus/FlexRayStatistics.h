// Counting FlexRay frames into the FlexRay bus statistics, and preparing them to be sent.
#pragma once

#include <cstdint>

#include "bus/BusStatistics.h"

namespace nKV_DLL300 {

// The three driver states of a FlexRay report, read in this order until one read fails.
inline constexpr uint32_t kFlexRayStateId = 0x00130020;            // 4-byte state word
inline constexpr uint32_t kFlexRayStatisticsStateId = 0x08130021;  // six 32-bit words
inline constexpr uint32_t kFlexRayLastStateId = 0x00130004;        // one 32-bit word

// A frame that passed the identifier table's filters: data (0x20) or null (0x21); other types count
// nowhere.
void countFrame(FlexRayBusStatistics& statistics, uint8_t type, bool inWindow);

// The two window counts turned into frames per second over elapsedMs.
void PrepareToSend(FlexRayBusStatistics& statistics, uint64_t elapsedMs);

// The three state reads, each with its fault code.
void DecodeState(FlexRayBusStatistics& statistics, uint32_t state, uint32_t faultCode);
void StoreStatisticsWords(FlexRayBusStatistics& statistics, const uint32_t (&words)[6],
                          uint32_t faultCode);
void StoreLastStateWord(FlexRayBusStatistics& statistics, uint32_t word, uint32_t faultCode);

void EndWindow(FlexRayBusStatistics& statistics);

}  // namespace nKV_DLL300
