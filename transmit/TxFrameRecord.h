// The frame record that the transmit frame writes to its output session.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "driver/RawFrame.h"

namespace nKV_DLL300 {

// The driver's raw frame layout (see driver::RawFrameHeader), limited to a CAN FD payload:
//
//   offset size field
//   0      8    timestamp: 0 (send now)
//   8      4    identifier: the frame's identifier, bit 29 set for an extended one
//   12     1    type: 1 remote, 0 data (FD or not is the database frame's choice)
//   13     1    flags: 0
//   14     1    info: 0
//   15     1    payload length
//   16     n    payload, padded with zeros to a multiple of 8 bytes, at least 8
inline constexpr uint32_t kTxMaxPayload = 64;

struct TxFrameRecord {
  driver::RawFrameHeader header{};
  uint8_t payload[kTxMaxPayload]{};
};
static_assert(sizeof(TxFrameRecord) == driver::kRawFrameHeaderSize + kTxMaxPayload);
static_assert(offsetof(TxFrameRecord, payload) == driver::kRawFrameHeaderSize);

// What the frame fields make of one write.
struct TxFrameFields {
  uint32_t identifier = 0;
  bool extended = false;
  bool remote = false;
  uint32_t payloadLength = 0;           // only its low byte counts
  const std::vector<uint8_t>* payload;  // bytes beyond its end are sent as 0
};

// Fills `record` and returns the number of bytes to write. The low byte of the payload length
// can reach 255, which the record cannot hold: the length is held at 64 (a longer frame has
// already been refused by the database).
uint32_t BuildTxFrameRecord(const TxFrameFields& fields, TxFrameRecord& record);

}  // namespace nKV_DLL300
