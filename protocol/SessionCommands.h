// The commands that start, pause, reset and end a bus session, read the last errors and
// acknowledge transmission.
#pragma once

#include <cstdint>

namespace nKV_DLL300 {

class HostConnection;

// Command handlers (see CommandHandler); service thread only.
// CMD_SESSION_START: 0, or the failing status of the session's open operation (the connection
// is then closed).
int32_t StartSession(HostConnection& connection);
// CMD_SESSION_STOP: pauses polling for good; nothing is sent without a session.
int32_t StopSession(HostConnection& connection);
// CMD_SESSION_TERMINATE: acknowledges, stops and deletes the session, closes the connection;
// the result of the session's stop.
int32_t TerminateSession(HostConnection& connection);
int32_t ReadLastError(HostConnection& connection);
// CMD_SESSION_RESET: the table is emptied at the session's next identifier-record send.
int32_t ResetSession(HostConnection& connection);
// CMD_TX_START and CMD_TX_STOP: the acknowledgement, then, on a CAN session, the start or stop
// of its transmit frame. Ending the session (terminate, heartbeat, closed host) stops
// transmission through the CAN session's stop.
int32_t StartTransmitCommand(HostConnection& connection);
int32_t StopTransmitCommand(HostConnection& connection);

}  // namespace nKV_DLL300
