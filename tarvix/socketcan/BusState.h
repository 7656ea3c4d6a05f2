// The CAN state word of an interface bound to a SocketCAN device, from what the device reports
// over netlink and, where it reports nothing, from the error frames seen.
#pragma once

#include <cstdint>

#include "tarvix/socketcan/WireFrame.h"

namespace tarvix {

// What the netlink query found about the device (LinkQuery.h fills it).
struct DeviceReport {
  bool present = false;  // the device exists
  bool up = false;       // administratively up and its carrier is on
  bool hasState = false;
  uint32_t canState = 0;  // the kernel's can_state: 0 active, 1 warning, 2 passive, 3 bus off,
                          // 4 stopped, 5 sleeping
  bool hasCounters = false;
  uint16_t txErrors = 0;
  uint16_t rxErrors = 0;
};

// Not thread-safe: the owning session's lock guards it.
class BusState {
 public:
  // Takes the state changes an error frame announces (controller, bus off, restart, counters,
  // protocol errors, missing acknowledge).
  void observe(const WireFrame& errorFrame);
  // The state word (driver/States.h layout) of a session that runs (`started`) on this device.
  uint32_t word(bool started, const DeviceReport& device) const;

 private:
  uint32_t comm_ = 0;       // from error frames: 0 active, 1 passive, 2 bus off
  uint32_t lastError_ = 0;  // 0 none, 1 stuff, 2 form, 3 acknowledge
  uint32_t txErrors_ = 0;
  uint32_t rxErrors_ = 0;
};

}  // namespace tarvix
