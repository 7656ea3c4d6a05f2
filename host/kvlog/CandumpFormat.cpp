// Formatting of CAN frames as candump log lines.
#include "host/kvlog/CandumpFormat.h"

#include <cstdio>
#include <cstring>

#include "logging/FileTime.h"

namespace kvlog {
namespace {

using driver::RawFrameView;

constexpr uint32_t kExtendedFlag = 0x2000'0000;
constexpr uint32_t kClassicMax = 8;
constexpr uint32_t kFdMax = 64;
constexpr char kBusErrorFrame[] = "20000080#0000000000000000";
constexpr uint8_t kFdFlag = 0x04, kBitRateSwitchFlag = 0x01;

enum class Kind { kData, kRemote, kBusError, kFd, kNone };

Kind KindOf(const driver::RawFrameView& f) {
  const uint32_t length = driver::RawPayloadLength(f.header);
  const bool whole = f.payloadLength == length;
  switch (f.header.type) {
    case 0x00:
    case driver::kFrameJ1939:
      return whole && length <= kClassicMax ? Kind::kData : Kind::kNone;
    case 0x01:
      return Kind::kRemote;
    case 0x02:
      return Kind::kBusError;
    case 0x10:
    case 0x18:
      return whole && length <= kFdMax ? Kind::kFd : Kind::kNone;
    default:
      return Kind::kNone;
  }
}

char* AppendHexUpper(char* p, const uint8_t* bytes, uint32_t count) {
  constexpr char kDigits[] = "0123456789ABCDEF";
  for (uint32_t i = 0; i < count; ++i) {
    *p++ = kDigits[bytes[i] >> 4];
    *p++ = kDigits[bytes[i] & 15];
  }
  return p;
}

char* AppendIdentifier(char* p, uint32_t identifier) {
  const bool extended = (identifier & kExtendedFlag) != 0;
  return p + std::sprintf(p, extended ? "%08X" : "%03X",
                          identifier & (extended ? 0x1FFF'FFFFu : 0x7FFu));
}

char* AppendTime(char* p, uint64_t fileTime) {
  const uint64_t micros = fileTime < nKV_DLL300::kFileTimeUnixEpoch
                              ? 0
                              : (fileTime - nKV_DLL300::kFileTimeUnixEpoch) / 10;
  return p + std::sprintf(p, "(%llu.%06llu) ", static_cast<unsigned long long>(micros / 1'000'000),
                          static_cast<unsigned long long>(micros % 1'000'000));
}

char* AppendFrame(char* p, Kind kind, const driver::RawFrameView& f) {
  if (kind == Kind::kBusError) return p + std::sprintf(p, "%s", kBusErrorFrame);
  p = AppendIdentifier(p, f.header.identifier);
  *p++ = '#';
  const uint32_t length = driver::RawPayloadLength(f.header);
  if (kind == Kind::kRemote) {
    *p++ = 'R';
    if (length > 0 && length <= kClassicMax) *p++ = static_cast<char>('0' + length);
    return p;
  }
  if (kind == Kind::kFd) {
    const uint8_t flags = kFdFlag | (f.header.type == 0x18 ? kBitRateSwitchFlag : 0);
    *p++ = '#';
    *p++ = static_cast<char>('0' + flags);
  }
  return AppendHexUpper(p, f.payload, length);
}

}  // namespace

bool IsValidInterfaceName(std::string_view name) {
  if (name.empty() || name.size() > kMaxInterfaceName) return false;
  for (const char c : name) {
    if (c <= ' ' || c >= 0x7F) return false;
  }
  return true;
}

size_t FormatCandumpLine(char* out, size_t cap, const driver::RawFrameView& frame,
                         std::string_view interfaceName) {
  const Kind kind = KindOf(frame);
  if (kind == Kind::kNone || cap < kCandumpLineCapacity || !IsValidInterfaceName(interfaceName))
    return 0;
  char* p = AppendTime(out, frame.header.timestamp);
  std::memcpy(p, interfaceName.data(), interfaceName.size());
  p += interfaceName.size();
  *p++ = ' ';
  p = AppendFrame(p, kind, frame);
  if (kind != Kind::kBusError && (frame.header.flags & driver::kFlagEcho) != 0) {
    *p++ = ' ';
    *p++ = 'T';
  }
  *p++ = '\n';
  return static_cast<size_t>(p - out);
}

}  // namespace kvlog
