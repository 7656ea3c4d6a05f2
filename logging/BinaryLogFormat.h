// The binary frame log (".zfl"): its 12-byte file header and the record written for one frame.
//
// A binary log is the file header followed by frame records, nothing else: no index, no trailer, no
// record count, and nothing names the bus. A record is the frame exactly as the driver delivered it
// (driver::RawFrameHeader of driver/RawFrame.h, then payload bytes), cut or padded to the record
// size of its bus:
//
//   LIN                                          24 bytes, always
//   CAN, canIoMode 0 and applicationProtocol 0   24 bytes, always (classic frames, 8 payload bytes)
//   CAN otherwise                                16 + L rounded up to a multiple of 8; 16 when L is
//   0
//                                                (L includes the J1939 length bits of the info
//                                                byte)
//   FlexRay                                      16 + the length byte rounded up to a multiple of
//   8;
//                                                16 when it is 0
//
// Every record size is at most the size the frame occupies in the driver's read buffer, so a record
// is always taken from inside its frame. All multi-byte fields are little-endian.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "driver/RawFrame.h"

namespace nKV_DLL300 {

// File header, written once when the log is created.
//   offset 0: "QV"; 2: 0x00; 3: 0x03; 4: 0x01; 5: 0x01; 6: 0x02; 7: 0x00; 8: 0x01; 9-11: 0x00.
// Only the two magic characters are ever read back.
struct BinaryLogFileHeader {
  char magic[2];
  uint8_t fields[10];
};
static_assert(sizeof(BinaryLogFileHeader) == 12);
static_assert(offsetof(BinaryLogFileHeader, fields) == 2);

inline constexpr size_t kBinaryLogFileHeaderSize = sizeof(BinaryLogFileHeader);
inline constexpr std::array<uint8_t, kBinaryLogFileHeaderSize> kBinaryLogFileHeaderBytes = {
    'Q', 'V', 0x00, 0x03, 0x01, 0x01, 0x02, 0x00, 0x01, 0x00, 0x00, 0x00};

// True when `size` bytes at `data` begin with the file header's magic characters.
bool HasBinaryLogMagic(const uint8_t* data, size_t size);

// How the records of one log are sized (table above).
enum class BinaryRecordLayout : uint8_t {
  kFixed24,          // LIN, classic CAN
  kCanVariable,      // CAN FD and J1939 sessions
  kFlexRayVariable,  // FlexRay
};

inline constexpr uint32_t kFixedRecordSize = 24;

// The layout of a CAN log follows the two session settings as they are when the frame is written.
constexpr BinaryRecordLayout CanBinaryRecordLayout(uint32_t canIoMode,
                                                   uint32_t applicationProtocol) {
  return canIoMode == 0 && applicationProtocol == 0 ? BinaryRecordLayout::kFixed24
                                                    : BinaryRecordLayout::kCanVariable;
}

// Bytes of the record of a frame with this head.
constexpr uint32_t BinaryRecordSize(BinaryRecordLayout layout, const driver::RawFrameHeader& h) {
  const auto rounded = [](uint32_t length) {
    return driver::kRawFrameHeaderSize + ((length + 7u) & ~7u);
  };
  switch (layout) {
    case BinaryRecordLayout::kFixed24:
      return kFixedRecordSize;
    case BinaryRecordLayout::kCanVariable:
      return rounded(driver::RawPayloadLength(h));
    case BinaryRecordLayout::kFlexRayVariable:
      return rounded(h.length);
  }
  return kFixedRecordSize;
}

// Copies the record of `frame` (a view into a read batch, as driver::RawFrameWalker yields it) into
// `out` and returns its size; returns 0 and writes nothing when `cap` is too small. The record
// never reaches past the frame's padded payload area, which the walker has checked lies in the
// batch.
size_t CopyBinaryRecord(uint8_t* out, size_t cap, const driver::RawFrameView& frame,
                        BinaryRecordLayout layout);

}  // namespace nKV_DLL300
