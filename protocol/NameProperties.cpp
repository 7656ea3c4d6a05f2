// The port name chooses the bus type; the log file name is kept inside the service directory.
#include "protocol/NameProperties.h"

#include "hostlink/HostConnection.h"

namespace nKV_DLL300 {

namespace {

constexpr ReplySession kNone = ReplySession::kNone;
// The bus a port name stands for by its first characters; kNone when none matches.
driver::BusKind BusOfPort(std::string_view portName) {
  if (portName.starts_with("CAN")) return driver::BusKind::kCan;
  if (portName.starts_with("LIN")) return driver::BusKind::kLin;
  if (portName.starts_with("FlexRay")) return driver::BusKind::kFlexRay;
  return driver::BusKind::kNone;
}

void PortName(HostConnection& connection, std::string_view value) {
  const driver::BusKind bus = BusOfPort(value);
  // A name of another bus while a session runs is taken for the next session: the live session
  // keeps its own kind (CBusSystem::busType), and its commands, refusals and transmit follow that.
  connection.settings.portName.set(value);
  connection.settings.interfaceName.set(std::string(value).append(kInterfaceSuffix));
  if (value.empty()) {
    SendPropertyReply(connection, "<ERROR: SET_PROP_SESSION_PORTNAME: empty paramter>\n", kNone);
  } else if (bus == driver::BusKind::kNone) {
    SendPropertyReply(connection, "<ERROR: WRONG PORT NAME>\n", kNone);
  } else {
    connection.busType.store(bus);
    std::string stored = connection.settings.portName.get();
    SendPropertyReply(connection, FillReply("<ACK: SET_PROP_SESSION_PORTNAME %s>", stored), kNone);
  }
}

// The log file is the service directory, a separator and this name: a name holding a separator
// of either kind, or the directory names "." and "..", would put the file somewhere else, so it
// is no valid file name and gets the same answer as an empty one.
bool IsValidLogFileName(std::string_view name) {
  return !name.empty() && name.find_first_of("\\/") == std::string_view::npos && name != "." &&
         name != "..";
}

void LogFileName(HostConnection& connection, std::string_view value) {
  if (connection.settings.logFileEnabled.load() != 0 && connection.session) {
    SendPropertyReply(connection, "<ERROR: SET_PROP_LOGFILE_NAME, logging is active>\n", kNone);
    return;
  }
  if (IsValidLogFileName(value)) {
    connection.settings.logFileName.set(value);
  } else {
    SendPropertyReply(connection,
                      "<ERROR: no valid file name, file name KelvaneLog will be used>\n", kNone);
    connection.settings.logFileName.set(kDefaultLogFileName);
  }
  std::string stored = connection.settings.logFileName.get();
  SendPropertyReply(connection, FillReply("<ACK: SET_PROP_LOGFILE_NAME %s> \n", stored), kNone);
}

// Stores the text; answers the empty-text error or the acknowledgement without a line end.
void StoreName(HostConnection& connection, GuardedText& field, std::string_view value,
               std::string_view emptyError, std::string_view acknowledgement) {
  field.set(value);
  if (value.empty()) {
    SendPropertyReply(connection, std::string(emptyError), kNone);
    return;
  }
  SendPropertyReply(connection, FillReply(acknowledgement, field.get()), kNone);
}

void VoraGroupName(HostConnection& connection, std::string_view value) {
  StoreName(connection, connection.settings.voraGroupName, value,
            "<ERROR: SET_PROP_LOGFILE_VORA_GROUP_NAME: empty paramter>\n",
            "<ACK: SET_PROP_LOGFILE_VORA_GROUP_NAME %s>");
}

void VoraChannelName(HostConnection& connection, std::string_view value) {
  StoreName(connection, connection.settings.voraChannelName, value,
            "<ERROR: SET_PROP_LOGFILE_VORA_CHANNEL_NAME: empty paramter>\n",
            "<ACK: SET_PROP_LOGFILE_VORA_CHANNEL_NAME %s>");
}

}  // namespace

void AddNamePropertyHandlers(PropertyHandlerTable& table) {
  table[kPropertySessionPortName] = &PortName;
  table[kPropertyLogFileName] = &LogFileName;
  table[kPropertyLogFileVoraGroupName] = &VoraGroupName;
  table[kPropertyLogFileVoraChannelName] = &VoraChannelName;
}

}  // namespace nKV_DLL300
