// Decoding records into text log lines, one formatted line at a time.
#include "host/voradump/RecordDecoder.h"

#include "logging/TextLogFormat.h"

namespace voradump {

using namespace nKV_DLL300;

BinaryRecordLayout RecordLayout(RecordBus bus, CanRecords choice, const uint8_t* records,
                                size_t size) {
  switch (bus) {
    case RecordBus::kLin:
      return BinaryRecordLayout::kFixed24;
    case RecordBus::kFlexRay:
      return BinaryRecordLayout::kFlexRayVariable;
    case RecordBus::kNone:
    case RecordBus::kCan:
      break;
  }
  switch (choice) {
    case CanRecords::kFixed:
      return BinaryRecordLayout::kFixed24;
    case CanRecords::kVariable:
      return BinaryRecordLayout::kCanVariable;
    case CanRecords::kAuto:
      break;
  }
  return DetectCanRecordLayout(records, size);
}

std::optional<RecordBus> BusOfName(std::string_view name) {
  if (name == "can") return RecordBus::kCan;
  if (name == "lin") return RecordBus::kLin;
  if (name == "flexray") return RecordBus::kFlexRay;
  return std::nullopt;
}

const char* NameOfBus(RecordBus bus) {
  switch (bus) {
    case RecordBus::kCan:
      return "CAN";
    case RecordBus::kLin:
      return "LIN";
    case RecordBus::kFlexRay:
      return "FlexRay";
    case RecordBus::kNone:
      break;
  }
  return "?";
}

namespace {

std::string_view HeaderOf(RecordBus bus, uint8_t linChecksum) {
  switch (bus) {
    case RecordBus::kCan:
      return kCanTextLogHeader;
    case RecordBus::kLin:
      return LinTextLogHeader(linChecksum);
    case RecordBus::kFlexRay:
      return kFlexRayTextLogHeader;
    case RecordBus::kNone:
      break;
  }
  return {};
}

size_t FormatLine(RecordBus bus, char* line, const driver::RawFrameView& frame,
                  uint8_t linChecksum) {
  switch (bus) {
    case RecordBus::kCan:
      return FormatCanTextLine(line, kTextLineCapacity, frame);
    case RecordBus::kLin:
      return FormatLinTextLine(line, kTextLineCapacity, frame, linChecksum);
    case RecordBus::kFlexRay:
      return FormatFlexRayTextLine(line, kTextLineCapacity, frame);
    case RecordBus::kNone:
      break;
  }
  return 0;
}

}  // namespace

DecodeResult WriteTextLog(const uint8_t* records, size_t size, RecordBus bus,
                          const DecodeOptions& options, std::FILE* out) {
  DecodeResult result;
  const std::string_view header = HeaderOf(bus, options.linChecksum);
  if (std::fwrite(header.data(), 1, header.size(), out) != header.size() ||
      std::fputc('\n', out) == EOF) {
    result.writeFailed = true;
    return result;
  }
  BinaryRecordReader reader(records, size, RecordLayout(bus, options.canRecords, records, size));
  char line[kTextLineCapacity];
  driver::RawFrameView frame;
  while (reader.next(frame)) {
    const size_t n = FormatLine(bus, line, frame, options.linChecksum);
    if (std::fwrite(line, 1, n, out) != n) {
      result.writeFailed = true;
      return result;
    }
    ++result.frames;
  }
  result.trailingBytes = reader.remaining();
  return result;
}

}  // namespace voradump
