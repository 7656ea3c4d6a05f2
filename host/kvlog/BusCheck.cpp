// Checking the frame types of a binary log against the bus it is converted as.
#include "host/kvlog/BusCheck.h"

#include <cstdio>

namespace kvlog {

using voradump::RecordBus;

std::optional<ForeignRecord> FirstForeignRecord(const uint8_t* records, size_t size,
                                                voradump::BinaryRecordLayout layout,
                                                RecordBus bus) {
  nKV_DLL300::BinaryRecordReader reader(records, size, layout);
  driver::RawFrameView frame;
  for (uint64_t number = 1;; ++number) {
    const size_t offset = reader.offset();
    if (!reader.next(frame)) return std::nullopt;
    if (!nKV_DLL300::IsFrameTypeOfBus(frame.header.type, bus))
      return ForeignRecord{number, offset, frame.header.type};
  }
}

namespace {

const char* OptionName(RecordBus bus) {
  switch (bus) {
    case RecordBus::kCan:
      return "can";
    case RecordBus::kLin:
      return "lin";
    case RecordBus::kFlexRay:
      return "flexray";
    case RecordBus::kNone:
      break;
  }
  return "?";
}

// A bus other than `bus` whose records these are, or nullopt.
std::optional<RecordBus> BusTheyFit(const uint8_t* records, size_t size, RecordBus bus) {
  for (const RecordBus other : {RecordBus::kCan, RecordBus::kLin, RecordBus::kFlexRay}) {
    if (other == bus || size == 0) continue;
    const auto layout = voradump::RecordLayout(other, voradump::CanRecords::kAuto, records, size);
    if (!FirstForeignRecord(records, size, layout, other)) return other;
  }
  return std::nullopt;
}

}  // namespace

std::string ExplainForeignRecords(const uint8_t* records, size_t size, RecordBus bus,
                                  voradump::CanRecords canRecords) {
  const auto layout = voradump::RecordLayout(bus, canRecords, records, size);
  const auto foreign = FirstForeignRecord(records, size, layout, bus);
  if (!foreign) return "";
  char text[160];
  std::snprintf(text, sizeof text,
                "these are not %s records: record %llu (byte %zu of the file) has frame type "
                "0x%02X",
                voradump::NameOfBus(bus), static_cast<unsigned long long>(foreign->number),
                foreign->offset + nKV_DLL300::kBinaryLogFileHeaderSize, foreign->type);
  std::string words = text;
  if (const auto other = BusTheyFit(records, size, bus)) {
    words += std::string("; they read as ") + voradump::NameOfBus(*other) + " records (--bus " +
             OptionName(*other) + ")";
  } else {
    words += "; the file is damaged or not a binary log";
  }
  return words;
}

}  // namespace kvlog
