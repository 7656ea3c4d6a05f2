// The 28-byte header that precedes every message the service sends to a host.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

namespace nKV_DLL300 {

// Wire format, all multi-byte fields little-endian:
//
//   offset size field
//   0      4    sequence number of the connection before this message
//   4      1    message type (MessageType)
//   5      3    zero
//   8      4    payload length in bytes
//   12     4    the session's identifier count (16 bits widened), 0 without a session
//   16     4    the session's last status (signed), 0 without a session
//   20     4    constant bytes 00 0F 00 00
//   24     4    low byte of driver version values 1, 2, 3 and 4
//
// The payload follows the header at once.
enum MessageType : uint8_t {
  kMessageCanRecords = 0,
  kMessageLinRecords = 1,
  kMessageFlexRayRecords = 2,
  kMessageText = 3,
  kMessageErrorText = 5,
  kMessageStatistics = 6,
  kMessageHardwareTable = 7,
};

struct MessageHeaderFields {
  uint32_t sequenceNumber = 0;
  uint8_t type = 0;
  uint32_t payloadLength = 0;
  uint32_t idCount = 0;
  int32_t lastStatus = 0;
  uint8_t versionBytes[4] = {0, 0, 0, 0};
};

constexpr size_t kMessageHeaderSize = 28;
constexpr size_t kHeaderOffsetType = 4;
constexpr size_t kHeaderOffsetLength = 8;
constexpr size_t kHeaderOffsetIdCount = 12;
constexpr size_t kHeaderOffsetLastStatus = 16;
constexpr size_t kHeaderOffsetConstant = 20;
constexpr size_t kHeaderOffsetVersion = 24;
static_assert(kHeaderOffsetVersion + 4 == kMessageHeaderSize);
static_assert(kHeaderOffsetConstant + 4 == kHeaderOffsetVersion);

using MessageHeader = std::array<uint8_t, kMessageHeaderSize>;

// The header bytes for `fields`.
MessageHeader EncodeMessageHeader(const MessageHeaderFields& fields);

// True for the types whose payload is binary with a caller-given length (0, 1, 2, 6, 7).
bool IsBinaryMessageType(uint8_t type);

}  // namespace nKV_DLL300
