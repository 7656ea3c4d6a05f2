// Turns frame records (of a binary log or a measurement-data channel) into the controller's text
// log.
#pragma once

#include <cstdint>
#include <cstdio>
#include <optional>
#include <string_view>

#include "driver/BusKind.h"
#include "logging/BinaryLogFormat.h"
#include "logging/BinaryRecordReader.h"

namespace voradump {

using nKV_DLL300::BinaryRecordLayout;
// The bus of a log or a channel: the driver's bus kind (never kNone here).
using RecordBus = driver::BusKind;

// How CAN records are sized: fixed 24 bytes (classic sessions), variable (FD and J1939 sessions),
// or found from the records themselves.
enum class CanRecords : uint8_t { kAuto, kFixed, kVariable };

struct DecodeOptions {
  uint8_t linChecksum = 0;  // LIN: write the checksum column
  CanRecords canRecords = CanRecords::kAuto;
};

struct DecodeResult {
  uint64_t frames = 0;
  uint64_t trailingBytes = 0;  // bytes after the last whole record (a cut last write)
  bool writeFailed = false;
};

// The layout of the records of `bus`, settled from `choice` (and the bytes, for kAuto).
BinaryRecordLayout RecordLayout(RecordBus bus, CanRecords choice, const uint8_t* records,
                                size_t size);

// The bus a channel's "QV_network_protocol" names: 0 CAN, 1 FlexRay, 2 LIN.
using driver::BusOfProtocol;
// "can", "lin" or "flexray".
std::optional<RecordBus> BusOfName(std::string_view name);
const char* NameOfBus(RecordBus bus);

// Writes the header line and one line per record to `out`, exactly as the controller's text log of
// the bus holds them.
DecodeResult WriteTextLog(const uint8_t* records, size_t size, RecordBus bus,
                          const DecodeOptions& options, std::FILE* out);

}  // namespace voradump
