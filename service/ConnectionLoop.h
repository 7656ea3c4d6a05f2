// One pass of the connection loop: accept, receive and dispatch, heartbeat watchdog.
#pragma once

#include <cstdint>

namespace nKV_DLL300 {

class ServiceContext;
struct ConnectionSlot;

constexpr int32_t kSilentPass = -4;
constexpr uint32_t kPassWaitMs = 10000;
constexpr char kGreetingText[] = "<Connected to Kelvane>\n";

// Waits at most 10 s for the listener and the connected hosts, then accepts one host into the
// first free slot (none free: the host waits in the backlog), handles one message of every
// readable host, and frees the slots of ended connections. When nothing was readable for 10 s,
// ends the hosts whose heartbeat lapsed. Returns 0, -4 for a silent pass, or the socket error
// of a failed accept. Service thread only.
int32_t ConnectionPass(ServiceContext& context);

// Ends the slot's connection (session stopped first, socket closed) and frees the slot.
// Service thread, or the shutdown after the service thread has ended.
void FreeSlot(ServiceContext& context, ConnectionSlot& slot);

}  // namespace nKV_DLL300
