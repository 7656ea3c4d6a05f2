// Counting CAN frames into the CAN bus statistics, and preparing them to be sent.
#include "bus/CanStatistics.h"

#include "bus/FramesPerSecond.h"

namespace nKV_DLL300 {

namespace {
constexpr uint8_t kTypeRemote = 0x01;
constexpr uint8_t kTypeBusError = 0x02;

void Count(uint32_t& total, uint32_t& perSecond, bool inWindow) {
  ++total;
  if (inWindow) ++perSecond;
}
}  // namespace

void countFrame(CanBusStatistics& s, CanFrameTimes& times, const driver::RawFrameHeader& frame,
                bool inWindow) {
  switch (frame.type) {
    case kTypeRemote:
      Count(s.remoteFrames, s.remoteFramesPerSecond, inWindow);
      return;
    case kTypeBusError:
      Count(s.errorFrames, s.errorFramesPerSecond, inWindow);
      return;
    default:
      break;
  }
  const bool extended = (frame.identifier & kCanExtendedIdentifier) != 0;
  if (extended) {
    Count(s.extendedFrames, s.extendedFramesPerSecond, inWindow);
  } else {
    Count(s.standardFrames, s.standardFramesPerSecond, inWindow);
  }
  // A J1939 message may be reassembled from several bus frames (up to 2047 bytes), so its length
  // tells no frame duration: it counts as a frame of its identifier but adds no bus time.
  if (frame.type != driver::kFrameJ1939) times.addFrame(extended, frame.length);
}

void PrepareToSend(CanBusStatistics& s, const CanFrameTimes& times, uint64_t elapsedMs) {
  s.busLoad = times.busLoad(elapsedMs);
  if (s.busLoad > s.peakBusLoad) s.peakBusLoad = s.busLoad;
  s.standardFramesPerSecond = FramesPerSecond(s.standardFramesPerSecond, elapsedMs);
  s.extendedFramesPerSecond = FramesPerSecond(s.extendedFramesPerSecond, elapsedMs);
  s.errorFramesPerSecond = FramesPerSecond(s.errorFramesPerSecond, elapsedMs);
  s.remoteFramesPerSecond = FramesPerSecond(s.remoteFramesPerSecond, elapsedMs);
}

void DecodeState(CanBusStatistics& s, uint32_t state, uint32_t faultCode) {
  s.faultCode = faultCode;
  s.stateBits0to3 = state & 0xF;
  s.stateBits8to11 = (state >> 8) & 0xF;
  s.stateBits24to31 = state >> 24;
  s.stateBits16to23 = (state >> 16) & 0xFF;
  s.stateBit4 = (state >> 4) & 1;
  s.stateBit5 = (state >> 5) & 1;
}

void EndWindow(CanBusStatistics& s, CanFrameTimes& times) {
  times.clearBusTime();
  s.standardFramesPerSecond = s.extendedFramesPerSecond = 0;
  s.remoteFramesPerSecond = s.errorFramesPerSecond = 0;
  s.busLoad = 0;
}

}  // namespace nKV_DLL300
