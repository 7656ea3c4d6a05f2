// kvmon's command line: what the user asked for, read with getopt_long, and the usage text.
#pragma once

#include <cstdint>
#include <cstdio>
#include <optional>
#include <string>
#include <vector>

#include "host/kvmon/TransmitText.h"

namespace kvmon {

enum class OutputMode : uint8_t { kAuto, kTerminal, kPlain, kJson };

struct Options {
  std::string controllerHost = "127.0.0.1";
  uint16_t controllerPort = 13456;
  double waitSeconds = 20.0;  // how long to wait for the controller to listen
  bool hardware = false;
  bool help = false;
  OutputMode output = OutputMode::kAuto;
  std::optional<double> durationSeconds;
  std::optional<uint64_t> recordMessages;  // stop after this many identifier-record messages

  std::string interfaceName;
  // Session properties, in the order they are sent: each one the name=value text of a property
  // message, already validated and written the way the controller reads it.
  std::vector<std::string> properties;
  std::optional<TransmitFrame> transmit;
};

enum class ParseResult : uint8_t { kRun, kHelp, kUsageError };

// Reads argv into `options`. A usage error is described on `err`.
ParseResult ParseOptions(int argc, char** argv, Options& options, std::FILE* err);

void PrintUsage(std::FILE* out);

}  // namespace kvmon
