// Encoding of the message header, byte by byte so the host byte order never matters.
#include "hostlink/MessageHeader.h"

namespace nKV_DLL300 {

namespace {

void PutLittleEndian32(MessageHeader& header, size_t offset, uint32_t value) {
  for (size_t i = 0; i < 4; ++i) header[offset + i] = static_cast<uint8_t>(value >> (8 * i));
}

}  // namespace

MessageHeader EncodeMessageHeader(const MessageHeaderFields& fields) {
  MessageHeader header{};
  PutLittleEndian32(header, 0, fields.sequenceNumber);
  header[kHeaderOffsetType] = fields.type;
  PutLittleEndian32(header, kHeaderOffsetLength, fields.payloadLength);
  PutLittleEndian32(header, kHeaderOffsetIdCount, fields.idCount);
  PutLittleEndian32(header, kHeaderOffsetLastStatus, static_cast<uint32_t>(fields.lastStatus));
  header[kHeaderOffsetConstant + 1] = 0x0F;
  for (size_t i = 0; i < 4; ++i) header[kHeaderOffsetVersion + i] = fields.versionBytes[i];
  return header;
}

bool IsBinaryMessageType(uint8_t type) {
  switch (type) {
    case kMessageCanRecords:
    case kMessageLinRecords:
    case kMessageFlexRayRecords:
    case kMessageStatistics:
    case kMessageHardwareTable:
      return true;
    default:
      return false;
  }
}

}  // namespace nKV_DLL300
