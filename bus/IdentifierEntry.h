// Identifier table entries of the three buses; each entry is also the record layout on the wire.
#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>

namespace nKV_DLL300 {

// Records go to the host byte for byte as they are held, so the host order must be little-endian.
static_assert(std::endian::native == std::endian::little);

// CAN entry: 32 bytes held, the first 28 are the record sent in a type 0 message, followed on the
// wire by payloadLength payload bytes.
//
//   offset size field
//   0      4    identifier (bit 29 marks an extended identifier)
//   4      4    count: frames of this identifier and type since the table was last emptied
//   8      8    lastTimestamp
//   16     8    previousTimestamp (equal to lastTimestamp after the first frame)
//   24     1    type
//   25     1    echo: 0x80 if the last frame was an echo, else 0
//   26     2    payloadLength (up to 2047; 0 while no payload copy is held)
//   28     4    payloadRef: 1 + the payload slot holding the copy, 0 for none (held, never sent)
struct CanIdentifierEntry {
  uint32_t identifier;
  uint32_t count;
  uint64_t lastTimestamp;
  uint64_t previousTimestamp;
  uint8_t type;
  uint8_t echo;
  uint16_t payloadLength;
  uint32_t payloadRef;
};
static_assert(sizeof(CanIdentifierEntry) == 32);
static_assert(offsetof(CanIdentifierEntry, count) == 4);
static_assert(offsetof(CanIdentifierEntry, lastTimestamp) == 8);
static_assert(offsetof(CanIdentifierEntry, previousTimestamp) == 16);
static_assert(offsetof(CanIdentifierEntry, type) == 24);
static_assert(offsetof(CanIdentifierEntry, echo) == 25);
static_assert(offsetof(CanIdentifierEntry, payloadLength) == 26);
static_assert(offsetof(CanIdentifierEntry, payloadRef) == 28);
inline constexpr uint32_t kCanRecordSize = 28;

// LIN entry: 40 bytes, all of them sent in a type 1 message; the payload lives inside the entry.
//
//   offset size field
//   0      4    identifier
//   4      4    count
//   8      8    lastTimestamp
//   16     8    previousTimestamp
//   24     1    type of the last frame
//   25     1    echo (0x80 or 0)
//   26     1    flag: bit 0 of the last frame's flags
//   27     4    checksum: the last frame's info byte widened to 32 bits (not aligned)
//   31     1    payloadLength (0 to 8)
//   32     8    payload; bytes beyond payloadLength are 0
struct LinIdentifierEntry {
  uint32_t identifier;
  uint32_t count;
  uint64_t lastTimestamp;
  uint64_t previousTimestamp;
  uint8_t type;
  uint8_t echo;
  uint8_t flag;
  uint8_t checksum[4];  // little-endian 32-bit value; byte 0 is the info byte, bytes 1-3 stay 0
  uint8_t payloadLength;
  uint8_t payload[8];
};
static_assert(sizeof(LinIdentifierEntry) == 40);
static_assert(offsetof(LinIdentifierEntry, type) == 24);
static_assert(offsetof(LinIdentifierEntry, flag) == 26);
static_assert(offsetof(LinIdentifierEntry, checksum) == 27);
static_assert(offsetof(LinIdentifierEntry, payloadLength) == 31);
static_assert(offsetof(LinIdentifierEntry, payload) == 32);
inline constexpr uint32_t kLinRecordSize = 40;

// FlexRay entry: 36 bytes held, the first 32 are the record sent in a type 2 message, followed on
// the wire by payloadLength payload bytes. Packed to 4 so that the held size stays 36.
//
//   offset size field
//   0      4    slot identifier
//   4      4    count
//   8      8    lastTimestamp
//   16     8    previousTimestamp
//   24     1    type of the first frame of the entry
//   25     1    echo (0x80 or 0)
//   26     1    startup (flags bit 0)
//   27     1    sync (flags bit 1)
//   28     1    preamble (flags bit 2)
//   29     1    channel: 0 channel A, 1 channel B
//   30     1    cycle number (info byte)
//   31     1    payloadLength (0 to 255; 0 while no payload copy is held)
//   32     4    payloadRef: 1 + the payload slot holding the copy, 0 for none (held, never sent)
#pragma pack(push, 4)
struct FlexRayIdentifierEntry {
  uint32_t identifier;
  uint32_t count;
  uint64_t lastTimestamp;
  uint64_t previousTimestamp;
  uint8_t type;
  uint8_t echo;
  uint8_t startup;
  uint8_t sync;
  uint8_t preamble;
  uint8_t channel;
  uint8_t cycle;
  uint8_t payloadLength;
  uint32_t payloadRef;
};
#pragma pack(pop)
static_assert(sizeof(FlexRayIdentifierEntry) == 36);
static_assert(offsetof(FlexRayIdentifierEntry, type) == 24);
static_assert(offsetof(FlexRayIdentifierEntry, startup) == 26);
static_assert(offsetof(FlexRayIdentifierEntry, channel) == 29);
static_assert(offsetof(FlexRayIdentifierEntry, cycle) == 30);
static_assert(offsetof(FlexRayIdentifierEntry, payloadLength) == 31);
static_assert(offsetof(FlexRayIdentifierEntry, payloadRef) == 32);
inline constexpr uint32_t kFlexRayRecordSize = 32;

}  // namespace nKV_DLL300
