// One bus interface of the controller as the hardware table sends it to a host.
#pragma once

#include <cstddef>
#include <cstdint>

namespace nKV_DLL300 {

// Wire format, 44 bytes, little-endian (the module runs on little-endian machines only):
//
//   offset size field
//   0      16   interface name as the driver returns it, NUL-padded
//   16     4    interface property 0x00130003 (the port number)
//   20     4    interface property 0x00130005 (the protocol: 0 CAN, 1 FlexRay, 2 LIN)
//   24     4    interface property 0x00130007 for a CAN interface, else 0
//   28     16   zero
struct HardwareRecord {
  char name[16];
  uint32_t port;
  uint32_t protocol;
  uint32_t canProperty;
  uint8_t reserved[16];
};
static_assert(sizeof(HardwareRecord) == 44);
static_assert(offsetof(HardwareRecord, port) == 16);
static_assert(offsetof(HardwareRecord, protocol) == 20);
static_assert(offsetof(HardwareRecord, canProperty) == 24);
static_assert(offsetof(HardwareRecord, reserved) == 28);

// The five driver version values in the order the service reads them; the first four go into
// every message header.
constexpr size_t kDriverVersionCount = 5;

}  // namespace nKV_DLL300
