// One frame on a simulated bus, and its encoding in the driver's raw frame layout.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "driver/FrameTypes.h"

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

// Raw frame layout written by kxReadFrame (little-endian):
//   offset 0  u64 timestamp, 100 ns units since 1601-01-01 UTC, the end of the frame
//   offset 8  u32 identifier
//   offset 12 u8  type, 13 u8 flags, 14 u8 info, 15 u8 payload length (low 8 bits)
//   offset 16 payload, padded with zeros to a multiple of 8 bytes, at least 8
struct RawHeader {
  uint64_t timestamp;
  uint32_t identifier;
  uint8_t type;
  uint8_t flags;
  uint8_t info;
  uint8_t length;
};
static_assert(sizeof(RawHeader) == driver::kRawHeaderSize);
static_assert(offsetof(RawHeader, identifier) == 8);
static_assert(offsetof(RawHeader, type) == 12);
static_assert(offsetof(RawHeader, flags) == 13);
static_assert(offsetof(RawHeader, info) == 14);
static_assert(offsetof(RawHeader, length) == 15);

constexpr uint32_t RawPayloadArea(uint32_t length) {
  return length == 0 ? 8u : ((length + 7u) & ~7u);
}

constexpr uint32_t RawSize(const SimFrame& f) {
  return driver::kRawHeaderSize + RawPayloadArea(f.length);
}

// Writes `f` at `out` (RawSize(f) bytes of room); returns the bytes written.
uint32_t EncodeRaw(const SimFrame& f, uint8_t* out);

}  // namespace tarvix
