// kvmon's session options: tables of flags, numbers and names that become property messages,
// each value checked the way the controller reads it.
#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cmath>
#include <cstdlib>

#include "host/kvmon/OptionParts.h"

namespace kvmon::options {

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

namespace {

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

// The controller answers a name that would point outside its service directory like an empty one
// and logs to "KelvaneLog": refused here, with the reason.
bool SetLogName(Collected& c, std::FILE* err, const char* text) {
  const std::string name = text ? text : "";
  const bool plain = name != "." && name != ".." &&
                     name.find_first_of("/\\:") == std::string::npos &&
                     std::none_of(name.begin(), name.end(),
                                  [](char ch) { return static_cast<unsigned char>(ch) < 0x20; }) &&
                     !name.empty() && name.front() != ' ' && name.back() != ' ';
  if (!plain) {
    return Fail(err, "--log-name: '" + name +
                         "' is not a plain file name (the controller writes its logs in its "
                         "service directory: no /, \\, : or surrounding blanks)");
  }
  // With several interfaces the name gets "-INTERFACE" (up to 65 characters), and the whole
  // property message must stay within the 256 bytes the controller reads.
  constexpr size_t kLongestLogName = 160;
  if (name.size() > kLongestLogName)
    return Fail(err, "--log-name needs a name of 1 to 160 characters");
  c.logName = name;
  return AddText(c, err, "log-name", "SET_PROP_LOGFILE_NAME", text);
}

bool AddIoMode(Collected& c, std::FILE* err, const char* text) {
  const std::string mode = Lower(text ? text : "");
  const char* value = mode == "can" || mode == "0"      ? "0"
                      : mode == "fd" || mode == "1"     ? "1"
                      : mode == "fd-brs" || mode == "2" ? "2"
                                                        : nullptr;
  if (value == nullptr) return Fail(err, "--io-mode: '" + mode + "' is not can, fd or fd-brs");
  c.fdBrs = value[0] == '2';
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
  c.log = true;
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
    {kLogGroup, "log-group", "SET_PROP_LOGFILE_VORA_GROUP_NAME"},
    {kLogChannel, "log-channel", "SET_PROP_LOGFILE_VORA_CHANNEL_NAME"},
};

}  // namespace

bool ApplySessionOption(int code, const char* arg, Collected& c, std::FILE* err) {
  for (const auto& flag : kFlagOptions) {
    if (flag.code == code) {
      c.properties.push_back(std::string(flag.property) + "=1");
      return true;
    }
  }
  c.baud = c.baud || code == 'b';
  c.fdBaud = c.fdBaud || code == kFdBaud;
  for (const auto& n : kNumberOptions) {
    if (n.code == code) return AddNumber(c, err, n.option, n.property, arg, n.min, n.max);
  }
  if (code == kAlias) c.alias = arg ? arg : "";
  if (code == kCluster) c.cluster = arg ? arg : "";
  for (const auto& t : kTextOptions) {
    if (t.code == code) return AddText(c, err, t.option, t.property, arg);
  }
  if (code == kLogName) return SetLogName(c, err, arg);
  if (code == 'm') return SetRunMode(c, err, arg);
  if (code == kIoMode) return AddIoMode(c, err, arg);
  if (code == 'l') return AddLogType(c, err, arg);
  return Fail(err, "unknown option");
}

}  // namespace kvmon::options
