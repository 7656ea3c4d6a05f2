// kvmon's options: getopt_long over the tool's, the view's and the session's options, with every
// value checked here so that each property message gets exactly one reply from the controller.
#include "host/kvmon/KvmonOptions.h"

#include "host/kvmon/OptionParts.h"
#include "host/kvmon/TransmitText.h"

namespace kvmon {
namespace {

using namespace options;

bool SetController(Options& options, std::FILE* err, const std::string& text, const char* origin) {
  std::string error;
  const auto address = ParseControllerAddress(text, error);
  if (!address) return Fail(err, std::string(origin) + ": " + error);
  options.controller = *address;
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
    return Fail(err, "--reports needs a count of 1 or more");
  target = value;
  return true;
}

bool SetSeconds(std::FILE* err, const char* option, const char* text, double& target) {
  if (!ReadPositiveNumber(text, target))
    return Fail(err, std::string("--") + option + " needs a number of seconds above 0");
  return true;
}

// View options; nullopt when `code` is none.
std::optional<bool> ApplyViewOption(int code, const char* arg, ViewOptions& view, std::FILE* err) {
  std::string error;
  double number = 0;
  switch (code) {
    case 'f':
      if (auto filter = RowFilter::parse(arg ? arg : "", error)) {
        view.filter = std::move(*filter);
        return true;
      }
      return Fail(err, "--filter: " + error);
    case kChanged:
      view.changedOnly = true;
      return true;
    case kAge:
      if (!SetSeconds(err, "age", arg, number)) return false;
      view.ageSeconds = number;
      return true;
    case kSort:
      if (const auto order = SortOrderNamed(arg ? arg : "")) {
        view.sort = *order;
        return true;
      }
      return Fail(err, std::string("--sort: '") + (arg ? arg : "") +
                           "' is not id, count, period or recent");
    case kTiming:
      view.timing = true;
      return true;
    case kOverdue:
      if (!ReadPositiveNumber(arg, number) || number <= 1)
        return Fail(err, "--overdue needs a factor above 1");
      view.overdueFactor = number;
      return true;
    default:
      return std::nullopt;
  }
}

// Connection, output and transmit options; nullopt when `code` is none of them.
std::optional<bool> ApplyToolOption(int code, const char* arg, Options& options, Collected& c,
                                    std::FILE* err) {
  double seconds = 0;
  switch (code) {
    case 'c':
      return SetController(options, err, arg ? arg : "", "--controller");
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
      return SetCount(err, arg, options.reports);
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
      return ApplyViewOption(code, arg, options.view, err);
  }
}

bool IsInterfaceName(const std::string& name) {
  return !name.empty() && name.size() <= 64 && name.find_first_of("= \t\r\n") == std::string::npos;
}

bool CheckInterfaces(const Options& options, std::FILE* err) {
  if (options.interfaces.empty()) return Fail(err, "name the interface to watch, for example CAN1");
  if (options.interfaces.size() > kMaxInterfaces)
    return Fail(err, "at most eight interfaces at once (the controller serves eight hosts)");
  for (size_t i = 0; i < options.interfaces.size(); ++i) {
    const std::string& name = options.interfaces[i];
    if (!IsInterfaceName(name)) return Fail(err, "'" + name + "' is not an interface name");
    for (size_t j = 0; j < i; ++j) {
      if (options.interfaces[j] == name) return Fail(err, "'" + name + "' is named twice");
    }
  }
  return true;
}

bool AnyInterfaceOf(const Options& options, Bus bus) {
  for (const auto& name : options.interfaces) {
    if (BusOfInterface(name) == bus) return true;
  }
  return false;
}

// A bus kvmon sets up itself needs its bit rates, which a database would otherwise give.
bool CheckBitRates(const Options& options, const Collected& c, std::FILE* err) {
  const bool builtIn = c.runMode == "NORMAL" && (c.alias.empty() || c.cluster.empty());
  if (!builtIn) return true;
  const bool can = AnyInterfaceOf(options, Bus::kCan);
  if ((can || AnyInterfaceOf(options, Bus::kLin)) && !c.baud) {
    return Fail(err,
                "--run-mode normal sets the bus up and needs its bit rate: give --baud (for "
                "example 500000 for CAN, 19200 for LIN), or a database with --alias and --cluster");
  }
  if (can && c.fdBrs && !c.fdBaud)
    return Fail(err, "--io-mode fd-brs needs the data-phase bit rate: give --fd-baud");
  return true;
}

bool CheckLogging(const Collected& c, std::FILE* err) {
  if (c.log && c.logName.empty()) {
    return Fail(err,
                "--log needs --log-name NAME: the controller writes NAME.txt, NAME.zfl or "
                "NAME.vora in its service directory");
  }
  if (!c.log && !c.logName.empty()) return Fail(err, "--log-name needs --log TYPE");
  return true;
}

bool CheckTransmit(Options& options, const Collected& c, std::FILE* err) {
  if (c.txEveryMs && !options.transmit) return Fail(err, "--tx-every needs a --tx frame");
  if (!options.transmit) return true;
  if (options.interfaces.size() != 1) return Fail(err, "--tx sends on one interface only");
  if (BusOfInterface(options.interfaces[0]) != Bus::kCan)
    return Fail(err, "--tx sends on CAN interfaces only");
  options.transmit->periodMs = c.txEveryMs;
  options.echo = true;  // the frame's row shows that it goes out
  return true;
}

bool Finish(Options& options, Collected& c, std::FILE* err) {
  if (options.hardware) return true;
  if (c.runMode.empty() && !c.alias.empty() && !c.cluster.empty()) c.runMode = "NORMAL";
  if (!CheckInterfaces(options, err) || !CheckBitRates(options, c, err) || !CheckLogging(c, err) ||
      !CheckTransmit(options, c, err)) {
    return false;
  }
  for (const auto& property : c.properties) {
    options.echo = options.echo || property == "SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES=1";
    options.logChecksum = options.logChecksum || property == "SET_PROP_SESSION_LOG_CHECKSUM=1";
    options.textLog = options.textLog || property == "SET_PROP_LOGFILE_TYPE=0";
  }
  options.runMode = c.runMode;
  options.properties = std::move(c.properties);
  return true;
}

}  // namespace

ParseResult ParseOptions(int argc, char** argv, Options& options, std::FILE* err,
                         const char* controllerVariable) {
  Collected collected;
  if (controllerVariable != nullptr && *controllerVariable != '\0' &&
      !SetController(options, err, controllerVariable, kControllerVariable)) {
    return ParseResult::kUsageError;
  }
  optind = 0;  // a fresh scan, also when called more than once in one process
  opterr = 0;
  int code = 0;
  while ((code = getopt_long(argc, argv, "c:w:jd:n:f:m:b:l:t:h", kLongOptions, nullptr)) != -1) {
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
  while (optind < argc) options.interfaces.push_back(argv[optind++]);
  return Finish(options, collected, err) ? ParseResult::kRun : ParseResult::kUsageError;
}

}  // namespace kvmon
