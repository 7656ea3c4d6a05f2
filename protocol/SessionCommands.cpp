// The session commands: each answers with its text and acts on the connection's one session.
#include "protocol/SessionCommands.h"

#include <cstdio>
#include <memory>

#include "bus/CCAN.h"
#include "bus/CFlexRay.h"
#include "bus/CLIN.h"
#include "hostlink/HostConnection.h"
#include "hostlink/HostLink.h"
#include "hostlink/MessageHeader.h"
#include "hostlink/SendReply.h"
#include "protocol/TransmitProperties.h"

namespace nKV_DLL300 {

namespace {

constexpr char kStartAck[] = "<ACK: CMD_SESSION_START>\n";
constexpr char kStopAck[] = "<ACK: CMD_SESSION_STOP>\n";
constexpr char kTerminateAck[] = "<ACK: CMD_SESSION_TERMINATE>\n";
constexpr char kResetAck[] = "<ACK: CMD_SESSION_RESET>\n";
constexpr char kTxStartAck[] = "<ACK: CMD_TX_START>\n";
constexpr char kTxStopAck[] = "<ACK: CMD_TX_STOP>\n";
constexpr char kWrongPortName[] = "<ERROR: WRONG PORT NAME>\n";
constexpr char kNoAliasAndCluster[] = "<ERROR: CMD_SESSION_START: no Alias and Cluster defined>\n";
constexpr char kCanAlreadyStarted[] = "<ERROR: CAN session is already started>\n";
constexpr char kLinAlreadyStarted[] = "<ERROR: LIN session is already started>\n";
constexpr char kFlexRayAlreadyStarted[] = "<ERROR: FlexRay session is already started>\n";

// Long enough for every text below with two 32-bit numbers.
constexpr size_t kTextSize = 96;

void SendFormatted(HostConnection& connection, uint8_t type, const char* format, int32_t first,
                   int32_t second = 0) {
  char text[kTextSize];
  std::snprintf(text, sizeof text, format, first, second);
  SendText(connection, text, connection.session.get(), type);
}

// Step 5 and 6 of a start: a session that opened runs, one that did not ends the connection.
int32_t Launch(HostConnection& connection, std::unique_ptr<CBusSystem> session, int32_t result) {
  if (result == 0) {
    CBusSystem& started = *session;
    connection.session = std::move(session);
    started.startPollThread();
    SendText(connection, kStartAck, &started, kMessageText);
    connection.busType.store(started.busType);
    return 0;
  }
  // The code of the failing step; a warning from the last step fails the start as well and is
  // shown as itself (lastStatus keeps only negative codes, it would show an earlier value).
  char text[kTextSize];
  std::snprintf(text, sizeof text, "<ERROR: %d>\n", result);
  SendText(connection, text, session.get(), kMessageErrorText);
  session->threadRunning.store(false);
  (void)session->clearDriverSession();
  session.reset();
  CloseConnection(connection);
  connection.heartbeatWatch = Stopwatch{};
  return result;
}

int32_t StartCan(HostConnection& connection) {
  const SessionSettings& settings = connection.settings;
  auto session = std::make_unique<CCAN>(&connection);
  const int32_t result = session->openCanSession(
      settings.interfaceName.get(), settings.baudRate.load(), settings.termination.load());
  return Launch(connection, std::move(session), result);
}

int32_t StartLin(HostConnection& connection) {
  const SessionSettings& settings = connection.settings;
  auto session = std::make_unique<CLIN>(&connection);
  const int32_t result =
      session->openLinSession(settings.interfaceName.get(), settings.baudRate.load());
  return Launch(connection, std::move(session), result);
}

int32_t StartFlexRay(HostConnection& connection) {
  const SessionSettings& settings = connection.settings;
  auto session = std::make_unique<CFlexRay>(&connection);
  const int32_t result =
      session->openFlexRaySession(settings.interfaceName.get(), settings.termination.load());
  return Launch(connection, std::move(session), result);
}

// The "already started" text of the live session's own bus.
const char* AlreadyStartedText(const CBusSystem& session) {
  switch (session.busType) {
    case driver::BusKind::kLin:
      return kLinAlreadyStarted;
    case driver::BusKind::kFlexRay:
      return kFlexRayAlreadyStarted;
    default:
      return kCanAlreadyStarted;
  }
}

}  // namespace

int32_t StartSession(HostConnection& connection) {
  const driver::BusKind busType = connection.busType.load();
  const SessionSettings& settings = connection.settings;
  if (busType == driver::BusKind::kFlexRay && settings.runMode.contains("NORMAL") &&
      settings.alias.empty() && settings.cluster.empty()) {
    SendText(connection, kNoAliasAndCluster, nullptr, kMessageErrorText);
    return 0;
  }
  if (busType == driver::BusKind::kNone) {
    SendText(connection, kWrongPortName, nullptr, kMessageErrorText);
    return 0;
  }
  if (connection.session) {
    SendText(connection, AlreadyStartedText(*connection.session), connection.session.get(),
             kMessageErrorText);
    return 0;
  }
  if (busType == driver::BusKind::kCan) return StartCan(connection);
  if (busType == driver::BusKind::kLin) return StartLin(connection);
  return StartFlexRay(connection);
}

int32_t StopSession(HostConnection& connection) {
  if (!connection.session) return 0;
  SendText(connection, kStopAck, connection.session.get(), kMessageText);
  connection.session->pollActive.store(false);
  connection.session->wakePollThread();  // a loop pausing between reads ends now
  return 0;
}

int32_t TerminateSession(HostConnection& connection) {
  SendText(connection, kTerminateAck, connection.session.get(), kMessageText);
  int32_t result = 0;
  if (connection.session) {
    result = connection.session->stop();
    connection.session.reset();
    connection.busType.store(driver::BusKind::kNone);
  }
  CloseConnection(connection);
  return result;
}

int32_t ReadLastError(HostConnection& connection) {
  const int32_t tcpError = connection.lastTcpError.load();
  const CBusSystem* session = connection.session.get();
  if (session == nullptr) {
    SendFormatted(connection, kMessageText, "<TCP Error: %d> \n", tcpError);
    return 0;
  }
  const char* format =
      session->busType == driver::BusKind::kLin       ? "<LIN Error: %d>  <TCP Error: %d> \n"
      : session->busType == driver::BusKind::kFlexRay ? "<FlexRay Error: %d>  <TCP Error: %d> \n"
                                                      : "<CAN Error: %d>  <TCP Error: %d> \n";
  SendFormatted(connection, kMessageText, format, session->lastStatus.load(), tcpError);
  return 0;
}

int32_t ResetSession(HostConnection& connection) {
  SendText(connection, kResetAck, connection.session.get(), kMessageText);
  if (connection.session) connection.session->resetRequested.store(true);
  return 0;
}

// Transmission exists on CAN sessions only; LIN and FlexRay sessions get the acknowledgement.
int32_t StartTransmitCommand(HostConnection& connection) {
  SendText(connection, kTxStartAck, connection.session.get(), kMessageText);
  if (CTransmitFrame* frame = CanTransmitFrame(connection)) frame->StartTransmit();
  return 0;
}

int32_t StopTransmitCommand(HostConnection& connection) {
  SendText(connection, kTxStopAck, connection.session.get(), kMessageText);
  if (CTransmitFrame* frame = CanTransmitFrame(connection)) frame->StopTransmit();
  return 0;
}

}  // namespace nKV_DLL300
