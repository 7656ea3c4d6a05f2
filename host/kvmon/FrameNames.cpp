// Frame type names, identifier texts, periods and time conversion for kvmon's displays.
#include "host/kvmon/FrameNames.h"

#include <cstdio>

#include "host/HostMessage.h"

namespace kvmon {
namespace {

constexpr uint32_t kExtendedBit = 0x20000000;
constexpr uint64_t kUnixEpochIn1601Units =
    116444736000000000ULL;  // 1970-01-01 in 100 ns since 1601
constexpr size_t kCanStatisticsSize = 68, kLinStatisticsSize = 60, kFlexRayStatisticsSize = 72;

struct TypeName {
  Bus bus;
  uint8_t type;
  const char* name;
};

constexpr TypeName kTypeNames[] = {
    {Bus::kCan, 0x00, "data"},     {Bus::kCan, 0x01, "remote"},   {Bus::kCan, 0x02, "error"},
    {Bus::kCan, 0x10, "fd"},       {Bus::kCan, 0x18, "fd-brs"},   {Bus::kCan, 0xC0, "j1939"},
    {Bus::kLin, 0x40, "data"},     {Bus::kLin, 0x41, "error"},    {Bus::kLin, 0x42, "no-resp"},
    {Bus::kFlexRay, 0x20, "data"}, {Bus::kFlexRay, 0x21, "null"},
};

}  // namespace

std::optional<Bus> BusOfRecordType(uint8_t messageType) {
  switch (messageType) {
    case kvhost::kCanRecords:
      return Bus::kCan;
    case kvhost::kLinRecords:
      return Bus::kLin;
    case kvhost::kFlexRayRecords:
      return Bus::kFlexRay;
    default:
      return std::nullopt;
  }
}

std::optional<Bus> BusOfStatistics(size_t payloadSize) {
  switch (payloadSize) {
    case kCanStatisticsSize:
      return Bus::kCan;
    case kLinStatisticsSize:
      return Bus::kLin;
    case kFlexRayStatisticsSize:
      return Bus::kFlexRay;
    default:
      return std::nullopt;
  }
}

std::optional<Bus> BusOfInterface(const std::string& name) {
  if (name.rfind("CAN", 0) == 0) return Bus::kCan;
  if (name.rfind("LIN", 0) == 0) return Bus::kLin;
  if (name.rfind("FlexRay", 0) == 0) return Bus::kFlexRay;
  return std::nullopt;
}

const char* BusName(Bus bus) {
  switch (bus) {
    case Bus::kCan:
      return "CAN";
    case Bus::kLin:
      return "LIN";
    case Bus::kFlexRay:
      return "FlexRay";
    case Bus::kNone:
      break;
  }
  return "?";
}

std::string FrameTypeName(Bus bus, uint8_t type) {
  for (const auto& entry : kTypeNames) {
    if (entry.bus == bus && entry.type == type) return entry.name;
  }
  char text[8];
  std::snprintf(text, sizeof text, "0x%02X", type);
  return text;
}

bool IsExtended(Bus bus, const kvhost::IdentifierRecord& record) {
  return bus == Bus::kCan && (record.identifier & kExtendedBit) != 0;
}

uint32_t PlainIdentifier(Bus bus, const kvhost::IdentifierRecord& record) {
  return IsExtended(bus, record) ? record.identifier & ~kExtendedBit : record.identifier;
}

char ChannelName(const kvhost::IdentifierRecord& record) { return record.channel == 0 ? 'A' : 'B'; }

std::string IdentifierText(Bus bus, const kvhost::IdentifierRecord& record) {
  char text[24];
  if (bus == Bus::kFlexRay) {
    std::snprintf(text, sizeof text, "slot %u %c", record.identifier, ChannelName(record));
  } else if (IsExtended(bus, record)) {
    std::snprintf(text, sizeof text, "%08X", PlainIdentifier(bus, record));
  } else {
    std::snprintf(text, sizeof text, bus == Bus::kLin ? "%02X" : "%03X", record.identifier);
  }
  return text;
}

std::optional<double> PeriodMs(const kvhost::IdentifierRecord& record) {
  if (record.count < 2 || record.lastTimestamp < record.previousTimestamp) return std::nullopt;
  return static_cast<double>(record.lastTimestamp - record.previousTimestamp) / 10000.0;
}

std::string UnixTimeText(uint64_t timestamp) {
  const uint64_t since1970 =
      timestamp < kUnixEpochIn1601Units ? 0 : timestamp - kUnixEpochIn1601Units;
  char text[40];
  std::snprintf(text, sizeof text, "%llu.%06llu",
                static_cast<unsigned long long>(since1970 / 10000000),
                static_cast<unsigned long long>(since1970 % 10000000 / 10));
  return text;
}

std::string HexBytes(const std::vector<uint8_t>& bytes, const char* separator) {
  static const char kDigits[] = "0123456789ABCDEF";
  std::string text;
  for (size_t i = 0; i < bytes.size(); ++i) {
    if (i > 0) text += separator;
    text += kDigits[bytes[i] >> 4];
    text += kDigits[bytes[i] & 0xF];
  }
  return text;
}

RowKey KeyOf(Bus bus, const kvhost::IdentifierRecord& record) {
  switch (bus) {
    case Bus::kCan:
      return {record.identifier, record.type};
    case Bus::kLin:
      return {record.identifier, 0};
    case Bus::kFlexRay:
      return {record.identifier, record.channel};
    case Bus::kNone:
      break;
  }
  return {record.identifier, 0};
}

}  // namespace kvmon
