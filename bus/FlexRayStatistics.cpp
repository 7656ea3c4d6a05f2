// Counting FlexRay frames into the FlexRay bus statistics, and preparing them to be sent.
#include "bus/FlexRayStatistics.h"

#include <algorithm>
#include <iterator>

#include "bus/FramesPerSecond.h"

namespace nKV_DLL300 {

void countFrame(FlexRayBusStatistics& s, uint8_t type, bool inWindow) {
  if (type == 0x20) {
    ++s.dataFrames;
    if (inWindow) ++s.dataFramesPerSecond;
  } else if (type == 0x21) {
    ++s.nullFrames;
    if (inWindow) ++s.nullFramesPerSecond;
  }
}

void PrepareToSend(FlexRayBusStatistics& s, uint64_t elapsedMs) {
  s.dataFramesPerSecond = FramesPerSecond(s.dataFramesPerSecond, elapsedMs);
  s.nullFramesPerSecond = FramesPerSecond(s.nullFramesPerSecond, elapsedMs);
}

void DecodeState(FlexRayBusStatistics& s, uint32_t state, uint32_t faultCode) {
  s.faultCode = faultCode;
  s.stateBits0to3 = state & 0xF;
  s.stateBits4to7 = (state >> 4) & 0xF;
  s.stateBits8to12 = (state >> 8) & 0x1F;
  s.stateBit13 = (state >> 13) & 1;
  s.stateBit14 = (state >> 14) & 1;
}

void StoreStatisticsWords(FlexRayBusStatistics& s, const uint32_t (&words)[6], uint32_t faultCode) {
  s.faultCode = faultCode;
  std::copy(std::begin(words), std::end(words), s.statisticsWords);
}

void StoreLastStateWord(FlexRayBusStatistics& s, uint32_t word, uint32_t faultCode) {
  s.faultCode = faultCode;
  s.lastStateWord = word;
}

void EndWindow(FlexRayBusStatistics& s) { s.dataFramesPerSecond = s.nullFramesPerSecond = 0; }

}  // namespace nKV_DLL300
