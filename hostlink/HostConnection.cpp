// Construction of a host connection with its defaults, and its last-resort clean-up.
#include "hostlink/HostConnection.h"

#include <utility>

#include "hostlink/HostLink.h"

namespace nKV_DLL300 {

HostConnection::HostConnection(platform::net::SocketHandle socket, ConnectionSetup setup)
    : commandTable(MakeCommandTable()),
      propertyTable(MakePropertyTable()),
      hardwareTable(std::move(setup.hardwareTable)),
      hardwareCount(static_cast<uint16_t>(hardwareTable.size())),
      statistics(setup.statistics),
      heartbeatLimitMs(setup.heartbeatLimitMs),
      socket_(socket) {
  for (size_t i = 0; i < kDriverVersionCount; ++i) driverVersion[i] = setup.driverVersion[i];
  heartbeatWatch.Restart();
}

// Normally the loop has already stopped the session and closed the socket; an orderly shutdown
// of the service may destroy a connection that is still live.
HostConnection::~HostConnection() {
  EndSession(*this);
  if (socket_ != platform::net::kInvalidSocket) platform::net::Close(socket_);
}

}  // namespace nKV_DLL300
