// kvmon's options: getopt_long over a table of session properties, with every value checked here
// so that each property message gets exactly one reply from the controller.
#include "host/kvmon/KvmonOptions.h"

#include <getopt.h>

#include <cctype>
#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <string_view>

#include "host/kvmon/TransmitText.h"

namespace kvmon {
namespace {

const char kUsage[] =
    "Usage: kvmon [OPTIONS] INTERFACE\n"
    "       kvmon --hardware [OPTIONS]\n"
    "\n"
    "Examples:\n"
    "  kvmon CAN1                                    live table of CAN1 as the bus runs\n"
    "  kvmon --hardware                              the controller's bus interfaces\n"
    "  kvmon --run-mode normal --baud 19200 LIN1     LIN1 opened by kvmon at 19 200 bit/s\n"
    "  kvmon --alias SimDB --cluster FlexRay FlexRay1   FlexRay1 from a database cluster\n"
    "  kvmon --json --duration 5 CAN1 > can1.jsonl   five seconds of CAN1 as JSON lines\n"
    "  kvmon --log binary --log-name run CAN1        also log every frame to a binary log\n"
    "  kvmon --run-mode normal --baud 500000 --tx 123#11223344 --tx-every 100 CAN3\n"
    "                                                send 0x123 every 100 ms on CAN3\n"
    "  kvmon -c 192.168.1.20:2000 CAN2               another controller and port\n"
    "\n"
    "Connects to a controller, opens a session on one of its bus interfaces (CAN, CAN FD, J1939,\n"
    "LIN or FlexRay), and shows the identifiers seen on the bus with their payload, count and\n"
    "period, and the bus statistics. On a terminal the table updates in place and changed payload\n"
    "bytes are highlighted; otherwise kvmon prints one line per identifier record and per\n"
    "statistics report. Ctrl-C ends the session.\n"
    "\n"
    "Connection and output:\n"
    "  -c, --controller HOST[:PORT]  the controller (default 127.0.0.1:13456)\n"
    "  -w, --wait SECONDS        wait this long for the controller to listen (default 20)\n"
    "      --hardware            print the hardware table and exit\n"
    "  -j, --json                JSON lines instead of the table\n"
    "      --lines               plain text lines even on a terminal\n"
    "  -d, --duration SECONDS    end the session after this time\n"
    "  -n, --messages N          end the session after N identifier-record reports\n"
    "\n"
    "Session:\n"
    "  -m, --run-mode MODE       subordinate (default: watch the bus as the controller runs it)\n"
    "                            or normal (kvmon sets the bus up); --alias with --cluster\n"
    "                            implies normal\n"
    "  -b, --baud RATE           bit rate in bit/s (CAN, LIN)\n"
    "      --fd-baud RATE        CAN FD data-phase bit rate in bit/s\n"
    "      --io-mode MODE        CAN I/O mode: can, fd or fd-brs (or 0, 1, 2)\n"
    "      --iso-fd MODE         ISO CAN FD mode value handed to the driver\n"
    "      --alias NAME          database alias (for example SimDB)\n"
    "      --cluster NAME        database cluster (for example Body, FD, LIN, FlexRay)\n"
    "      --j1939               J1939 application protocol\n"
    "      --node-address N      J1939 address to claim (0 to 253; 254 and 255 claim none)\n"
    "      --node-name N         J1939 NAME (64 bits)\n"
    "      --listen-only         never acknowledge or send on the bus\n"
    "      --bus-errors          list and count bus-error frames\n"
    "      --echo                also list frames this interface sent\n"
    "      --null-frames         FlexRay: list null frames\n"
    "      --no-response         LIN: list headers without response\n"
    "      --termination         switch the interface's bus termination on\n"
    "      --transceiver N       transceiver type (0 to 4)\n"
    "      --key-slot N          FlexRay key slot\n"
    "      --data-period MS      identifier reports every MS milliseconds (controller: 1000)\n"
    "      --stats-period MS     statistics every MS milliseconds, 1000 or more (controller: "
    "1000)\n"
    "      --table-size N        identifiers the controller keeps (controller: 1000)\n"
    "\n"
    "Logging on the controller:\n"
    "  -l, --log TYPE            log every frame: text, binary or vora\n"
    "      --log-name NAME       log file name (the controller adds date, time and extension)\n"
    "      --log-group NAME      measurement-data group name\n"
    "      --log-channel NAME    measurement-data channel name\n"
    "      --log-checksum        LIN text logs: checksum column\n"
    "\n"
    "Transmit (CAN):\n"
    "  -t, --tx FRAME            send FRAME once: 123#DEADBEEF, 18FEF100#0011 (extended: more "
    "than\n"
    "                            three hex digits), 123#R or 123#R4 (remote), 123##1AABB (CAN FD;\n"
    "                            flag 1: bit-rate switching)\n"
    "      --tx-every MS         send the --tx frame every MS milliseconds instead\n"
    "\n"
    "  -h, --help                show this text\n"
    "\n"
    "Exit status: 0 the session ended normally, 1 the controller refused or the connection\n"
    "failed, 2 a usage error.\n";

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
};

const option kLongOptions[] = {
    {"controller", required_argument, nullptr, 'c'},
    {"wait", required_argument, nullptr, 'w'},
    {"hardware", no_argument, nullptr, kHardware},
    {"json", no_argument, nullptr, 'j'},
    {"lines", no_argument, nullptr, kLines},
    {"duration", required_argument, nullptr, 'd'},
    {"messages", required_argument, nullptr, 'n'},
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

// What the parser collects before it orders the property messages.
struct Collected {
  std::string runMode, alias, cluster;
  std::vector<std::string> properties;
  std::optional<double> txEveryMs;
};

// Reads a whole unsigned number, decimal or 0x hexadecimal, no larger than `max`.
bool ReadUnsigned(const char* text, uint64_t max, uint64_t& value) {
  if (text == nullptr || *text == '\0' || *text == '-' ||
      std::isspace(static_cast<unsigned char>(*text))) {
    return false;
  }
  errno = 0;
  char* end = nullptr;
  const unsigned long long read = std::strtoull(text, &end, 0);
  if (errno != 0 || *end != '\0' || read > max) return false;
  value = read;
  return true;
}

bool ReadPositiveNumber(const char* text, double& value) {
  if (text == nullptr || *text == '\0') return false;
  char* end = nullptr;
  value = std::strtod(text, &end);
  return *end == '\0' && std::isfinite(value) && value > 0;
}

std::string Lower(std::string text) {
  for (char& c : text) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return text;
}

bool Fail(std::FILE* err, const std::string& message) {
  std::fprintf(err, "kvmon: %s\nTry 'kvmon --help'.\n", message.c_str());
  return false;
}

// A numeric property: the value checked against [min, max] and sent in decimal.
bool AddNumber(Collected& c, std::FILE* err, const char* option, const char* property,
               const char* text, uint64_t min, uint64_t max) {
  uint64_t value = 0;
  if (!ReadUnsigned(text, max, value) || value < min) {
    return Fail(err, std::string("--") + option + ": '" + (text ? text : "") +
                         "' is not a number from " + std::to_string(min) + " to " +
                         std::to_string(max));
  }
  c.properties.push_back(std::string(property) + "=" + std::to_string(value));
  return true;
}

bool AddText(Collected& c, std::FILE* err, const char* option, const char* property,
             const char* text) {
  const std::string value = text ? text : "";
  if (value.empty() || value.size() > 200) {
    return Fail(err, std::string("--") + option + " needs a name of 1 to 200 characters");
  }
  c.properties.push_back(std::string(property) + "=" + value);
  return true;
}

bool AddIoMode(Collected& c, std::FILE* err, const char* text) {
  const std::string mode = Lower(text ? text : "");
  const char* value = mode == "can" || mode == "0"      ? "0"
                      : mode == "fd" || mode == "1"     ? "1"
                      : mode == "fd-brs" || mode == "2" ? "2"
                                                        : nullptr;
  if (value == nullptr) return Fail(err, "--io-mode: '" + mode + "' is not can, fd or fd-brs");
  c.properties.push_back(std::string("SET_PROP_SESSION_CAN_IOMODE=") + value);
  return true;
}

bool AddLogType(Collected& c, std::FILE* err, const char* text) {
  const std::string type = Lower(text ? text : "");
  const char* value = type == "text"     ? "0"
                      : type == "binary" ? "1"
                      : type == "vora"   ? "2"
                                         : nullptr;
  if (value == nullptr) return Fail(err, "--log: '" + type + "' is not text, binary or vora");
  c.properties.push_back("SET_PROP_LOGFILE=1");
  c.properties.push_back(std::string("SET_PROP_LOGFILE_TYPE=") + value);
  return true;
}

bool SetRunMode(Collected& c, std::FILE* err, const char* text) {
  const std::string mode = Lower(text ? text : "");
  if (mode != "subordinate" && mode != "normal") {
    return Fail(err, "--run-mode: '" + mode + "' is not subordinate or normal");
  }
  c.runMode = mode == "normal" ? "NORMAL" : "SUBORDINATE";
  return true;
}

bool SetController(Options& options, std::FILE* err, const std::string& text) {
  const size_t colon = text.rfind(':');
  options.controllerHost = colon == std::string::npos ? text : text.substr(0, colon);
  if (colon != std::string::npos) {
    uint64_t port = 0;
    if (!ReadUnsigned(text.c_str() + colon + 1, 65535, port) || port == 0) {
      return Fail(err, "--controller: '" + text.substr(colon + 1) + "' is not a TCP port");
    }
    options.controllerPort = static_cast<uint16_t>(port);
  }
  if (options.controllerHost.empty()) return Fail(err, "--controller needs a host");
  return true;
}

bool SetTransmit(Options& options, std::FILE* err, const char* text) {
  std::string error;
  auto frame = ParseTransmitFrame(text ? text : "", error);
  if (!frame) return Fail(err, "--tx: " + error);
  options.transmit = std::move(frame);
  return true;
}

bool SetCount(std::FILE* err, const char* text, std::optional<uint64_t>& target) {
  uint64_t value = 0;
  if (!ReadUnsigned(text, UINT32_MAX, value) || value == 0)
    return Fail(err, "--messages needs a count of 1 or more");
  target = value;
  return true;
}

bool SetSeconds(std::FILE* err, const char* option, const char* text, double& target) {
  if (!ReadPositiveNumber(text, target))
    return Fail(err, std::string("--") + option + " needs a number of seconds above 0");
  return true;
}

// Session options that switch a property on (value 1).
struct FlagOption {
  int code;
  const char* property;
};
constexpr FlagOption kFlagOptions[] = {
    {kJ1939, "SET_PROP_SESSION_APPLICATION_PROTOCOL"},
    {kListenOnly, "SET_PROP_SESSION_LISTEN_ONLY"},
    {kBusErrors, "SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES"},
    {kEcho, "SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES"},
    {kNullFrames, "SET_PROP_SESSION_SHOW_NULL_FRAMES"},
    {kNoResponse, "SET_PROP_SESSION_NO_RESPONSE_FRAMES"},
    {kTermination, "SET_PROP_SESSION_TERMINATION"},
    {kLogChecksum, "SET_PROP_SESSION_LOG_CHECKSUM"},
};

// Session options with a number, checked against the range the controller accepts.
struct NumberOption {
  int code;
  const char* option;
  const char* property;
  uint64_t min, max;
};
constexpr NumberOption kNumberOptions[] = {
    {'b', "baud", "SET_PROP_SESSION_BAUDRATE", 1, 100000000},
    {kFdBaud, "fd-baud", "SET_PROP_SESSION_CANFD_BAUDRATE", 1, 100000000},
    {kIsoFd, "iso-fd", "SET_PROP_SESSION_ISOFD_MODE", 0, INT32_MAX},
    {kNodeAddress, "node-address", "SET_PROP_SESSION_NODE_ADDRESS", 0, 255},
    {kNodeName, "node-name", "SET_PROP_SESSION_NODE_NAME", 0, UINT64_MAX},
    {kTransceiver, "transceiver", "SET_PROP_SESSION_TRANSCEIVER_TYPE", 0, 4},
    {kKeySlot, "key-slot", "SET_PROP_SESSION_KEY_SLOT", 0, 0xFFFFFFFE},
    {kDataPeriod, "data-period", "SET_PROP_TX_TIME_DATA", 1, INT32_MAX},
    {kStatsPeriod, "stats-period", "SET_PROP_TX_TIME_STATISTIC", 1000, INT32_MAX},
    {kTableSize, "table-size", "SET_PROP_DATA_LOG_IDS_MAX", 1, 65535},
};

// Session options with a name.
struct TextOption {
  int code;
  const char* option;
  const char* property;
};
constexpr TextOption kTextOptions[] = {
    {kAlias, "alias", "SET_PROP_SESSION_ALIAS"},
    {kCluster, "cluster", "SET_PROP_SESSION_CLUSTER"},
    {kLogName, "log-name", "SET_PROP_LOGFILE_NAME"},
    {kLogGroup, "log-group", "SET_PROP_LOGFILE_VORA_GROUP_NAME"},
    {kLogChannel, "log-channel", "SET_PROP_LOGFILE_VORA_CHANNEL_NAME"},
};

// Session options; false on a bad value (reported).
bool ApplySessionOption(int code, const char* arg, Collected& c, std::FILE* err) {
  for (const auto& flag : kFlagOptions) {
    if (flag.code == code) {
      c.properties.push_back(std::string(flag.property) + "=1");
      return true;
    }
  }
  for (const auto& n : kNumberOptions) {
    if (n.code == code) return AddNumber(c, err, n.option, n.property, arg, n.min, n.max);
  }
  if (code == kAlias) c.alias = arg ? arg : "";
  if (code == kCluster) c.cluster = arg ? arg : "";
  for (const auto& t : kTextOptions) {
    if (t.code == code) return AddText(c, err, t.option, t.property, arg);
  }
  if (code == 'm') return SetRunMode(c, err, arg);
  if (code == kIoMode) return AddIoMode(c, err, arg);
  if (code == 'l') return AddLogType(c, err, arg);
  return Fail(err, "unknown option");
}

// Connection, output and transmit options; nullopt when `code` is a session option.
std::optional<bool> ApplyToolOption(int code, const char* arg, Options& options, Collected& c,
                                    std::FILE* err) {
  double seconds = 0;
  switch (code) {
    case 'c':
      return SetController(options, err, arg ? arg : "");
    case 'w':
      if (!SetSeconds(err, "wait", arg, seconds)) return false;
      options.waitSeconds = seconds;
      return true;
    case kHardware:
      options.hardware = true;
      return true;
    case 'j':
      options.output = OutputMode::kJson;
      return true;
    case kLines:
      options.output = OutputMode::kPlain;
      return true;
    case 'd':
      if (!SetSeconds(err, "duration", arg, seconds)) return false;
      options.durationSeconds = seconds;
      return true;
    case 'n':
      return SetCount(err, arg, options.recordMessages);
    case 't':
      return SetTransmit(options, err, arg);
    case kTxEvery:
      if (!SetSeconds(err, "tx-every", arg, seconds)) return false;
      c.txEveryMs = seconds;
      return true;
    case 'h':
      options.help = true;
      return true;
    default:
      return std::nullopt;
  }
}

// The run mode and port name go first; the rest keep the order of the command line.
bool Finish(Options& options, Collected& c, std::FILE* err) {
  if (options.hardware) return true;
  if (options.interfaceName.empty())
    return Fail(err, "name the interface to watch, for example CAN1");
  if (options.interfaceName.size() > 64 ||
      options.interfaceName.find_first_of("= \t\r\n") != std::string::npos) {
    return Fail(err, "'" + options.interfaceName + "' is not an interface name");
  }
  if (c.runMode.empty() && !c.alias.empty() && !c.cluster.empty()) c.runMode = "NORMAL";
  if (c.txEveryMs && !options.transmit) return Fail(err, "--tx-every needs a --tx frame");
  if (options.transmit) {
    if (options.interfaceName.rfind("CAN", 0) != 0)
      return Fail(err, "--tx sends on CAN interfaces only");
    options.transmit->periodMs = c.txEveryMs;
  }
  options.properties.push_back("SET_PROP_SESSION_PORTNAME=" + options.interfaceName);
  if (!c.runMode.empty()) options.properties.push_back("SET_PROP_SESSION_RUNMODE=" + c.runMode);
  options.properties.insert(options.properties.end(), c.properties.begin(), c.properties.end());
  return true;
}

}  // namespace

ParseResult ParseOptions(int argc, char** argv, Options& options, std::FILE* err) {
  Collected collected;
  optind = 0;  // a fresh scan, also when called more than once in one process
  opterr = 0;
  int code = 0;
  while ((code = getopt_long(argc, argv, "c:w:jd:n:m:b:l:t:h", kLongOptions, nullptr)) != -1) {
    if (code == '?' || code == ':') {
      const std::string name = optopt != 0 ? std::string("-") + static_cast<char>(optopt)
                                           : std::string(argv[optind - 1]);
      Fail(err, "unknown option or missing value: " + name);
      return ParseResult::kUsageError;
    }
    const auto tool = ApplyToolOption(code, optarg, options, collected, err);
    const bool ok = tool ? *tool : ApplySessionOption(code, optarg, collected, err);
    if (!ok) return ParseResult::kUsageError;
  }
  if (options.help) return ParseResult::kHelp;
  if (optind < argc) options.interfaceName = argv[optind++];
  if (optind < argc) {
    Fail(err, std::string("one interface at a time ('") + argv[optind] + "' is one too many)");
    return ParseResult::kUsageError;
  }
  return Finish(options, collected, err) ? ParseResult::kRun : ParseResult::kUsageError;
}

void PrintUsage(std::FILE* out) { std::fputs(kUsage, out); }

}  // namespace kvmon
