// A message is a property assignment (SET_PROP..., SET_TX_PROP...) or a whole command name.
#include "protocol/Dispatcher.h"

#include <array>

#include "bus/CBusSystem.h"
#include "hostlink/HostConnection.h"
#include "hostlink/HostLink.h"
#include "hostlink/MessageHeader.h"
#include "hostlink/SendReply.h"
#include "protocol/CommandHandlers.h"
#include "protocol/PropertyHandlers.h"

namespace nKV_DLL300 {

namespace {

constexpr std::string_view kPropertyPrefix = "SET_PROP";
constexpr std::string_view kTxPropertyPrefix = "SET_TX_PROP";
constexpr char kUnknownCommandText[] = "<ERROR: unknown command>\n";
constexpr char kUnknownPropertyText[] = "<ERROR: unknown SETPROP command>\n";

int32_t HandleProperty(HostConnection& connection, std::string_view text) {
  size_t equals = text.find('=');
  if (equals == std::string_view::npos) return 0;  // not an assignment: dropped silently
  int32_t id = connection.propertyTable.find(text.substr(0, equals));
  if (id == kPropertyUnknown) {
    SendText(connection, kUnknownPropertyText, nullptr, kMessageErrorText);
    return 0;
  }
  PropertyHandlerFor(id)(connection, text.substr(equals + 1));
  return 0;
}

int32_t HandleCommand(HostConnection& connection, std::string_view text) {
  int32_t id = connection.commandTable.find(text);
  if (id == kCommandUnknown) {
    SendText(connection, kUnknownCommandText, connection.session.get(), kMessageErrorText);
    return 0;
  }
  return CommandHandlerFor(id)(connection);
}

}  // namespace

int32_t HandleMessageText(HostConnection& connection, std::string_view text) {
  bool txProperty = text.starts_with(kTxPropertyPrefix);
  // Transmit properties belong to a CAN session's frame; without one they are dropped.
  // The session's own kind counts, not a port name set while it runs.
  if (txProperty && (!connection.session || connection.session->busType != driver::BusKind::kCan))
    return 0;
  if (txProperty || text.starts_with(kPropertyPrefix)) return HandleProperty(connection, text);
  return HandleCommand(connection, text);
}

DispatchOutcome DispatchMessage(HostConnection& connection) {
  std::array<char, kMessageBufferSize> buffer{};
  size_t received = 0;
  int32_t result = ReceiveMessage(connection, buffer.data(), received);
  if (result != 0) return DispatchOutcome{result, 0};
  if (connection.statistics != nullptr) connection.statistics->messagesReceived++;
  std::string_view text(buffer.data(), received);
  text = text.substr(0, text.find('\0'));  // the text ends at its first NUL, if any
  return DispatchOutcome{0, HandleMessageText(connection, text)};
}

}  // namespace nKV_DLL300
