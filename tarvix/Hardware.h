// The simulated hardware at run time: devices, interfaces and the buses they are attached to.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "tarvix/Bus.h"
#include "tarvix/HardwareConfig.h"
#include "tarvix/socketcan/DevicePort.h"

namespace tarvix {

// An interface on a simulated bus, or bound to a SocketCAN device (`port` set, no bus).
struct SimInterface {
  InterfaceConfig config;
  int32_t index = 0;  // position in the hardware's interface list; the origin of its frames
  uint32_t ref = 0;
  std::shared_ptr<Bus> bus;
  std::shared_ptr<DevicePort> port;
};

struct SimDevice {
  std::string name;
  uint32_t ref = 0;
  std::vector<int32_t> interfaces;
};

// Immutable after Build; the buses inside have their own locks.
class Hardware {
 public:
  // Builds the hardware of a checked configuration; null with a message when it is inconsistent
  // (unknown bus, protocol mismatch, unreadable replay log, capture file that cannot be written).
  // `generation` keeps the references of successive hardware apart.
  static std::shared_ptr<Hardware> Build(const HardwareConfig& config, uint32_t generation,
                                         std::string& error);
  // No devices at all (a configuration that could not be used), with the given version values.
  static std::shared_ptr<Hardware> Empty(const VersionValues& versions);

  const HardwareConfig& config() const { return config_; }
  const std::vector<SimDevice>& devices() const { return devices_; }
  const std::vector<SimInterface>& interfaces() const { return interfaces_; }
  const SimInterface* findInterface(std::string_view name) const;
  const SimInterface* interfaceByRef(uint32_t ref) const;
  const SimDevice* deviceByRef(uint32_t ref) const;

 private:
  bool buildBuses(uint32_t generation, std::string& error);
  bool buildDevices(uint32_t generation, std::string& error);
  bool attach(SimInterface& i, std::string& error) const;

  HardwareConfig config_;
  std::vector<std::shared_ptr<Bus>> buses_;
  std::vector<SimDevice> devices_;
  std::vector<SimInterface> interfaces_;
};

}  // namespace tarvix
