// The service thread's side of a connection: one receive, the close, and the heartbeat rule.
#include "hostlink/HostLink.h"

#include "hostlink/LinkAccess.h"
#include "hostlink/MessageHeader.h"
#include "hostlink/SendReply.h"
#include "platform/net/SocketError.h"

namespace nKV_DLL300 {

namespace net = platform::net;

namespace {

constexpr uint32_t kReceiveWaitMs = 100;

}  // namespace

int32_t ReceiveMessage(HostConnection& connection, char* buffer, size_t& received) {
  received = 0;
  net::SocketHandle socket = connection.socket();
  bool readable = false;
  int32_t ready = net::WaitReadable(&socket, 1, &readable, kReceiveWaitMs);
  if (ready == 0) return net::kErrorTimedOut;
  if (ready < 0) return kReceiveFailed;
  int64_t count = net::Receive(socket, buffer, kMessageBufferSize);
  if (count > 0) {
    received = static_cast<size_t>(count);
    return 0;
  }
  if (count == 0) return kReceiveFailed;  // the host closed the connection
  return net::LastSocketError() == net::kErrorTimedOut ? net::kErrorTimedOut : kReceiveFailed;
}

void CloseConnection(HostConnection& connection) {
  // Whatever the host was sent last reaches it whole, if it reads within the send wait.
  FinishPendingOutput(connection);
  {
    std::lock_guard<std::mutex> lock(LinkAccess::sendMutex(connection));
    net::SocketHandle& socket = LinkAccess::socket(connection);
    if (socket != net::kInvalidSocket) {
      if (!net::Close(socket)) connection.lastTcpError.store(net::LastSocketError());
      socket = net::kInvalidSocket;
    }
    LinkAccess::pendingOutput(connection).clear();
    LinkAccess::notePendingOutput(connection);
  }
  connection.closeRequested.store(true);
}

int32_t CheckHeartbeat(HostConnection& connection) {
  if (connection.heartbeatWatch.ElapsedMilliseconds() <= connection.heartbeatLimitMs) return 0;
  EndSession(connection);
  SendText(connection, kHeartbeatErrorText, nullptr, kMessageErrorText);
  CloseConnection(connection);
  connection.heartbeatWatch = Stopwatch{};
  if (connection.statistics != nullptr) connection.statistics->heartbeatTimeouts++;
  return kHeartbeatTimeout;
}

void RestartHeartbeat(HostConnection& connection) { connection.heartbeatWatch.Restart(); }

void EndSession(HostConnection& connection) {
  if (!connection.session) return;
  (void)connection.session.get_deleter().stop(connection.session.get());
  connection.session.reset();
}

}  // namespace nKV_DLL300
