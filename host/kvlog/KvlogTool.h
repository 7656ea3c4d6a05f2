// kvlog: converts the controller's binary and measurement-data logs to text logs or candump logs.
#pragma once

#include <cstdint>
#include <cstdio>
#include <optional>
#include <string>
#include <vector>

#include "host/voradump/RecordDecoder.h"

namespace kvlog {

enum class OutputFormat : uint8_t { kText, kCandump };

struct ConvertOptions {
  std::optional<voradump::RecordBus> bus;  // required for binary logs
  OutputFormat format = OutputFormat::kText;
  std::string interfaceName = "can0";
  voradump::DecodeOptions decode;
  std::string group, channel;  // measurement-data files: selection (empty: all)
  bool hasGroup = false, hasChannel = false;
};

struct CandumpResult {
  uint64_t frames = 0;
  uint64_t skipped = 0;  // frames without a candump form
  uint64_t trailingBytes = 0;
  bool writeFailed = false;
};

// Writes CAN records of `layout` as candump lines.
CandumpResult WriteCandumpLog(const uint8_t* records, size_t size,
                              nKV_DLL300::BinaryRecordLayout layout,
                              const std::string& interfaceName, std::FILE* out);

// Converts one binary log (file header and records) held in `file`. Returns the exit code.
int ConvertBinaryLog(const std::vector<uint8_t>& file, const ConvertOptions& options,
                     std::FILE* out, std::FILE* err);

// Converts the file at `path`, whose bytes `file` holds: a measurement-data file (HDF5 signature
// or ".vora" name) is read from `path`, anything else is taken for a binary log. Every channel of
// a measurement-data file is converted that can be; a damaged one is named on `err` and makes the
// result 1. Returns the exit code.
int ConvertFile(const std::string& path, const std::vector<uint8_t>& file,
                const ConvertOptions& options, std::FILE* out, std::FILE* err);

// The command line of kvlog. Returns the exit code: 0 done, 1 a file problem, 2 a usage error.
int RunKvlog(int argc, char** argv);

}  // namespace kvlog
