// The driver's version values and inventory of bus interfaces, and the reply that sends it.
#pragma once

#include <cstdint>
#include <vector>

#include "hostlink/HardwareRecord.h"
#include "protocol/DriverSystem.h"

namespace nKV_DLL300 {

class HostConnection;

// Driver property ids of the listing.
constexpr uint32_t kDriverVersionIds[kDriverVersionCount] = {0x00110008, 0x00110009, 0x0011000B,
                                                             0x0011000A, 0x00110006};
constexpr uint32_t kPropertyDeviceRefs = 0x06110002;     // 256 bytes: 64 device references
constexpr uint32_t kPropertyInterfaceRefs = 0x06120002;  // 64 bytes: 16 interface references
constexpr uint32_t kPropertyInterfaceName = 0x03130002;  // 16 bytes
constexpr uint32_t kPropertyInterfacePort = 0x00130003;  // read with 16 bytes of room
constexpr uint32_t kPropertyInterfaceProtocol = 0x00130005;
constexpr uint32_t kPropertyInterfaceCan = 0x00130007;

// Reads the five version values; on the first failure all five are 0 and that status is
// returned, else the status of closing the system.
int32_t readDriverVersion(DriverSystem& driver, uint32_t (&version)[kDriverVersionCount]);

// Replaces `table` with one record per interface, devices and interfaces in the driver's order.
// A failure part-way keeps the records completed before it and returns the driver's status;
// otherwise the status of closing the system.
int32_t buildHardwareTable(DriverSystem& driver, std::vector<HardwareRecord>& table);

// CMD_GET_HARDWARE_INFO: sends the connection's table as one type 7 message, no text reply.
int32_t SendHardwareInfo(HostConnection& connection);

}  // namespace nKV_DLL300
