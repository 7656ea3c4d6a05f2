// The connection loop's pass over the listener and the eight slots.
#include "service/ConnectionLoop.h"

#include <algorithm>

#include "hostlink/HostLink.h"
#include "hostlink/MessageHeader.h"
#include "hostlink/SendReply.h"
#include "platform/net/SocketError.h"
#include "protocol/Dispatcher.h"
#include "protocol/HardwareInfo.h"
#include "service/ServiceContext.h"

namespace nKV_DLL300 {

namespace net = platform::net;

namespace {

constexpr size_t kNoSlot = kConnectionSlots;
constexpr size_t kMaxEntries = 1 + kConnectionSlots;

// What one pass waits on: the listener while a slot is free, and every connected host, for its
// messages and, while part of a message waits to be sent to it, for room to send.
struct WaitSet {
  net::SocketHandle sockets[kMaxEntries];
  size_t slotOf[kMaxEntries];  // kNoSlot for the listener
  bool wantWritable[kMaxEntries] = {};
  bool readable[kMaxEntries] = {};
  bool writable[kMaxEntries] = {};
  size_t count = 0;

  void add(net::SocketHandle socket, size_t slot, bool pendingOutput) {
    sockets[count] = socket;
    wantWritable[count] = pendingOutput;
    slotOf[count++] = slot;
  }
  // True when the slot's host sent something in this pass.
  bool heardFrom(size_t slot) const {
    for (size_t i = 0; i < count; ++i) {
      if (slotOf[i] == slot) return readable[i];
    }
    return false;
  }
};

ConnectionSlot* FirstFreeSlot(ServiceContext& context) {
  for (ConnectionSlot& slot : context.connections) {
    if (!slot.connection) return &slot;
  }
  return nullptr;
}

// The heartbeat rule for one slot: a host silent for longer than its heartbeat time is ended.
void CheckSlotHeartbeat(ServiceContext& context, ConnectionSlot& slot) {
  if (!slot.connection || !slot.connection->heartbeatWatch.isRunning) return;
  if (CheckHeartbeat(*slot.connection) != 0) FreeSlot(context, slot);
}

// Every host that sent nothing in this pass (all of them after a silent pass) answers to the
// heartbeat rule, whatever the other hosts do.
void RunHeartbeatChecks(ServiceContext& context, const WaitSet* set) {
  for (size_t i = 0; i < kConnectionSlots; ++i) {
    if (set == nullptr || !set->heardFrom(i)) CheckSlotHeartbeat(context, context.connections[i]);
  }
}

// The pass waits at most 10 s, and no longer than until the first host's heartbeat lapses, so
// that a silent host is ended at its time.
uint32_t PassWaitMs(const ServiceContext& context) {
  uint64_t wait = kPassWaitMs;
  for (const ConnectionSlot& slot : context.connections) {
    if (!slot.connection || !slot.connection->heartbeatWatch.isRunning) continue;
    const uint64_t elapsed = slot.connection->heartbeatWatch.ElapsedMilliseconds();
    const uint64_t lapse = uint64_t{slot.connection->heartbeatLimitMs} + 1;
    wait = std::min(wait, elapsed >= lapse ? 0 : lapse - elapsed);
  }
  return static_cast<uint32_t>(wait);
}

// A host is waiting and a slot is free; 0, or the socket error of a failed accept.
int32_t AcceptHost(ServiceContext& context) {
  ConnectionSlot* slot = FirstFreeSlot(context);
  if (slot == nullptr) return 0;  // the host waits in the backlog until a slot frees
  net::SocketHandle socket = net::Accept(context.listenSocket.load());
  if (socket == net::kInvalidSocket) return net::LastSocketError();
  if (context.options.socketSendBufferBytes > 0) {
    net::SetSendBufferSize(socket, context.options.socketSendBufferBytes);
  }
  (void)buildHardwareTable(*context.options.driver, context.hardwareTable);
  ConnectionSetup setup;
  for (size_t i = 0; i < kDriverVersionCount; ++i)
    setup.driverVersion[i] = context.driverVersion[i];
  setup.hardwareTable = context.hardwareTable;
  setup.statistics = &context.stats;
  setup.heartbeatLimitMs = context.options.heartbeatLimitMs;
  slot->socket = socket;
  slot->connection = std::make_unique<HostConnection>(socket, std::move(setup));
  slot->published.store(slot->connection.get());
  context.stats.connectionsAccepted++;
  context.stats.connectionsOpen++;
  SendText(*slot->connection, kGreetingText, nullptr, kMessageText);
  return 0;
}

// One readable slot: one message.
void ServeSlot(ServiceContext& context, ConnectionSlot& slot) {
  DispatchOutcome outcome = DispatchMessage(*slot.connection);
  if (outcome.receiveResult == kReceiveFailed || slot.connection->closeRequested.load() ||
      slot.connection->linkBroken()) {
    FreeSlot(context, slot);
  }
}

// Frees the slots whose stream broke (a send gave up on it), then takes the listener while a
// slot is free (a ninth host waits in the backlog and does not wake the wait) and every host.
void FillWaitSet(ServiceContext& context, net::SocketHandle listener, WaitSet& set) {
  for (ConnectionSlot& slot : context.connections) {
    if (slot.connection && slot.connection->linkBroken()) FreeSlot(context, slot);
  }
  if (FirstFreeSlot(context) != nullptr) set.add(listener, kNoSlot, false);
  for (size_t i = 0; i < kConnectionSlots; ++i) {
    ConnectionSlot& slot = context.connections[i];
    if (slot.connection) set.add(slot.socket, i, slot.connection->hasPendingOutput());
  }
}

// After the wait: the rest of partly sent messages, one message of each host that sent one,
// and a new host.
int32_t ServeWaitSet(ServiceContext& context, WaitSet& set) {
  int32_t result = 0;
  for (size_t entry = 0; entry < set.count; ++entry) {
    ConnectionSlot* slot =
        set.slotOf[entry] == kNoSlot ? nullptr : &context.connections[set.slotOf[entry]];
    if (slot == nullptr) {
      if (set.readable[entry]) result = AcceptHost(context);
      continue;
    }
    if (set.writable[entry] && slot->connection) FlushPendingOutput(*slot->connection);
    if (set.readable[entry] && slot->connection) ServeSlot(context, *slot);
  }
  return result;
}

}  // namespace

void FreeSlot(ServiceContext& context, ConnectionSlot& slot) {
  if (!slot.connection) return;
  EndSession(*slot.connection);
  CloseConnection(*slot.connection);
  (void)slot.published.exchange(nullptr);  // acquires what other readers handed over
  slot.connection.reset();
  slot.socket = net::kInvalidSocket;
  context.stats.connectionsEnded++;
  context.stats.connectionsOpen--;
}

int32_t ConnectionPass(ServiceContext& context) {
  // Without a listener (not yet listening, or shut down) there is nothing to wait on.
  net::SocketHandle listener = context.listenSocket.load();
  if (listener == net::kInvalidSocket) {
    RunHeartbeatChecks(context, nullptr);
    return kSilentPass;
  }
  WaitSet set;
  FillWaitSet(context, listener, set);
  int32_t ready = net::WaitReadableOrWritable(set.sockets, set.count, set.wantWritable,
                                              set.readable, set.writable, PassWaitMs(context));
  if (ready <= 0) {
    RunHeartbeatChecks(context, nullptr);
    return kSilentPass;
  }
  const int32_t result = ServeWaitSet(context, set);
  RunHeartbeatChecks(context, &set);
  return result;
}

}  // namespace nKV_DLL300
