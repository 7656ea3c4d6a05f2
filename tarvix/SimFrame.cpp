// Encoding of simulated frames in the driver's raw frame layout.
#include "tarvix/SimFrame.h"

#include <cstring>

#include "tarvix/SimClock.h"

namespace tarvix {

uint32_t EncodeRaw(const SimFrame& f, uint8_t* out) {
  driver::RawFrameHeader h{TimestampAt(f.endNs), f.identifier, f.type, f.flags, f.info, f.length};
  std::memcpy(out, &h, sizeof h);
  const uint32_t area = driver::RawPayloadArea(f.length);
  std::memcpy(out + sizeof h, f.payload.data(), f.length);
  std::memset(out + sizeof h + f.length, 0, area - f.length);
  return static_cast<uint32_t>(sizeof h) + area;
}

}  // namespace tarvix
