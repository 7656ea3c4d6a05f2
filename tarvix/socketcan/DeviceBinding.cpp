// Interfaces bound to SocketCAN devices: name checks and the short form.
#include "tarvix/socketcan/DeviceBinding.h"

#include <algorithm>
#include <cctype>
#include <vector>

#include "driver/Properties.h"

namespace tarvix {
namespace {

constexpr size_t kMaxDeviceName = 15;  // IFNAMSIZ - 1
constexpr size_t kMaxInterfaceName = 15;
constexpr size_t kMaxInterfacesPerDevice = 16;

std::vector<std::string_view> Items(std::string_view list) {
  std::vector<std::string_view> items;
  size_t begin = 0;
  while (begin < list.size()) {
    const size_t end = std::min(list.find_first_of(", \t\n", begin), list.size());
    if (end > begin) items.push_back(list.substr(begin, end - begin));
    begin = end + 1;
  }
  return items;
}

// The n of an interface named "CANn", or 0.
uint32_t CanNumber(const std::string& name) {
  if (name.size() < 4 || name.size() > 12 || name.compare(0, 3, "CAN") != 0) return 0;
  uint32_t n = 0;
  for (size_t i = 3; i < name.size(); ++i) {
    if (!std::isdigit(static_cast<unsigned char>(name[i]))) return 0;
    n = n * 10 + static_cast<uint32_t>(name[i] - '0');
  }
  return n;
}

bool NameTaken(const HardwareConfig& config, const std::vector<InterfaceConfig>& added,
               const std::string& name) {
  auto same = [&name](const InterfaceConfig& i) { return i.name == name; };
  if (std::any_of(added.begin(), added.end(), same)) return true;
  return std::any_of(config.devices.begin(), config.devices.end(), [&](const DeviceConfig& d) {
    return std::any_of(d.interfaces.begin(), d.interfaces.end(), same);
  });
}

uint32_t HighestCanNumber(const HardwareConfig& config) {
  uint32_t highest = 0;
  for (const DeviceConfig& d : config.devices) {
    for (const InterfaceConfig& i : d.interfaces) highest = std::max(highest, CanNumber(i.name));
  }
  return highest;
}

bool ParseItem(std::string_view item, uint32_t& next, InterfaceConfig& out, std::string& error) {
  const size_t equals = item.find('=');
  std::string name;
  if (equals != std::string_view::npos) {
    name = std::string(item.substr(0, equals));
    item = item.substr(equals + 1);
  }
  if (!ValidDeviceName(item, error)) {
    error = "\"" + std::string(item) + "\": " + error;
    return false;
  }
  if (equals != std::string_view::npos &&
      (name.empty() || name.size() > kMaxInterfaceName || name.find('@') != std::string::npos)) {
    error = "\"" + name + "\": an interface name has 1 to 15 characters, no '@'";
    return false;
  }
  const uint32_t number = CanNumber(name);
  out.name = name.empty() ? "CAN" + std::to_string(next) : name;
  out.port = name.empty() ? next : (number != 0 ? number : next);
  if (name.empty() || number == 0 || number >= next) next = std::max(next, out.port) + 1;
  out.protocol = driver::kProtocolCan;
  out.device = std::string(item);
  return true;
}

}  // namespace

bool ValidDeviceName(std::string_view name, std::string& why) {
  if (name.empty() || name.size() > kMaxDeviceName) {
    why = "a device name has 1 to 15 characters";
    return false;
  }
  if (name == "." || name == ".." || std::any_of(name.begin(), name.end(), [](char c) {
        return c == '/' || c == ':' || std::isspace(static_cast<unsigned char>(c));
      })) {
    why = "not a network device name";
    return false;
  }
  return true;
}

bool AddShortFormDevices(std::string_view list, HardwareConfig& config, std::string& error) {
  const std::vector<std::string_view> items = Items(list);
  if (items.empty()) return true;
  if (items.size() > kMaxInterfacesPerDevice) {
    error = "at most 16 devices";
    return false;
  }
  DeviceConfig device{kSocketCanDeviceName, {}};
  uint32_t next = HighestCanNumber(config) + 1;
  for (std::string_view item : items) {
    InterfaceConfig i;
    if (!ParseItem(item, next, i, error)) return false;
    if (NameTaken(config, device.interfaces, i.name)) {
      error = "interface \"" + i.name + "\" is listed twice";
      return false;
    }
    device.interfaces.push_back(std::move(i));
  }
  config.devices.push_back(std::move(device));
  return true;
}

}  // namespace tarvix
