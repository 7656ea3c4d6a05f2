// The parts kvmon's option parser shares between its files: option codes, what the parser
// collects, and the readers of values. Internal to host/kvmon.
#pragma once

#include <getopt.h>

#include <cstdint>
#include <cstdio>
#include <optional>
#include <string>
#include <vector>

namespace kvmon::options {

enum LongOnly : int {
  kHardware = 1000,
  kLines,
  kFdBaud,
  kIoMode,
  kIsoFd,
  kAlias,
  kCluster,
  kJ1939,
  kNodeAddress,
  kNodeName,
  kListenOnly,
  kBusErrors,
  kEcho,
  kNullFrames,
  kNoResponse,
  kTermination,
  kTransceiver,
  kKeySlot,
  kDataPeriod,
  kStatsPeriod,
  kTableSize,
  kLogName,
  kLogGroup,
  kLogChannel,
  kLogChecksum,
  kTxEvery,
  kChanged,
  kAge,
  kSort,
  kTiming,
  kOverdue,
};

inline const option kLongOptions[] = {
    {"controller", required_argument, nullptr, 'c'},
    {"wait", required_argument, nullptr, 'w'},
    {"hardware", no_argument, nullptr, kHardware},
    {"json", no_argument, nullptr, 'j'},
    {"lines", no_argument, nullptr, kLines},
    {"duration", required_argument, nullptr, 'd'},
    {"reports", required_argument, nullptr, 'n'},
    {"messages", required_argument, nullptr, 'n'},  // the earlier name of --reports
    {"filter", required_argument, nullptr, 'f'},
    {"changed", no_argument, nullptr, kChanged},
    {"age", required_argument, nullptr, kAge},
    {"sort", required_argument, nullptr, kSort},
    {"timing", no_argument, nullptr, kTiming},
    {"overdue", required_argument, nullptr, kOverdue},
    {"run-mode", required_argument, nullptr, 'm'},
    {"baud", required_argument, nullptr, 'b'},
    {"fd-baud", required_argument, nullptr, kFdBaud},
    {"io-mode", required_argument, nullptr, kIoMode},
    {"iso-fd", required_argument, nullptr, kIsoFd},
    {"alias", required_argument, nullptr, kAlias},
    {"cluster", required_argument, nullptr, kCluster},
    {"j1939", no_argument, nullptr, kJ1939},
    {"node-address", required_argument, nullptr, kNodeAddress},
    {"node-name", required_argument, nullptr, kNodeName},
    {"listen-only", no_argument, nullptr, kListenOnly},
    {"bus-errors", no_argument, nullptr, kBusErrors},
    {"echo", no_argument, nullptr, kEcho},
    {"null-frames", no_argument, nullptr, kNullFrames},
    {"no-response", no_argument, nullptr, kNoResponse},
    {"termination", no_argument, nullptr, kTermination},
    {"transceiver", required_argument, nullptr, kTransceiver},
    {"key-slot", required_argument, nullptr, kKeySlot},
    {"data-period", required_argument, nullptr, kDataPeriod},
    {"stats-period", required_argument, nullptr, kStatsPeriod},
    {"table-size", required_argument, nullptr, kTableSize},
    {"log", required_argument, nullptr, 'l'},
    {"log-name", required_argument, nullptr, kLogName},
    {"log-group", required_argument, nullptr, kLogGroup},
    {"log-channel", required_argument, nullptr, kLogChannel},
    {"log-checksum", no_argument, nullptr, kLogChecksum},
    {"tx", required_argument, nullptr, 't'},
    {"tx-every", required_argument, nullptr, kTxEvery},
    {"help", no_argument, nullptr, 'h'},
    {nullptr, 0, nullptr, 0},
};

// What the parser collects before it checks the whole and orders the property messages.
struct Collected {
  std::string runMode, alias, cluster, logName;
  std::vector<std::string> properties;
  std::optional<double> txEveryMs;
  bool log = false, baud = false, fdBaud = false, fdBrs = false;
};

// Reads a whole unsigned number, decimal or 0x hexadecimal, no larger than `max`.
bool ReadUnsigned(const char* text, uint64_t max, uint64_t& value);
// A finite number above 0.
bool ReadPositiveNumber(const char* text, double& value);
// Describes a usage error on `err`; always false.
bool Fail(std::FILE* err, const std::string& message);

// Session options (properties of the controller); false on a bad value (reported).
bool ApplySessionOption(int code, const char* arg, Collected& c, std::FILE* err);

}  // namespace kvmon::options
