// Receiving a host's message, ending a connection, and the heartbeat watchdog.
#pragma once

#include <cstddef>
#include <cstdint>

#include "hostlink/HostConnection.h"

namespace nKV_DLL300 {

constexpr size_t kMessageBufferSize = 256;
constexpr int32_t kReceiveFailed = -7;
constexpr int32_t kHeartbeatTimeout = -25;
constexpr char kHeartbeatErrorText[] =
    "<ERROR: Heartbeat message missing| TCP Client disconnect> \n";

// Waits at most 100 ms for the host's next message and receives at most 256 bytes of it into
// `buffer` (kMessageBufferSize bytes), `received` telling how many. Returns 0 when bytes were
// received, 10060 on a time-out, -7 on a failure or when the host closed the connection.
// Service thread only.
int32_t ReceiveMessage(HostConnection& connection, char* buffer, size_t& received);

// Hands the unsent rest of a partly sent message to the system first (waiting at most the send
// wait of 1 s for room), then closes the socket (a failing close puts the socket error into
// lastTcpError) and marks the connection for the loop to free its slot. The session must already
// be stopped: no other thread may send any more. Service thread only.
void CloseConnection(HostConnection& connection);

// Ends a connection whose heartbeat lapsed more than its heartbeatLimitMs (10 000 ms unless the
// service was given another time) ago: stops its session, sends the heartbeat error text, closes
// it and clears the watch. Returns 0, or -25 when it ended the connection. Service thread only.
int32_t CheckHeartbeat(HostConnection& connection);

// Restarts the heartbeat watch (CMD_HEARTBEAT). Service thread only.
void RestartHeartbeat(HostConnection& connection);

// Stops and deletes the connection's session, if any; its poll thread has ended on return.
// A CAN session stops its own transmission as part of stop(). Service thread only.
void EndSession(HostConnection& connection);

}  // namespace nKV_DLL300
