// One pass of the connection loop: accept, receive and dispatch, heartbeat watchdog.
#pragma once

#include <cstdint>

namespace nKV_DLL300 {

class ServiceContext;
struct ConnectionSlot;

constexpr int32_t kSilentPass = -4;
constexpr uint32_t kPassWaitMs = 10000;
constexpr char kGreetingText[] = "<Connected to Kelvane>\n";

// Waits at most 10 s (and no longer than until the first heartbeat lapses) for the connected
// hosts, for room to send the unsent rest of a message to a host, and, while a slot is free,
// for the listener (with all eight slots taken a ninth host waits in the backlog). Then accepts
// one host into the first free slot, finishes what room allows of pending output, handles one
// message of every readable host and frees the slots of ended connections. Every host that sent
// nothing in the pass is ended when its heartbeat lapsed, whatever the other hosts do. Returns
// 0, -4 when the wait ended without anything to do or failed, or the socket error of a failed
// accept. Service thread only.
int32_t ConnectionPass(ServiceContext& context);

// Ends the slot's connection (session stopped first, socket closed) and frees the slot.
// Service thread, or the shutdown after the service thread has ended.
void FreeSlot(ServiceContext& context, ConnectionSlot& slot);

}  // namespace nKV_DLL300
