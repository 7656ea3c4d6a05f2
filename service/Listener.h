// Opening the TCP listener on the configured port.
#pragma once

#include <cstdint>
#include <string_view>

#include "platform/net/Socket.h"

namespace nKV_DLL300 {

constexpr int32_t kSocketCreationFailed = -8;
constexpr int32_t kBindFailed = -9;
constexpr int32_t kListenBacklog = 5;

// Creates, binds (all interfaces, PortFromText(portText)), sets no-delay and listens. Returns 0,
// -8 or -9 (listenSocket then invalid), or the no-delay error number (listener still usable).
int32_t OpenListener(std::string_view portText, platform::net::SocketHandle& listenSocket);

}  // namespace nKV_DLL300
