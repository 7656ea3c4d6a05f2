// The description of the simulated hardware: devices, interfaces, buses and their traffic, faults.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "driver/BusKind.h"
#include "tarvix/PayloadPattern.h"

namespace tarvix {

// A CAN frame the bus carries periodically. `type` is a driver frame type: data, remote, bus error,
// FD data or FD data with bit-rate switching. A period of 0 sends back to back (a saturated bus).
struct PeriodicFrame {
  uint32_t identifier = 0;  // without the extended flag
  bool extended = false;
  uint8_t type = 0;
  uint32_t length = 0;
  double periodMs = 0;
  double offsetMs = 0;
  PayloadPattern payload;
};

// Replay of a candump -l log on a CAN bus; frames keep their relative times.
struct ReplayConfig {
  std::string file;
  bool loop = false;
  std::string logInterface;  // only lines of this candump interface; empty: every line
  double offsetMs = 0;
};

// One slot of a LIN schedule table.
struct LinSlot {
  uint8_t identifier = 0;
  bool response = true;  // false: header without response (no-response frame)
  uint32_t length = 0;
  PayloadPattern payload;
};

enum class NullCycles : uint8_t { None, Odd, Even, All };

// One static slot of a FlexRay cycle.
struct FlexRaySlot {
  uint16_t slot = 1;
  bool channelA = true;
  bool channelB = false;
  bool startup = false;
  bool sync = false;
  bool preamble = false;
  uint32_t length = 0;
  NullCycles nullCycles = NullCycles::None;
  PayloadPattern payload;
};

struct BusConfig {
  std::string name;
  driver::BusKind protocol = driver::BusKind::kCan;
  uint64_t bitRate = 500000;
  uint64_t dataBitRate = 0;  // CAN FD data phase; 0: none
  uint32_t canIoMode = 0;    // what subordinate sessions read as their CAN I/O mode
  std::string capture;       // candump -l file of every frame the bus carries; empty: none
  std::vector<PeriodicFrame> traffic;
  std::vector<ReplayConfig> replays;
  std::vector<uint8_t> claimedAddresses;  // J1939 addresses held by nodes outside the controller
  double linSlotMs = 10;
  std::vector<LinSlot> linSchedule;
  double flexRayCycleMs = 5;
  double flexRaySlotUs = 50;
  std::vector<FlexRaySlot> flexRaySlots;
};

// An interface on a simulated bus, or (with `device`) bound to a SocketCAN network device, whose
// CAN FD capability the device's MTU gives while the driver runs.
struct InterfaceConfig {
  std::string name;
  std::string bus;  // the simulated bus; empty for a bound interface
  uint32_t port = 1;
  uint32_t protocol = 0;  // driver::kProtocol*
  uint32_t canFd = 0;     // 1: the interface can do CAN FD (simulated interfaces)
  uint32_t transceiver = 0;
  std::string device;  // SocketCAN device name ("can0"); empty: simulated
};

struct DeviceConfig {
  std::string name;
  std::vector<InterfaceConfig> interfaces;
};

// A status that an operation returns instead of doing its work, on one interface or on all ("").
struct FaultConfig {
  std::string operation;
  std::string interfaceName;
  int32_t status = 0;
  bool always = false;
};

struct VersionValues {
  uint32_t major = 21;           // 0x00110008
  uint32_t minor = 5;            // 0x00110009
  uint32_t update = 0;           // 0x0011000B
  uint32_t phase = 3;            // 0x0011000A
  uint32_t packed = 0x15503000;  // 0x00110006
};

struct HardwareConfig {
  VersionValues versions;
  std::vector<DeviceConfig> devices;
  std::vector<BusConfig> buses;
  std::vector<FaultConfig> faults;
  uint32_t receiveQueueFrames = 16384;  // per receive session; an overflow drops the oldest
  uint32_t transmitQueueFrames = 1024;  // per queued output session
};

// The hardware of a controller without a configuration file (docs/tarvix.md).
HardwareConfig DefaultHardware();

}  // namespace tarvix
