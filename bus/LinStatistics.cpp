// Counting LIN frames into the LIN bus statistics, and preparing them to be sent.
#include "bus/LinStatistics.h"

#include "bus/FramesPerSecond.h"

namespace nKV_DLL300 {

void countFrame(LinBusStatistics& s, uint8_t type, bool inWindow) {
  uint32_t* total = nullptr;
  uint32_t* perSecond = nullptr;
  switch (type) {
    case 0x40:
      total = &s.dataFrames, perSecond = &s.dataFramesPerSecond;
      break;
    case 0x41:
      total = &s.errorFrames, perSecond = &s.errorFramesPerSecond;
      break;
    case 0x42:
      total = &s.noResponseFrames, perSecond = &s.noResponseFramesPerSecond;
      break;
    default:
      return;
  }
  ++*total;
  if (inWindow) ++*perSecond;
}

void PrepareToSend(LinBusStatistics& s, uint64_t elapsedMs) {
  s.dataFramesPerSecond = FramesPerSecond(s.dataFramesPerSecond, elapsedMs);
  s.errorFramesPerSecond = FramesPerSecond(s.errorFramesPerSecond, elapsedMs);
  s.noResponseFramesPerSecond = FramesPerSecond(s.noResponseFramesPerSecond, elapsedMs);
}

void DecodeState(LinBusStatistics& s, uint64_t state, uint32_t faultCode) {
  const uint32_t w = static_cast<uint32_t>(state);
  s.faultCode = faultCode;
  s.stateBit1 = (w >> 1) & 1;
  s.stateBits2to3 = (w >> 2) & 3;
  s.stateBits4to7 = (w >> 4) & 0xF;
  s.stateBits8to15 = (w >> 8) & 0xFF;
  s.stateBits16to23 = (w >> 16) & 0xFF;
  s.stateBits24to29 = (w >> 24) & 0x3F;
  s.stateBit31 = w >> 31;
  s.stateBits0to7 = w & 0xFF;
}

void EndWindow(LinBusStatistics& s) {
  s.dataFramesPerSecond = s.errorFramesPerSecond = s.noResponseFramesPerSecond = 0;
}

}  // namespace nKV_DLL300
