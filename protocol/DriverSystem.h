// The driver library's system object as the hardware listing uses it; a seam for tests.
#pragma once

#include <cstdint>

namespace nKV_DLL300 {

// The three system operations of the driver library. Implementations must allow calls from the
// service thread while sessions use the driver in other threads.
class DriverSystem {
 public:
  virtual ~DriverSystem() = default;
  virtual int32_t SystemOpen(uint32_t& system) = 0;
  virtual int32_t SystemClose(uint32_t system) = 0;
  virtual int32_t GetProperty(uint32_t reference, uint32_t propertyId, uint32_t size,
                              void* value) = 0;
};

// The driver library the module links (libtarvix.so); lives as long as the process.
DriverSystem& TarvixDriverSystem();

}  // namespace nKV_DLL300
