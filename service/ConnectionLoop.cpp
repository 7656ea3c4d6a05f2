// The connection loop's pass over the listener and the eight slots.
#include "service/ConnectionLoop.h"

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

struct ReadSet {
  net::SocketHandle sockets[1 + kConnectionSlots];
  size_t slotOf[1 + kConnectionSlots];  // entry 0 is the listener
  bool readable[1 + kConnectionSlots] = {};
  size_t count = 0;

  void add(net::SocketHandle socket, size_t slot) {
    sockets[count] = socket;
    slotOf[count++] = slot;
  }
};

ConnectionSlot* FirstFreeSlot(ServiceContext& context) {
  for (ConnectionSlot& slot : context.connections) {
    if (!slot.connection) return &slot;
  }
  return nullptr;
}

// Step 3 of a pass: nothing arrived for the whole wait.
int32_t RunHeartbeatChecks(ServiceContext& context) {
  for (ConnectionSlot& slot : context.connections) {
    if (!slot.connection || !slot.connection->heartbeatWatch.isRunning) continue;
    if (CheckHeartbeat(*slot.connection) != 0) FreeSlot(context, slot);
  }
  return kSilentPass;
}

// Step 4: a host is waiting; 0, or the socket error of a failed accept.
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
  slot->socket = socket;
  slot->connection = std::make_unique<HostConnection>(socket, std::move(setup));
  context.stats.connectionsAccepted++;
  context.stats.connectionsOpen++;
  SendText(*slot->connection, kGreetingText, nullptr, kMessageText);
  return 0;
}

// Step 5 for one readable slot.
void ServeSlot(ServiceContext& context, ConnectionSlot& slot) {
  DispatchOutcome outcome = DispatchMessage(*slot.connection);
  if (outcome.receiveResult == kReceiveFailed || slot.connection->closeRequested.load() ||
      slot.connection->linkBroken()) {
    FreeSlot(context, slot);
  }
}

}  // namespace

void FreeSlot(ServiceContext& context, ConnectionSlot& slot) {
  if (!slot.connection) return;
  EndSession(*slot.connection);
  CloseConnection(*slot.connection);
  slot.connection.reset();
  slot.socket = net::kInvalidSocket;
  context.stats.connectionsEnded++;
  context.stats.connectionsOpen--;
}

int32_t ConnectionPass(ServiceContext& context) {
  // Without a listener (failed set-up, or shut down) the wait fails at once: a silent pass.
  net::SocketHandle listener = context.listenSocket.load();
  if (listener == net::kInvalidSocket) return RunHeartbeatChecks(context);
  ReadSet set;
  set.add(listener, kNoSlot);
  for (size_t i = 0; i < kConnectionSlots; ++i) {
    ConnectionSlot& slot = context.connections[i];
    if (!slot.connection) continue;
    if (slot.connection->linkBroken()) {  // a send gave up on this stream
      FreeSlot(context, slot);
      continue;
    }
    FlushPendingOutput(*slot.connection);
    set.add(slot.socket, i);
  }
  int32_t ready = net::WaitReadable(set.sockets, set.count, set.readable, kPassWaitMs);
  if (ready <= 0) return RunHeartbeatChecks(context);
  if (set.readable[0]) {
    int32_t accepted = AcceptHost(context);
    if (accepted != 0) return accepted;
  }
  for (size_t entry = 1; entry < set.count; ++entry) {
    ConnectionSlot& slot = context.connections[set.slotOf[entry]];
    if (set.readable[entry] && slot.connection) ServeSlot(context, slot);
  }
  return 0;
}

}  // namespace nKV_DLL300
