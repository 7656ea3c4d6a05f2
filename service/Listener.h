// Opening the TCP listener on the configured port.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "platform/net/Socket.h"

namespace nKV_DLL300 {

constexpr int32_t kSocketCreationFailed = -8;
constexpr int32_t kBindFailed = -9;
constexpr int32_t kListenBacklog = 5;

// Creates, binds (all interfaces, PortFromText(portText)), sets no-delay and listens. Returns 0,
// -8 or -9 (a failed bind or listen; listenSocket then invalid, LastSocketError says why), or the
// no-delay error number (listener still usable).
int32_t OpenListener(std::string_view portText, platform::net::SocketHandle& listenSocket);

// The console line of a listener that could not be opened: the port and the reason.
std::string ListenerProblem(std::string_view portText, int32_t socketError);

}  // namespace nKV_DLL300
