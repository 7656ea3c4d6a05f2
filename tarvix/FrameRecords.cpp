// Parsing the frame records written to output sessions.
#include "tarvix/FrameRecords.h"

#include <cstring>

#include "driver/FrameTypes.h"
#include "driver/Properties.h"
#include "driver/RawFrame.h"
#include "driver/Status.h"

namespace tarvix {
namespace {

const FrameDefinition* FrameOf(const SessionSetup& setup, uint32_t identifier) {
  if (setup.frames.size() == 1) return &setup.frames.front();
  for (const FrameDefinition& d : setup.frames) {
    if (d.identifier == (identifier & driver::kExtendedIdMask)) return &d;
  }
  return nullptr;
}

uint8_t TypeOf(const driver::RawFrameHeader& h, const FrameDefinition& def) {
  const bool remote = h.type == driver::kFrameCanRemote ||
                      def.timingType == driver::kTimingCyclicRemote ||
                      def.timingType == driver::kTimingEventRemote;
  if (remote) return driver::kFrameCanRemote;
  if (def.canIoMode == driver::kFrameCanIoModeFdBrs) return driver::kFrameCanFdBrsData;
  if (def.canIoMode == driver::kFrameCanIoModeFd) return driver::kFrameCanFdData;
  return driver::kFrameCanData;
}

}  // namespace

int32_t ParseFrameRecords(const SessionSetup& setup, const uint8_t* data, uint32_t size,
                          std::vector<FrameRecord>& out) {
  uint32_t offset = 0;
  while (offset < size) {
    driver::RawFrameHeader h;
    if (size - offset < sizeof h) return driver::kInvalidFrame;
    std::memcpy(&h, data + offset, sizeof h);
    const uint32_t frameSize = driver::kRawFrameHeaderSize + driver::RawPayloadArea(h.length);
    if (h.type == driver::kFrameJ1939 || frameSize > size - offset) return driver::kInvalidFrame;
    const FrameDefinition* def = FrameOf(setup, h.identifier);
    if (def == nullptr) return driver::kFrameNotFound;
    const bool fd = def->canIoMode != driver::kFrameCanIoModeClassic;
    if (h.length > (fd ? driver::kMaxCanFdPayload : 8u)) return driver::kInvalidFrame;
    SimFrame f;
    f.identifier = def->identifier | (def->extended ? driver::kExtendedIdFlag : 0);
    f.type = TypeOf(h, *def);
    f.length = h.length;
    if (f.type != driver::kFrameCanRemote) {
      std::memcpy(f.payload.data(), data + offset + driver::kRawFrameHeaderSize, h.length);
    }
    f.origin = setup.interfaceIndex;
    out.emplace_back(f, def);
    offset += frameSize;
  }
  return out.empty() ? driver::kInvalidFrame : driver::kSuccess;
}

}  // namespace tarvix
