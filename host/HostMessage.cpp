// Little-endian decoding of headers and hardware records, independent of the service's code.
#include "host/HostMessage.h"

namespace kvhost {

namespace {

uint32_t U32(const uint8_t* p) {
  return uint32_t(p[0]) | uint32_t(p[1]) << 8 | uint32_t(p[2]) << 16 | uint32_t(p[3]) << 24;
}

}  // namespace

std::optional<MessageHeaderView> DecodeHeader(const uint8_t* bytes, size_t size) {
  if (size < kHeaderSize) return std::nullopt;
  MessageHeaderView header;
  header.sequence = U32(bytes);
  header.type = bytes[4];
  for (size_t i = 0; i < 3; ++i) header.padding[i] = bytes[5 + i];
  header.payloadLength = U32(bytes + 8);
  header.idCount = U32(bytes + 12);
  header.lastStatus = static_cast<int32_t>(U32(bytes + 16));
  for (size_t i = 0; i < 4; ++i) {
    header.constant[i] = bytes[20 + i];
    header.version[i] = bytes[24 + i];
  }
  return header;
}

std::optional<std::vector<HardwareEntry>> DecodeHardwareTable(const std::vector<uint8_t>& payload) {
  if (payload.size() % kHardwareRecordSize != 0) return std::nullopt;
  std::vector<HardwareEntry> entries;
  for (size_t at = 0; at < payload.size(); at += kHardwareRecordSize) {
    const uint8_t* record = payload.data() + at;
    HardwareEntry entry;
    size_t nameLength = 0;
    while (nameLength < 16 && record[nameLength] != 0) ++nameLength;
    entry.name.assign(reinterpret_cast<const char*>(record), nameLength);
    entry.port = U32(record + 16);
    entry.protocol = U32(record + 20);
    entry.canProperty = U32(record + 24);
    entry.raw.assign(record, record + kHardwareRecordSize);
    entries.push_back(std::move(entry));
  }
  return entries;
}

}  // namespace kvhost
