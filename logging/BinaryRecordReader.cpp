// Walking binary log records, and telling the fixed and variable CAN record layouts apart.
#include "logging/BinaryRecordReader.h"

#include <algorithm>
#include <cstring>

namespace nKV_DLL300 {

bool IsFrameTypeOfBus(uint8_t type, driver::BusKind bus) {
  switch (bus) {
    case driver::BusKind::kCan:
      return type == 0x00 || type == 0x01 || type == 0x02 || type == 0x10 || type == 0x18 ||
             type == driver::kFrameJ1939;
    case driver::BusKind::kLin:
      return type == 0x40 || type == 0x41 || type == 0x42;
    case driver::BusKind::kFlexRay:
      return type == 0x20 || type == 0x21;
    case driver::BusKind::kNone:
      break;
  }
  return false;
}

namespace {

// The head of a record cut off at the end (a copy taken while the log was written, a crash) must
// look like the heads before it: a type of the bus and no time stamp going back.
bool CutHeadFits(const uint8_t* head, driver::BusKind bus, uint64_t lastTimestamp) {
  driver::RawFrameHeader h;
  std::memcpy(&h, head, driver::kRawFrameHeaderSize);
  return IsFrameTypeOfBus(h.type, bus) && h.timestamp >= lastTimestamp;
}

// RecordsAreConsistent over the whole records; `cutTailAllowed`: bytes after them may be the
// beginning of one more record.
bool WholeRecordsAreConsistent(const uint8_t* records, size_t size, BinaryRecordLayout layout,
                               driver::BusKind bus, bool cutTailAllowed) {
  BinaryRecordReader reader(records, size, layout);
  driver::RawFrameView frame;
  uint64_t lastTimestamp = 0;
  while (reader.next(frame)) {
    if (!IsFrameTypeOfBus(frame.header.type, bus)) return false;
    if (frame.payloadLength < driver::RawPayloadLength(frame.header) &&
        bus != driver::BusKind::kFlexRay)
      return false;
    if (frame.header.timestamp < lastTimestamp) return false;
    lastTimestamp = frame.header.timestamp;
  }
  if (reader.remaining() == 0) return true;
  if (!cutTailAllowed) return false;
  return reader.remaining() < driver::kRawFrameHeaderSize ||
         CutHeadFits(records + reader.offset(), bus, lastTimestamp);
}

}  // namespace

bool BinaryRecordReader::next(driver::RawFrameView& out) {
  if (size_ - offset_ < driver::kRawFrameHeaderSize) return false;
  std::memcpy(&out.header, data_ + offset_, driver::kRawFrameHeaderSize);
  const uint32_t recordSize = BinaryRecordSize(layout_, out.header);
  if (recordSize > size_ - offset_) return false;
  const uint32_t held = recordSize - driver::kRawFrameHeaderSize;
  const uint32_t stated = layout_ == BinaryRecordLayout::kFlexRayVariable
                              ? out.header.length
                              : driver::RawPayloadLength(out.header);
  out.payload = data_ + offset_ + driver::kRawFrameHeaderSize;
  out.payloadLength = std::min(stated, held);
  offset_ += recordSize;
  return true;
}

bool RecordsAreConsistent(const uint8_t* records, size_t size, BinaryRecordLayout layout,
                          driver::BusKind bus) {
  return WholeRecordsAreConsistent(records, size, layout, bus, false);
}

BinaryRecordLayout DetectCanRecordLayout(const uint8_t* records, size_t size) {
  return WholeRecordsAreConsistent(records, size, BinaryRecordLayout::kFixed24,
                                   driver::BusKind::kCan, true)
             ? BinaryRecordLayout::kFixed24
             : BinaryRecordLayout::kCanVariable;
}

}  // namespace nKV_DLL300
