// libFuzzer target: arbitrary bytes as a binary log (.zfl), converted by kvlog for every bus,
// record layout and output format, as `kvlog --bus ... FILE` converts a file it has read.
#include <cstddef>
#include <cstdint>
#include <vector>

#include "fuzz/FuzzSupport.h"
#include "host/kvlog/KvlogTool.h"

namespace {

using kvlog::ConvertOptions;
using kvlog::OutputFormat;
using voradump::CanRecords;
using voradump::RecordBus;

ConvertOptions Options(RecordBus bus, OutputFormat format, CanRecords records) {
  ConvertOptions options;
  options.bus = bus;
  options.format = format;
  options.decode.canRecords = records;
  options.decode.linChecksum = 1;
  return options;
}

const ConvertOptions kConversions[] = {
    Options(RecordBus::kCan, OutputFormat::kText, CanRecords::kAuto),
    Options(RecordBus::kCan, OutputFormat::kCandump, CanRecords::kAuto),
    Options(RecordBus::kCan, OutputFormat::kText, CanRecords::kFixed),
    Options(RecordBus::kCan, OutputFormat::kCandump, CanRecords::kVariable),
    Options(RecordBus::kLin, OutputFormat::kText, CanRecords::kAuto),
    Options(RecordBus::kFlexRay, OutputFormat::kText, CanRecords::kAuto),
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::vector<uint8_t> file(data, data + size);
  for (const ConvertOptions& options : kConversions)
    (void)kvlog::ConvertBinaryLog(file, options, kvfuzz::Sink(), kvfuzz::Sink());
  return 0;
}
