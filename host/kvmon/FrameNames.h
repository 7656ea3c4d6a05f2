// Names of what a session reports: buses, frame types, identifiers, periods and time stamps,
// shared by the terminal table and the line formats.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <tuple>
#include <vector>

#include "driver/BusKind.h"
#include "host/RecordDecoder.h"

namespace kvmon {

// The bus of a session: the driver's bus kind (never kNone here).
using Bus = driver::BusKind;

// The bus of an identifier-record message type (0, 1, 2); nullopt for other types.
std::optional<Bus> BusOfRecordType(uint8_t messageType);
// The bus of a statistics payload, told by its size (68 CAN, 60 LIN, 72 FlexRay).
std::optional<Bus> BusOfStatistics(size_t payloadSize);
// The bus an interface name stands for (CAN..., LIN..., FlexRay...), as the controller decides it.
std::optional<Bus> BusOfInterface(const std::string& interfaceName);
const char* BusName(Bus bus);

// "data", "remote", "error", "fd", "fd-brs", "j1939", "no-resp", "null", or "0xNN".
std::string FrameTypeName(Bus bus, uint8_t type);

// CAN: "100" or "18FEF100" (hex; extended without the marker bit); LIN: "10" (hex); FlexRay:
// "slot 40 B" (the slot in decimal and the channel), which no one reads as hex.
std::string IdentifierText(Bus bus, const kvhost::IdentifierRecord& record);
// The identifier without the extended marker bit.
uint32_t PlainIdentifier(Bus bus, const kvhost::IdentifierRecord& record);
bool IsExtended(Bus bus, const kvhost::IdentifierRecord& record);
char ChannelName(const kvhost::IdentifierRecord& record);

// Milliseconds between the last two frames; nullopt before the second frame.
std::optional<double> PeriodMs(const kvhost::IdentifierRecord& record);

// Seconds since 1970, with microseconds, of a time stamp in 100 ns units since 1601
// ("1700000000.123456"; "0.000000" for earlier stamps).
std::string UnixTimeText(uint64_t timestamp);

// Payload bytes as upper-case hex, `separator` between bytes.
std::string HexBytes(const std::vector<uint8_t>& bytes, const char* separator);

// What makes two records the same row: identifier and type (CAN), identifier (LIN), slot and
// channel (FlexRay), as the controller keys its table.
using RowKey = std::tuple<uint32_t, uint32_t>;
RowKey KeyOf(Bus bus, const kvhost::IdentifierRecord& record);

}  // namespace kvmon
