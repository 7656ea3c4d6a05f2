// kvmon's command line: what the user asked for, read with getopt_long, and the usage text.
#pragma once

#include <cstdint>
#include <cstdio>
#include <optional>
#include <string>
#include <vector>

#include "host/kvmon/ControllerAddress.h"
#include "host/kvmon/RowSelection.h"
#include "host/kvmon/TransmitText.h"

namespace kvmon {

enum class OutputMode : uint8_t { kAuto, kTerminal, kPlain, kJson };

inline constexpr size_t kMaxInterfaces = 8;  // the controller serves eight hosts at once

struct Options {
  ControllerAddress controller;
  double waitSeconds = 20.0;  // how long to wait for the controller to listen
  bool hardware = false;
  bool help = false;
  OutputMode output = OutputMode::kAuto;
  std::optional<double> durationSeconds;
  std::optional<uint64_t> reports;  // end after this many reports of every interface

  std::vector<std::string> interfaces;
  // Session properties shared by every interface, in command-line order: each one the name=value
  // text of a property message, already validated and written the way the controller reads it.
  // SessionProperties (SessionSetup.h) makes each interface's list from them.
  std::vector<std::string> properties;
  std::string runMode;  // "NORMAL", "SUBORDINATE", or empty: the controller's default
  bool echo = false;    // --echo, or implied by --tx
  bool logChecksum = false;
  bool textLog = false;  // --log text
  std::optional<TransmitFrame> transmit;
  ViewOptions view;
};

enum class ParseResult : uint8_t { kRun, kHelp, kUsageError };

// Reads argv into `options`. `controllerVariable` is the value of KVMON_CONTROLLER (or null),
// which -c overrides. A usage error is described on `err`.
ParseResult ParseOptions(int argc, char** argv, Options& options, std::FILE* err,
                         const char* controllerVariable = nullptr);

void PrintUsage(std::FILE* out);

}  // namespace kvmon
