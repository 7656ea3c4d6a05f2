// Interfaces bound to SocketCAN devices: the checks of the hardware description and the short form
// of the environment (TARVIX_SOCKETCAN). Pure text handling: no device is looked at here.
#pragma once

#include <string>
#include <string_view>

#include "tarvix/HardwareConfig.h"

namespace tarvix {

// The environment variable of the short form.
inline constexpr const char* kSocketCanVariable = "TARVIX_SOCKETCAN";
// The device the short form adds, after the described hardware.
inline constexpr const char* kSocketCanDeviceName = "SocketCAN";

// A Linux network device name: 1 to 15 characters, none of them '/', ':' or white space, and not
// "." or "..". False with the reason otherwise.
bool ValidDeviceName(std::string_view name, std::string& why);

// Adds the devices of the short form `list` to `config`: items separated by commas or blanks,
// each "DEVICE" or "NAME=DEVICE" ("can0", "CAN9=vcan0"). An unnamed item gets the name CANn and
// port n, n counting on from the highest CANn the hardware has. The interfaces join one device
// named SocketCAN at the end of the device list. False with the reason for a malformed item, a
// name taken twice or more than 16 items; `config` is then unchanged.
bool AddShortFormDevices(std::string_view list, HardwareConfig& config, std::string& error);

}  // namespace tarvix
