// The simulated hardware at run time.
#include "tarvix/Hardware.h"

#include <algorithm>

#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "tarvix/CanBus.h"
#include "tarvix/FlexRayBus.h"
#include "tarvix/LinBus.h"
#include "tarvix/ObjectRef.h"
#include "tarvix/SimClock.h"

namespace tarvix {
namespace {

constexpr uint32_t kGenerationShift = 12;

std::shared_ptr<Bus> MakeBus(BusConfig config, int64_t epochNs, std::string& error) {
  if (config.protocol == driver::BusKind::kLin)
    return std::make_shared<LinBus>(std::move(config), epochNs);
  if (config.protocol == driver::BusKind::kFlexRay) {
    std::sort(config.flexRaySlots.begin(), config.flexRaySlots.end(),
              [](const FlexRaySlot& a, const FlexRaySlot& b) { return a.slot < b.slot; });
    return std::make_shared<FlexRayBus>(std::move(config), epochNs);
  }
  std::vector<std::vector<LoggedFrame>> replays;
  for (const ReplayConfig& r : config.replays) {
    std::vector<LoggedFrame> all;
    if (!ReadCandumpFile(r.file, all, error)) return nullptr;
    std::vector<LoggedFrame> chosen;
    for (LoggedFrame& f : all) {
      if (r.logInterface.empty() || f.interfaceName == r.logInterface)
        chosen.push_back(std::move(f));
    }
    replays.push_back(std::move(chosen));
  }
  return std::make_shared<CanBus>(std::move(config), epochNs, std::move(replays));
}

}  // namespace

std::shared_ptr<Hardware> Hardware::Build(const HardwareConfig& config, uint32_t generation,
                                          std::string& error) {
  auto hw = std::shared_ptr<Hardware>(new Hardware());
  hw->config_ = config;
  if (!hw->buildBuses(generation, error) || !hw->buildDevices(generation, error)) return nullptr;
  return hw;
}

std::shared_ptr<Hardware> Hardware::Empty(const VersionValues& versions) {
  auto hw = std::shared_ptr<Hardware>(new Hardware());
  hw->config_.versions = versions;
  return hw;
}

bool Hardware::buildBuses(uint32_t, std::string& error) {
  const int64_t epoch = NowNs();
  for (const BusConfig& b : config_.buses) {
    if (!b.capture.empty() && b.protocol != driver::BusKind::kCan) {
      error = "bus \"" + b.name + "\": a capture file needs a CAN bus";
      return false;
    }
    std::shared_ptr<Bus> bus = MakeBus(b, epoch, error);
    if (bus == nullptr || !bus->openCapture(error)) return false;
    buses_.push_back(std::move(bus));
  }
  return true;
}

bool Hardware::buildDevices(uint32_t generation, std::string& error) {
  const uint32_t base = (generation & 0xFFF) << kGenerationShift;
  for (const DeviceConfig& d : config_.devices) {
    SimDevice device{
        d.name, MakeRef(kRefDevice, base + static_cast<uint32_t>(devices_.size()) + 1), {}};
    for (const InterfaceConfig& i : d.interfaces) {
      if (findInterface(i.name) != nullptr) {
        error = "interface \"" + i.name + "\" is listed twice";
        return false;
      }
      const auto index = static_cast<int32_t>(interfaces_.size());
      SimInterface added{i, index, MakeRef(kRefInterface, base + index + 1), nullptr, nullptr};
      if (!attach(added, error)) return false;
      interfaces_.push_back(std::move(added));
      device.interfaces.push_back(index);
    }
    devices_.push_back(std::move(device));
  }
  return true;
}

// Puts an interface on its simulated bus, or binds it to its device (opened only by sessions).
bool Hardware::attach(SimInterface& i, std::string& error) const {
  if (!i.config.device.empty()) {
    i.port = std::make_shared<DevicePort>(i.config.device);
    return true;
  }
  const InterfaceConfig& c = i.config;
  const auto bus = std::find_if(buses_.begin(), buses_.end(),
                                [&c](const auto& b) { return b->config().name == c.bus; });
  if (bus == buses_.end()) {
    error = "interface \"" + c.name + "\": unknown bus \"" + c.bus + "\"";
    return false;
  }
  if (driver::ProtocolOfBus((*bus)->config().protocol) != c.protocol) {
    error = "interface \"" + c.name + "\": its protocol differs from bus \"" + c.bus + "\"";
    return false;
  }
  i.bus = *bus;
  return true;
}

const SimInterface* Hardware::findInterface(std::string_view name) const {
  name = name.substr(0, name.find(driver::kInterfaceSuffixSeparator));
  for (const SimInterface& i : interfaces_) {
    if (i.config.name == name) return &i;
  }
  return nullptr;
}

const SimInterface* Hardware::interfaceByRef(uint32_t ref) const {
  for (const SimInterface& i : interfaces_) {
    if (i.ref == ref) return &i;
  }
  return nullptr;
}

const SimDevice* Hardware::deviceByRef(uint32_t ref) const {
  for (const SimDevice& d : devices_) {
    if (d.ref == ref) return &d;
  }
  return nullptr;
}

}  // namespace tarvix
