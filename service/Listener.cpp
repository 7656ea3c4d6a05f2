// The listener set-up: socket, bind, no-delay, listen with a backlog of 5.
#include "service/Listener.h"

#include <string>

#include "platform/net/SocketError.h"
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
  // A socket that does not listen would take no host: it is no listener.
  if (!net::Listen(socket, kListenBacklog)) {
    net::Close(socket);
    return kBindFailed;
  }
  listenSocket = socket;
  return status;
}

std::string ListenerProblem(std::string_view portText, int32_t socketError) {
  std::string reason = "socket error " + std::to_string(socketError);
  if (socketError == net::kErrorAddressInUse) reason += ", the port is in use";
  if (socketError == net::kErrorAddressNotAvailable) reason += ", the address is not available";
  return "cannot listen on port " + std::to_string(PortFromText(portText)) + " (" + reason +
         "); trying again every second";
}

}  // namespace nKV_DLL300
