// libFuzzer target: arbitrary bytes as a measurement-data file (.vora), listed by vora-dump and
// converted by kvlog to text and candump lines, the way the tools read a file on disk.
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "fuzz/FuzzSupport.h"
#include "host/kvlog/KvlogTool.h"
#include "host/voradump/VoraDumpTool.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string path = kvfuzz::ScratchDirectory() + "/input.vora";
  if (!kvfuzz::WriteFile(path, data, size)) return 0;
  const std::vector<uint8_t> file(data, data + size);

  kvlog::ConvertOptions text;
  (void)kvlog::ConvertFile(path, file, text, kvfuzz::Sink(), kvfuzz::Sink());
  kvlog::ConvertOptions candump;
  candump.format = kvlog::OutputFormat::kCandump;
  (void)kvlog::ConvertFile(path, file, candump, kvfuzz::Sink(), kvfuzz::Sink());
  (void)voradump::DumpVoraFile(path, voradump::DumpSelection{}, kvfuzz::Sink(), kvfuzz::Sink());
  return 0;
}
