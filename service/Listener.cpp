// The listener set-up: socket, bind, no-delay, listen with a backlog of 5.
#include "service/Listener.h"

#include "service/Configuration.h"

namespace nKV_DLL300 {

namespace net = platform::net;

int32_t OpenListener(std::string_view portText, net::SocketHandle& listenSocket) {
  listenSocket = net::kInvalidSocket;
  net::SocketHandle socket = net::CreateTcpSocket();
  if (socket == net::kInvalidSocket) return kSocketCreationFailed;
  if (!net::BindAnyAddress(socket, PortFromText(portText))) {
    net::Close(socket);
    return kBindFailed;
  }
  int32_t status = net::SetNoDelay(socket);
  (void)net::Listen(socket, kListenBacklog);  // its result is not examined
  listenSocket = socket;
  return status;
}

}  // namespace nKV_DLL300
