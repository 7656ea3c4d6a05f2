// Reads the frame records of a binary log (or of a measurement-data channel) back, one by one.
#pragma once

#include <cstddef>
#include <cstdint>

#include "driver/BusKind.h"
#include "driver/RawFrame.h"
#include "logging/BinaryLogFormat.h"

namespace nKV_DLL300 {

// Walks records of one layout over `size` bytes that follow the file header. The bytes must stay
// alive while the reader is used. A record that would reach past the end stops the walk; its bytes
// remain in `remaining()` (a log whose last write was cut short ends that way).
class BinaryRecordReader {
 public:
  BinaryRecordReader(const uint8_t* records, size_t size, BinaryRecordLayout layout)
      : data_(records), size_(size), layout_(layout) {}

  // The next record as a frame view. Its payloadLength is the length the head states, bounded by
  // the payload bytes the record holds (a 24-byte record holds 8).
  bool next(driver::RawFrameView& out);

  size_t offset() const { return offset_; }
  size_t remaining() const { return size_ - offset_; }

 private:
  const uint8_t* data_;
  size_t size_;
  BinaryRecordLayout layout_;
  size_t offset_ = 0;
};

// True when `type` is a frame type of `bus` (CAN 0x00 0x01 0x02 0x10 0x18 0xC0, LIN 0x40 to 0x42,
// FlexRay 0x20 0x21).
bool IsFrameTypeOfBus(uint8_t type, driver::BusKind bus);

// Checks that every record of `size` bytes parses in `layout`, ends exactly at the end, has a type
// of `bus` and a payload the layout can hold, with time stamps that never go back. Used to tell
// apart the two CAN layouts of a log whose writer settings are unknown.
bool RecordsAreConsistent(const uint8_t* records, size_t size, BinaryRecordLayout layout,
                          driver::BusKind bus);

// The CAN layout that reads `size` bytes of records consistently: fixed 24-byte records when they
// do, else the variable layout. A cut last record (a log copied while it was written) does not
// count against a layout when its head, if there is one, looks like the others.
BinaryRecordLayout DetectCanRecordLayout(const uint8_t* records, size_t size);

}  // namespace nKV_DLL300
