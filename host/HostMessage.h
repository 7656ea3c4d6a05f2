// Decoding what the service sends: the 28-byte header, texts and the hardware table.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace kvhost {

constexpr size_t kHeaderSize = 28;
constexpr size_t kHardwareRecordSize = 44;

enum MessageType : uint8_t {
  kCanRecords = 0,
  kLinRecords = 1,
  kFlexRayRecords = 2,
  kText = 3,
  kErrorText = 5,
  kStatistics = 6,
  kHardwareTable = 7,
};

// The header fields (little-endian on the wire):
//   0 sequence u32, 4 type u8, 5..7 zero, 8 payload length u32, 12 identifier count u32,
//   16 last status i32, 20..23 constant 00 0F 00 00, 24..27 driver version bytes.
struct MessageHeaderView {
  uint32_t sequence = 0;
  uint8_t type = 0;
  uint8_t padding[3] = {};
  uint32_t payloadLength = 0;
  uint32_t idCount = 0;
  int32_t lastStatus = 0;
  uint8_t constant[4] = {};
  uint8_t version[4] = {};
};

// Decodes the first 28 bytes of `bytes`; nullopt when fewer are given.
std::optional<MessageHeaderView> DecodeHeader(const uint8_t* bytes, size_t size);

// One message as received: its header, its raw header bytes and its payload.
struct HostMessage {
  MessageHeaderView header;
  std::vector<uint8_t> headerBytes;
  std::vector<uint8_t> payload;

  std::string text() const { return std::string(payload.begin(), payload.end()); }
};

// One interface of the controller's hardware table.
struct HardwareEntry {
  std::string name;  // up to the first NUL of the 16-byte field
  uint32_t port = 0;
  uint32_t protocol = 0;  // 0 CAN, 1 FlexRay, 2 LIN
  uint32_t canProperty = 0;
  std::vector<uint8_t> raw;  // the 44 bytes as sent
};

// The records of a type 7 payload; nullopt when its length is not a multiple of 44.
std::optional<std::vector<HardwareEntry>> DecodeHardwareTable(const std::vector<uint8_t>& payload);

}  // namespace kvhost
