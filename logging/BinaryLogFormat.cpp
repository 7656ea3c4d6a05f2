// The binary log header check and the copy of one frame's record.
#include "logging/BinaryLogFormat.h"

#include <algorithm>
#include <cstring>

namespace nKV_DLL300 {

bool HasBinaryLogMagic(const uint8_t* data, size_t size) {
  return size >= 2 && data[0] == kBinaryLogFileHeaderBytes[0] &&
         data[1] == kBinaryLogFileHeaderBytes[1];
}

size_t CopyBinaryRecord(uint8_t* out, size_t cap, const driver::RawFrameView& frame,
                        BinaryRecordLayout layout) {
  const uint32_t size = BinaryRecordSize(layout, frame.header);
  if (cap < size) return 0;
  // A fixed record of a frame whose payload area is shorter than 8 bytes cannot occur in a read
  // batch (every frame has at least 8); bound the copy anyway and zero what the frame lacks.
  const uint32_t available = driver::RawPayloadArea(frame.payloadLength);
  const uint32_t payloadBytes = size - driver::kRawFrameHeaderSize;
  std::memcpy(out, &frame.header, driver::kRawFrameHeaderSize);
  std::memcpy(out + driver::kRawFrameHeaderSize, frame.payload, std::min(payloadBytes, available));
  if (payloadBytes > available) {
    std::memset(out + driver::kRawFrameHeaderSize + available, 0, payloadBytes - available);
  }
  return size;
}

}  // namespace nKV_DLL300
