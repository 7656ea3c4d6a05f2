// The J1939 address claim of one session on a bound interface: the claim goes out on the bus, and
// the address stands 250 ms later unless a node with a higher-priority NAME (a lower value)
// claims it first. A node that claims it with a lower-priority NAME is answered with a repeated
// claim. Claims are sent through a CAN_J1939 socket bound to the NAME and address where the
// kernel has them (the kernel then answers transfers addressed to the node), else as raw frames.
#pragma once

#include <cstdint>

#include "tarvix/socketcan/CanSockets.h"
#include "tarvix/socketcan/DevicePort.h"

namespace tarvix {

// Not thread-safe: the owning session's lock guards it.
class J1939Claim {
 public:
  // Claims `address` for `name` on device `index` (listen-only sessions claim nothing).
  void begin(DevicePort& port, const void* owner, int index, uint64_t name, uint8_t address,
             bool listenOnly, int64_t nowNs);
  // Gives the address up.
  void end(DevicePort& port, const void* owner);
  // Reads the claims other nodes sent since the last call; the address held now, or 0xFE.
  uint32_t address(int64_t nowNs);

 private:
  bool send();
  void observe(uint8_t address, const uint8_t* data, size_t size);

  J1939Socket node_;
  RawCanSocket raw_;  // where the kernel has no CAN_J1939 sockets
  uint64_t name_ = 0;
  uint8_t address_ = 0xFE;
  int64_t standsAtNs_ = 0;
  bool active_ = false;
  bool lost_ = false;
};

}  // namespace tarvix
