// A driver system object in memory: devices with interfaces, version values, injected failures.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "protocol/DriverSystem.h"

namespace kvtest {

struct FakeInterface {
  std::string name;
  uint32_t port = 0;
  uint32_t protocol = 0;
  uint32_t canProperty = 0;
};

// Thread-safe for the service thread's use alone (tests configure it before the service starts).
class FakeDriverSystem : public nKV_DLL300::DriverSystem {
 public:
  // The controller's default hardware: three devices with ten interfaces, driver 21.5.0.3.
  static FakeDriverSystem DefaultHardware();

  std::vector<std::vector<FakeInterface>> devices;
  uint32_t versionValues[5] = {21, 5, 0, 3, 0x15503000};
  // Property id -> status returned for it (on every reference), replacing the read.
  std::map<uint32_t, int32_t> failingProperties;
  // Status of SystemOpen (0: it succeeds).
  int32_t failOpenStatus = 0;

  int32_t SystemOpen(uint32_t& system) override;
  int32_t SystemClose(uint32_t system) override;
  int32_t GetProperty(uint32_t reference, uint32_t propertyId, uint32_t size, void* value) override;

  int32_t openCount = 0;
  int32_t closeCount = 0;
};

}  // namespace kvtest
