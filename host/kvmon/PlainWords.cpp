// Plain words for the controller's error texts: a table of known texts and one of status codes.
#include "host/kvmon/PlainWords.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <string_view>

namespace kvmon {
namespace {

struct StatusWords {
  uint32_t code;
  const char* words;
};

// Driver statuses (0xBFF63xxx errors, 0x3FF63xxx warnings) and the controller's own codes.
constexpr StatusWords kStatusWords[] = {
    {0xBFF6300A, "nothing to read within the time-out"},
    {0xBFF6300B, "the interface did not reach the awaited condition in time"},
    {0xBFF6300C, "the transmit queue stayed full"},
    {0xBFF63010, "the driver ran out of memory"},
    {0xBFF63020, "unknown or closed driver object"},
    {0xBFF63021, "driver object of the wrong kind"},
    {0xBFF63022, "missing, empty or too long name"},
    {0xBFF63030, "setting not known for this interface or kind of session"},
    {0xBFF63031, "setting of the wrong size"},
    {0xBFF63032, "the setting can only be read"},
    {0xBFF63033, "a value is out of range"},
    {0xBFF63034, "an interface setting was changed while the session runs"},
    {0xBFF63035, "a subordinate session cannot change interface settings"},
    {0xBFF63036, "bus state not known for this session"},
    {0xBFF63037, "bus state of the wrong size"},
    {0xBFF63040, "no such interface"},
    {0xBFF63041, "no such database (alias)"},
    {0xBFF63042, "no such cluster in the database"},
    {0xBFF63043, "no such frame in the database"},
    {0xBFF63044, "the database is for another bus than this interface"},
    {0xBFF63045, "this interface has no CAN FD"},
    {0xBFF63046, "unsuitable session mode"},
    {0xBFF63047, "operation not possible on this kind of session"},
    {0xBFF63048, "malformed frame"},
    {0xBFF6304A, "unknown wait condition"},
    {0xBFF6304B, "unknown start or stop scope"},
    {0xBFF6304C, "cannot send on a listen-only session"},
    {0xBFF6320A, "the J1939 address could not be claimed"},
    {0xBFF63258, "buffer too small"},
    {0xBFF63259, "buffer missing"},
    {0x3FF63050, "the receive queue overflowed and the oldest frames were dropped"},
    {static_cast<uint32_t>(-3), "a send to the host failed"},
    {static_cast<uint32_t>(-7), "receiving from the host failed"},
    {static_cast<uint32_t>(-20), "the log file could not be opened"},
    {static_cast<uint32_t>(-21), "a log write was incomplete"},
    {static_cast<uint32_t>(-22), "a payload could not be stored"},
    {static_cast<uint32_t>(-24), "the measurement-data library failed or is not installed"},
    {static_cast<uint32_t>(-25), "no heartbeat within 10 seconds"},
};

struct PropertyOption {
  const char* property;
  const char* option;
};

constexpr PropertyOption kPropertyOptions[] = {
    {"SET_PROP_SESSION_PORTNAME", "the interface name"},
    {"SET_PROP_SESSION_BAUDRATE", "--baud"},
    {"SET_PROP_TX_TIME_DATA", "--data-period"},
    {"SET_PROP_DATA_LOG_IDS_MAX", "--table-size"},
    {"SET_PROP_LOGFILE", "--log"},
    {"SET_PROP_LOGFILE_NAME", "--log-name"},
    {"SET_PROP_LOGFILE_TYPE", "--log"},
    {"SET_PROP_LOGFILE_VORA_GROUP_NAME", "--log-group"},
    {"SET_PROP_LOGFILE_VORA_CHANNEL_NAME", "--log-channel"},
    {"SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES", "--echo"},
    {"SET_PROP_SESSION_TERMINATION", "--termination"},
    {"SET_PROP_SESSION_RUNMODE", "--run-mode"},
    {"SET_PROP_SESSION_LISTEN_ONLY", "--listen-only"},
    {"SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES", "--bus-errors"},
    {"SET_PROP_SESSION_ALIAS", "--alias"},
    {"SET_PROP_SESSION_CLUSTER", "--cluster"},
    {"SET_PROP_TX_TIME_STATISTIC", "--stats-period"},
    {"SET_PROP_SESSION_TRANSCEIVER_TYPE", "--transceiver"},
    {"SET_PROP_SESSION_SHOW_NULL_FRAMES", "--null-frames"},
    {"SET_PROP_SESSION_KEY_SLOT", "--key-slot"},
    {"SET_PROP_SESSION_CANFD_BAUDRATE", "--fd-baud"},
    {"SET_PROP_SESSION_CAN_IOMODE", "--io-mode"},
    {"SET_PROP_SESSION_APPLICATION_PROTOCOL", "--j1939"},
    {"SET_PROP_SESSION_ISOFD_MODE", "--iso-fd"},
    {"SET_PROP_SESSION_NO_RESPONSE_FRAMES", "--no-response"},
    {"SET_PROP_SESSION_LOG_CHECKSUM", "--log-checksum"},
    {"SET_PROP_SESSION_NODE_ADDRESS", "--node-address"},
    {"SET_PROP_SESSION_NODE_NAME", "--node-name"},
};

// The text between "<ERROR:" and the closing ">", without surrounding blanks.
std::string Inner(const std::string& reply) {
  std::string_view text = reply;
  if (text.substr(0, 7) == "<ERROR:") text.remove_prefix(7);
  const size_t close = text.rfind('>');
  if (close != std::string_view::npos) text = text.substr(0, close);
  while (!text.empty() && (text.front() == ' ')) text.remove_prefix(1);
  while (!text.empty() && (text.back() == ' ' || text.back() == '\n')) text.remove_suffix(1);
  return std::string(text);
}

bool EndsWith(const std::string& text, std::string_view suffix) {
  return text.size() >= suffix.size() &&
         text.compare(text.size() - suffix.size(), suffix.size(), suffix) == 0;
}

// "<ERROR: -1074384832>": a session that could not be opened.
bool ReadNumber(const std::string& text, long long& number) {
  if (text.empty()) return false;
  errno = 0;
  char* end = nullptr;
  number = std::strtoll(text.c_str(), &end, 10);
  return errno == 0 && *end == '\0';
}

// "<PROPERTY>: <complaint>": a refused setting, named by the option that sets it.
std::string ExplainPropertyError(const std::string& inner) {
  const size_t colon = inner.find(": ");
  const std::string property = inner.substr(0, colon);
  const std::string option = OptionOfProperty(property);
  if (EndsWith(inner, "Value range error"))
    return "the controller refused the value of " + option + " (out of range)";
  if (EndsWith(inner, "Session yet created"))
    return option + " cannot be changed while a session runs";
  if (EndsWith(inner, "empty paramter")) return option + " needs a value";
  if (EndsWith(inner, "logging is active"))
    return "the log file name cannot be changed while the session logs";
  return "the controller refused " + option + ": " +
         inner.substr(colon == std::string::npos ? 0 : colon + 2);
}

std::string ExplainKnownText(const std::string& inner, const std::string& interfaceName) {
  if (inner == "WRONG PORT NAME") {
    return "the controller has no interface named '" + interfaceName +
           "'; names begin with CAN, LIN or FlexRay (kvmon --hardware lists them)";
  }
  if (inner == "CMD_SESSION_START: no Alias and Cluster defined") {
    return "a FlexRay session in normal run mode needs a database: give --alias and --cluster "
           "(for example --alias SimDB --cluster FlexRay)";
  }
  if (EndsWith(inner, "session is already started"))
    return "this connection already has a session running";
  if (inner == "Heartbeat message missing| TCP Client disconnect") {
    return "the controller ended the connection: it had no heartbeat from this host for 10 seconds";
  }
  if (inner == "unknown command") return "the controller does not know this command";
  if (inner == "unknown SETPROP command") return "the controller does not know this setting";
  if (inner == "no valid file name, file name KelvaneLog will be used") {
    return "the controller took no log file name (empty, or not a plain file name) and logs to "
           "KelvaneLog";
  }
  return "";
}

}  // namespace

std::string OptionOfProperty(const std::string& property) {
  for (const auto& entry : kPropertyOptions) {
    if (property == entry.property) return entry.option;
  }
  return property;
}

std::string DescribeStatus(int32_t status) {
  const auto code = static_cast<uint32_t>(status);
  char number[48];
  if (status < -100 || status > 100) {
    std::snprintf(number, sizeof number, "status 0x%08X", code);
  } else {
    std::snprintf(number, sizeof number, "status %d", status);
  }
  for (const auto& entry : kStatusWords) {
    if (entry.code == code) return std::string(entry.words) + " (" + number + ")";
  }
  return number;
}

std::string ExplainError(const std::string& reply, const std::string& interfaceName) {
  const std::string inner = Inner(reply);
  if (const std::string known = ExplainKnownText(inner, interfaceName); !known.empty())
    return known;
  long long number = 0;
  if (ReadNumber(inner, number)) {
    constexpr int32_t kOutOfRange = static_cast<int32_t>(0xBFF63033);
    const std::string hint = number == kOutOfRange ? " (is a bit rate missing? --baud)" : "";
    return "the controller could not open the session on " + interfaceName + ": " +
           DescribeStatus(static_cast<int32_t>(number)) + hint + "; it closed the connection";
  }
  if (inner.rfind("LOG FILE:", 0) == 0 && ReadNumber(Inner(inner.substr(9)), number)) {
    return "logging failed on the controller: " + DescribeStatus(static_cast<int32_t>(number)) +
           "; the session goes on";
  }
  if (inner.rfind("SET_", 0) == 0) return ExplainPropertyError(inner);
  return "the controller reports: " + inner;
}

}  // namespace kvmon
