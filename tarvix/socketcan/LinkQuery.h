// A device's link over rtnetlink: its state, MTU and CAN settings, and setting its bit timing.
// The Linux calls of this unit are the backend's only netlink traffic.
#pragma once

#include <cstdint>
#include <string>

namespace tarvix {

// What the kernel reports about a network device.
struct LinkReport {
  int index = 0;
  bool up = false;       // administratively up
  bool running = false;  // up with its carrier on
  int mtu = 0;
  bool canController = false;  // a CAN controller (kind "can") with bit timing, not a virtual one
  uint32_t bitRate = 0;        // nominal rate; 0 unknown or not set
  uint32_t dataBitRate = 0;    // CAN FD data phase; 0 none
  uint32_t controlModes = 0;   // the kernel's CAN_CTRLMODE_* bits that are on
  bool hasState = false;
  uint32_t canState = 0;  // the kernel's can_state
  bool hasCounters = false;
  uint16_t txErrors = 0;
  uint16_t rxErrors = 0;
};

// Queries device `name`: 0, ENODEV when there is none, or another errno.
int QueryLink(const std::string& name, LinkReport& out);

// Bit timing and modes a session asks of a CAN controller.
struct CanTiming {
  uint32_t bitRate = 0;
  uint32_t dataBitRate = 0;  // with fd
  bool fd = false;
  bool listenOnly = false;
};

// Takes device `index` down, sets `timing` and brings it up again (a started session needs it
// up): 0 or the errno of the step that failed (EPERM without the right to configure network
// devices, EOPNOTSUPP for a mode the controller lacks).
int ConfigureCanLink(int index, const CanTiming& timing);

}  // namespace tarvix
