// The table of command handlers, indexed by command identifier.
#include "protocol/CommandHandlers.h"

#include <array>

#include "hostlink/HostLink.h"
#include "hostlink/MessageTable.h"
#include "protocol/HardwareInfo.h"
#include "protocol/SessionCommands.h"

namespace nKV_DLL300 {

namespace {

// A recognised command whose handler is not in place yet: taken, nothing sent.
int32_t Unanswered(HostConnection&) { return 0; }

// Keeps the connection alive; never answered.
int32_t Heartbeat(HostConnection& connection) {
  RestartHeartbeat(connection);
  return 0;
}

constexpr std::array<CommandHandler, kCommandCount> MakeHandlers() {
  std::array<CommandHandler, kCommandCount> handlers{};
  handlers.fill(&Unanswered);
  handlers[kCommandSessionStart] = &StartSession;
  handlers[kCommandSessionStop] = &StopSession;
  handlers[kCommandSessionTerminate] = &TerminateSession;
  handlers[kCommandSessionReadLastError] = &ReadLastError;
  handlers[kCommandSessionReset] = &ResetSession;
  handlers[kCommandHeartbeat] = &Heartbeat;
  handlers[kCommandGetHardwareInfo] = &SendHardwareInfo;
  handlers[kCommandTxStart] = &StartTransmitCommand;
  handlers[kCommandTxStop] = &StopTransmitCommand;
  return handlers;
}

// Built at compile time: the service thread may run before the module's dynamic initialisers.
constexpr std::array<CommandHandler, kCommandCount> kHandlers = MakeHandlers();

}  // namespace

CommandHandler CommandHandlerFor(int32_t id) {
  if (id <= kCommandUnknown || id >= kCommandCount) return &Unanswered;
  return kHandlers[static_cast<size_t>(id)];
}

}  // namespace nKV_DLL300
