// The driver's raw frame: the layout kxReadFrame hands over and kxWriteFrame takes, the one
// description the module, the simulated driver and the host tools share, and the walk over a
// batch of frames.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "driver/FrameTypes.h"

namespace driver {

// One frame as kxReadFrame delivers it; frames follow each other without gaps. Type codes and
// flag bits are named in driver/FrameTypes.h.
//
//   offset size field
//   0      8    timestamp: 100 ns units since 1601-01-01 UTC, the moment the frame ended
//   8      4    identifier (CAN: bit 29 marks an extended identifier; FlexRay: the slot)
//   12     1    type (CAN 0x00 data, 0x01 remote, 0x02 bus error, 0x10/0x18 FD data, 0xC0 J1939;
//               LIN 0x40 data, 0x41 bus error, 0x42 no response; FlexRay 0x20 data, 0x21 null)
//   13     1    flags (0x80 echo; FlexRay 0x01 startup, 0x02 sync, 0x04 preamble, 0x10 channel A,
//               0x20 channel B; LIN bit 0 is the frame's flag)
//   14     1    info (FlexRay cycle; LIN checksum; J1939 bits 0-2 = payload length bits 8-10)
//   15     1    payload length, low 8 bits
//   16     n    payload, padded to a multiple of 8 bytes, at least 8
// All multi-byte fields are little-endian.
struct RawFrameHeader {
  uint64_t timestamp;
  uint32_t identifier;
  uint8_t type;
  uint8_t flags;
  uint8_t info;
  uint8_t length;
};
static_assert(sizeof(RawFrameHeader) == 16);
static_assert(offsetof(RawFrameHeader, identifier) == 8);
static_assert(offsetof(RawFrameHeader, type) == 12);
static_assert(offsetof(RawFrameHeader, flags) == 13);
static_assert(offsetof(RawFrameHeader, info) == 14);
static_assert(offsetof(RawFrameHeader, length) == 15);

inline constexpr uint32_t kRawFrameHeaderSize = 16;

// Payload length: byte 15, widened by info bits 0-2 for J1939 frames (up to 2047 bytes).
inline constexpr uint32_t RawPayloadLength(const RawFrameHeader& h) {
  return h.type == kFrameJ1939 ? h.length + 256u * (h.info & 7u) : h.length;
}

// Size of the padded payload area: 8 when empty, else the length rounded up to a multiple of 8.
// Rounded without an 11-bit mask: lengths 2041 to 2047 take 2048 bytes, never 0, so a payload
// never reaches past its own frame.
inline constexpr uint32_t RawPayloadArea(uint32_t length) {
  return length == 0 ? 8u : ((length + 7u) & ~7u);
}
static_assert(RawPayloadArea(0) == 8 && RawPayloadArea(9) == 16 && RawPayloadArea(2047) == 2048);

inline constexpr uint32_t RawFrameSize(const RawFrameHeader& h) {
  return kRawFrameHeaderSize + RawPayloadArea(RawPayloadLength(h));
}

// A view of one frame inside a batch. The header is copied out (read buffers need not be aligned).
struct RawFrameView {
  RawFrameHeader header;
  const uint8_t* payload;  // RawPayloadLength(header) bytes, all inside the batch
  uint32_t payloadLength;
};

// Walks a batch of `size` bytes frame by frame. A frame whose header or payload would reach past
// the end of the batch ends the walk: nothing is ever read outside the bytes the driver delivered.
class RawFrameWalker {
 public:
  RawFrameWalker(const void* batch, uint32_t size)
      : data_(static_cast<const uint8_t*>(batch)), size_(size) {}

  bool next(RawFrameView& out) {
    if (size_ - offset_ < kRawFrameHeaderSize || offset_ > size_) return false;
    std::memcpy(&out.header, data_ + offset_, sizeof(RawFrameHeader));
    out.payloadLength = RawPayloadLength(out.header);
    const uint32_t frameSize = kRawFrameHeaderSize + RawPayloadArea(out.payloadLength);
    if (frameSize > size_ - offset_) return false;
    out.payload = data_ + offset_ + kRawFrameHeaderSize;
    offset_ += frameSize;
    return true;
  }

  uint32_t offset() const { return offset_; }

 private:
  const uint8_t* data_;
  uint32_t size_;
  uint32_t offset_ = 0;
};

}  // namespace driver
