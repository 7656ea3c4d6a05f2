// Bit lengths and bus times of CAN, CAN FD, LIN and FlexRay frames; LIN identifiers and checksums.
#pragma once

#include <cstdint>

#include "tarvix/SimFrame.h"

namespace tarvix {

// Bits of a frame at the nominal rate and at the data rate (CAN FD with bit-rate switching),
// stuff bits included, from start of frame to the end of the interframe space.
struct BitLength {
  uint32_t nominalBits = 0;
  uint32_t dataBits = 0;
};

// A CAN frame (classic, remote, FD, FD with bit-rate switching) or a bus-error frame. Stuff bits
// are counted on the frame's real bit stream (classic: with its CRC-15), a byte at a time.
BitLength CanBitLength(const SimFrame& f);
// The same count taken one bit at a time: the reference that CanBitLength is tested against.
BitLength CanBitLengthBitByBit(const SimFrame& f);

// Time in ns that `bits` take at `bitRate` bit/s, rounded to the nearest ns.
int64_t BitsToNs(uint64_t bits, uint64_t bitRate);

// Bus time of a CAN frame; the data rate applies to the data phase of frames with bit-rate
// switching.
int64_t CanFrameNs(const SimFrame& f, uint64_t bitRate, uint64_t dataBitRate);

// Smallest CAN FD payload length (0-8, 12, 16, 20, 24, 32, 48, 64) that holds `length` bytes.
uint32_t CanFdLength(uint32_t length);

// LIN: protected identifier (identifier with its two parity bits) and checksums.
uint8_t LinProtectedId(uint8_t id);
uint8_t LinChecksum(uint8_t id, const uint8_t* data, uint32_t length, bool enhanced);
// Bits of a LIN frame: header (break, delimiter, sync, identifier) and response bytes.
uint32_t LinHeaderBits();
uint32_t LinResponseBits(uint32_t length);

// Bits of a FlexRay frame on one channel with `length` payload bytes.
uint32_t FlexRayFrameBits(uint32_t length);

}  // namespace tarvix
