// Handlers of the settings a session reads when it is created: one rule per property.
#include "protocol/SessionLockedProperties.h"

#include <atomic>
#include <type_traits>

#include "bus/CBusSystem.h"
#include "hostlink/HostConnection.h"
#include "protocol/ValueReaders.h"

namespace nKV_DLL300 {

namespace {

struct LockedRule {
  std::string_view name;             // also the start of the refusal texts
  std::string_view acknowledgement;  // "%d" the stored field, "%s" the stored text
  std::string_view rangeError;
  uint32_t highest;  // numbers: accepted 0 to highest, compared unsigned
};

constexpr LockedRule kLogTransmittedFrames{
    "SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES",
    "<ACK: SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES %d> \n",
    "<ERROR: SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES: Value range error>\n", 1};
constexpr LockedRule kTermination{"SET_PROP_SESSION_TERMINATION",
                                  "<ACK: SET_PROP_SESSION_TERMINATION %d> \n",
                                  "<ERROR: SET_PROP_SESSION_TERMINATION: Value range error>\n", 1};
constexpr LockedRule kRunMode{"SET_PROP_SESSION_RUNMODE", "<ACK: SET_PROP_SESSION_RUNMODE %s> \n",
                              "<ERROR: SET_PROP_SESSION_RUNMODE: Value range error>\n", 0};
constexpr LockedRule kListenOnly{"SET_PROP_SESSION_LISTEN_ONLY",
                                 "<ACK: SET_PROP_SESSION_LISTEN_ONLY %d> \n",
                                 "<ERROR: SET_PROP_SESSION_LISTEN_ONLY: Value range error>\n", 1};
constexpr LockedRule kLogBusErrorFrames{
    "SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES", "<ACK: SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES %d> \n",
    "<ERROR: SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES: Value range error>\n", 1};
constexpr LockedRule kAlias{"SET_PROP_SESSION_ALIAS", "<ACK: SET_PROP_SESSION_ALIAS %s> \n", "", 0};
constexpr LockedRule kCluster{"SET_PROP_SESSION_CLUSTER", "<ACK: SET_PROP_SESSION_CLUSTER %s> \n",
                              "", 0};

// The bus word of the refusal texts; empty for a bus type that names no bus.
std::string_view BusWord(driver::BusKind bus) {
  switch (bus) {
    case driver::BusKind::kCan:
      return "CAN";
    case driver::BusKind::kLin:
      return "LIN";
    case driver::BusKind::kFlexRay:
      return "FR";
    default:
      return "";
  }
}

// The one reply after the value was stored; `shown` is what the acknowledgement prints.
void Answer(HostConnection& connection, const LockedRule& rule, bool accepted,
            std::string_view shown) {
  if (!accepted) {
    SendPropertyReply(connection, std::string(rule.rangeError), ReplySession::kNone);
    return;
  }
  if (!connection.session) {
    SendPropertyReply(connection, FillReply(rule.acknowledgement, shown), ReplySession::kNone);
    return;
  }
  // The refusal names the live session's bus, whatever port name was set since it started.
  std::string_view bus = BusWord(connection.session->busType);
  if (bus.empty()) return;
  std::string refusal = "<ERROR: ";
  refusal.append(rule.name).append(": ").append(bus).append(" Session yet created>\n");
  SendPropertyReply(connection, refusal, ReplySession::kWith);
}

template <auto Field, auto Read, const LockedRule& Rule>
void LockedNumber(HostConnection& connection, std::string_view value) {
  auto& field = connection.settings.*Field;
  using Stored = typename std::remove_reference_t<decltype(field)>::value_type;
  field.store(static_cast<Stored>(Read(value)));
  uint32_t stored = field.load();
  Answer(connection, Rule, stored <= Rule.highest, SignedText(stored));
}

bool AnyText(std::string_view) { return true; }

bool NamesRunMode(std::string_view text) {
  return text.find("SUBORDINATE") != std::string_view::npos ||
         text.find("NORMAL") != std::string_view::npos;
}

template <auto Field, bool (*Accepts)(std::string_view), const LockedRule& Rule>
void LockedText(HostConnection& connection, std::string_view value) {
  GuardedText& field = connection.settings.*Field;
  field.set(value);
  std::string stored = field.get();
  Answer(connection, Rule, Accepts(stored), stored);
}

}  // namespace

void AddSessionLockedPropertyHandlers(PropertyHandlerTable& table) {
  table[kPropertySessionLogTransmittedFrames] =
      &LockedNumber<&SessionSettings::logTransmittedFrames, &ReadByte, kLogTransmittedFrames>;
  table[kPropertySessionTermination] =
      &LockedNumber<&SessionSettings::termination, &ReadInteger, kTermination>;
  table[kPropertySessionRunMode] = &LockedText<&SessionSettings::runMode, &NamesRunMode, kRunMode>;
  table[kPropertySessionListenOnly] =
      &LockedNumber<&SessionSettings::listenOnly, &ReadByte, kListenOnly>;
  table[kPropertySessionLogBusErrorFrames] =
      &LockedNumber<&SessionSettings::logBusErrorFrames, &ReadByte, kLogBusErrorFrames>;
  table[kPropertySessionAlias] = &LockedText<&SessionSettings::alias, &AnyText, kAlias>;
  table[kPropertySessionCluster] = &LockedText<&SessionSettings::cluster, &AnyText, kCluster>;
}

}  // namespace nKV_DLL300
