// One frame on a simulated bus, and its encoding in the driver's raw frame layout
// (driver/RawFrame.h).
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "driver/FrameTypes.h"
#include "driver/RawFrame.h"

namespace tarvix {

// A frame as the bus carries it. `identifier` holds bit 29 for extended CAN identifiers (FlexRay:
// the slot). `origin` is the index of the transmitting interface, or -1 for the bus's own traffic.
struct SimFrame {
  int64_t endNs = 0;  // monotonic time at which the frame ended on the bus
  uint32_t identifier = 0;
  uint8_t type = 0;
  uint8_t flags = 0;
  uint8_t info = 0;
  uint8_t length = 0;  // payload bytes, at most 64
  int32_t origin = -1;
  std::array<uint8_t, driver::kMaxCanFdPayload> payload{};
};

constexpr uint32_t RawSize(const SimFrame& f) {
  return driver::kRawFrameHeaderSize + driver::RawPayloadArea(f.length);
}

// Writes `f` at `out` as a raw frame, payload padded with zeros (RawSize(f) bytes of room);
// returns the bytes written.
uint32_t EncodeRaw(const SimFrame& f, uint8_t* out);

}  // namespace tarvix
