// Walking binary log records, and telling the fixed and variable CAN record layouts apart.
#include "logging/BinaryRecordReader.h"

#include <algorithm>
#include <cstring>

namespace nKV_DLL300 {
namespace {

bool IsTypeOfBus(uint8_t type, RecordBus bus) {
  switch (bus) {
    case RecordBus::kCan:
      return type == 0x00 || type == 0x01 || type == 0x02 || type == 0x10 || type == 0x18 ||
             type == kFrameTypeJ1939;
    case RecordBus::kLin:
      return type == 0x40 || type == 0x41 || type == 0x42;
    case RecordBus::kFlexRay:
      return type == 0x20 || type == 0x21;
  }
  return false;
}

}  // namespace

bool BinaryRecordReader::next(RawFrameView& out) {
  if (size_ - offset_ < kRawFrameHeaderSize) return false;
  std::memcpy(&out.header, data_ + offset_, kRawFrameHeaderSize);
  const uint32_t recordSize = BinaryRecordSize(layout_, out.header);
  if (recordSize > size_ - offset_) return false;
  const uint32_t held = recordSize - kRawFrameHeaderSize;
  const uint32_t stated = layout_ == BinaryRecordLayout::kFlexRayVariable
                              ? out.header.length
                              : RawPayloadLength(out.header);
  out.payload = data_ + offset_ + kRawFrameHeaderSize;
  out.payloadLength = std::min(stated, held);
  offset_ += recordSize;
  return true;
}

bool RecordsAreConsistent(const uint8_t* records, size_t size, BinaryRecordLayout layout,
                          RecordBus bus) {
  BinaryRecordReader reader(records, size, layout);
  RawFrameView frame;
  uint64_t lastTimestamp = 0;
  while (reader.next(frame)) {
    if (!IsTypeOfBus(frame.header.type, bus)) return false;
    if (frame.payloadLength < RawPayloadLength(frame.header) && bus != RecordBus::kFlexRay)
      return false;
    if (frame.header.timestamp < lastTimestamp) return false;
    lastTimestamp = frame.header.timestamp;
  }
  return reader.remaining() == 0;
}

BinaryRecordLayout DetectCanRecordLayout(const uint8_t* records, size_t size) {
  return RecordsAreConsistent(records, size, BinaryRecordLayout::kFixed24, RecordBus::kCan)
             ? BinaryRecordLayout::kFixed24
             : BinaryRecordLayout::kCanVariable;
}

}  // namespace nKV_DLL300
