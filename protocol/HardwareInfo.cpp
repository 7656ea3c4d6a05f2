// Listing the driver's devices and interfaces into hardware records.
#include "protocol/HardwareInfo.h"

#include <cstring>

#include "bus/CBusSystem.h"
#include "hostlink/HostConnection.h"
#include "hostlink/MessageHeader.h"
#include "hostlink/SendReply.h"

namespace nKV_DLL300 {

namespace {

constexpr size_t kMaxDevices = 64;
constexpr size_t kMaxInterfaces = 16;

// Fills one record from the interface; a negative driver status or 0.
int32_t ReadInterfaceRecord(DriverSystem& driver, uint32_t interfaceRef, HardwareRecord& record) {
  std::memset(&record, 0, sizeof record);
  int32_t status = driver.GetProperty(interfaceRef, kPropertyInterfaceName, 16, record.name);
  if (status < 0) return status;
  // Only the first four bytes of the port value are defined; the rest of its room is dropped
  // so the record's later fields hold nothing but what is read for them.
  uint8_t port[16] = {};
  status = driver.GetProperty(interfaceRef, kPropertyInterfacePort, sizeof port, port);
  if (status < 0) return status;
  std::memcpy(&record.port, port, sizeof record.port);
  status = driver.GetProperty(interfaceRef, kPropertyInterfaceProtocol, 4, &record.protocol);
  if (status < 0) return status;
  if (record.protocol == 0) {
    status = driver.GetProperty(interfaceRef, kPropertyInterfaceCan, 4, &record.canProperty);
    if (status < 0) return status;
  }
  return 0;
}

// Lists the interfaces of one device into `table`; 0 or the failing status.
int32_t ListDevice(DriverSystem& driver, uint32_t deviceRef, std::vector<HardwareRecord>& table) {
  uint32_t interfaces[kMaxInterfaces] = {};
  int32_t status =
      driver.GetProperty(deviceRef, kPropertyInterfaceRefs, sizeof interfaces, interfaces);
  if (status != 0) return status;
  for (size_t i = 0; i < kMaxInterfaces && interfaces[i] != 0; ++i) {
    HardwareRecord record;
    status = ReadInterfaceRecord(driver, interfaces[i], record);
    if (status < 0) return status;
    table.push_back(record);
  }
  return 0;
}

}  // namespace

int32_t readDriverVersion(DriverSystem& driver, uint32_t (&version)[kDriverVersionCount]) {
  uint32_t system = 0;
  int32_t status = driver.SystemOpen(system);
  for (size_t i = 0; i < kDriverVersionCount && status >= 0; ++i) {
    status = driver.GetProperty(system, kDriverVersionIds[i], 4, &version[i]);
  }
  if (status < 0) {
    for (uint32_t& value : version) value = 0;
    driver.SystemClose(system);
    return status;
  }
  return driver.SystemClose(system);
}

int32_t buildHardwareTable(DriverSystem& driver, std::vector<HardwareRecord>& table) {
  table.clear();
  uint32_t system = 0;
  int32_t status = driver.SystemOpen(system);
  if (status < 0) {
    driver.SystemClose(system);
    return status;
  }
  uint32_t devices[kMaxDevices] = {};
  status = driver.GetProperty(system, kPropertyDeviceRefs, sizeof devices, devices);
  for (size_t i = 0; status == 0 && i < kMaxDevices && devices[i] != 0; ++i) {
    status = ListDevice(driver, devices[i], table);
  }
  if (status != 0) {
    driver.SystemClose(system);
    return status;
  }
  return driver.SystemClose(system);
}

int32_t SendHardwareInfo(HostConnection& connection) {
  const void* records =
      connection.hardwareTable.empty() ? nullptr : connection.hardwareTable.data();
  SendReply(connection, records, connection.session.get(), kMessageHardwareTable,
            static_cast<uint32_t>(connection.hardwareCount * sizeof(HardwareRecord)));
  return 0;
}

}  // namespace nKV_DLL300
