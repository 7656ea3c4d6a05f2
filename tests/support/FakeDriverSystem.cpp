// References: system 1, device 0x100 * (d + 1), interface device + i + 1.
#include "tests/support/FakeDriverSystem.h"

#include <cstring>

namespace kvtest {

namespace {

constexpr uint32_t kSystemRef = 1;

void PutWord(void* value, uint32_t size, uint32_t word) {
  std::memset(value, 0, size);
  std::memcpy(value, &word, size < 4 ? size : 4);
}

}  // namespace

FakeDriverSystem FakeDriverSystem::DefaultHardware() {
  FakeDriverSystem driver;
  driver.devices = {
      {{"CAN1", 1, 0, 0},
       {"CAN2", 2, 0, 0},
       {"CAN3", 3, 0, 1},
       {"CAN4", 4, 0, 1},
       {"CAN5", 5, 0, 1},
       {"CAN6", 6, 0, 1}},
      {{"LIN1", 1, 2, 0}, {"LIN2", 2, 2, 0}},
      {{"FlexRay1", 1, 1, 0}, {"FlexRay2", 2, 1, 0}},
  };
  return driver;
}

int32_t FakeDriverSystem::SystemOpen(uint32_t& system) {
  ++openCount;
  system = failOpenStatus < 0 ? 0 : kSystemRef;
  return failOpenStatus;
}

int32_t FakeDriverSystem::SystemClose(uint32_t) {
  ++closeCount;
  return 0;
}

int32_t FakeDriverSystem::GetProperty(uint32_t reference, uint32_t propertyId, uint32_t size,
                                      void* value) {
  if (auto failing = failingProperties.find(propertyId); failing != failingProperties.end()) {
    return failing->second;
  }
  if (reference == kSystemRef) {
    if (propertyId == 0x06110002) {
      std::memset(value, 0, size);
      auto* refs = static_cast<uint32_t*>(value);
      for (size_t d = 0; d < devices.size() && d < size / 4; ++d) refs[d] = 0x100 * uint32_t(d + 1);
      return 0;
    }
    const uint32_t ids[5] = {0x00110008, 0x00110009, 0x0011000B, 0x0011000A, 0x00110006};
    for (size_t i = 0; i < 5; ++i) {
      if (propertyId == ids[i]) {
        PutWord(value, size, versionValues[i]);
        return 0;
      }
    }
    return -1074384896;  // unknown property
  }
  size_t device = reference / 0x100 - 1;
  if (device >= devices.size()) return -1074384895;
  if (reference % 0x100 == 0 && propertyId == 0x06120002) {
    std::memset(value, 0, size);
    auto* refs = static_cast<uint32_t*>(value);
    for (size_t i = 0; i < devices[device].size() && i < size / 4; ++i)
      refs[i] = reference + uint32_t(i + 1);
    return 0;
  }
  size_t index = reference % 0x100 - 1;
  if (index >= devices[device].size()) return -1074384895;
  const FakeInterface& interface = devices[device][index];
  switch (propertyId) {
    case 0x03130002:
      std::memset(value, 0, size);
      std::memcpy(value, interface.name.data(),
                  interface.name.size() < size ? interface.name.size() : size);
      return 0;
    case 0x00130003:
      std::memset(value, 0xEE, size);  // room beyond the port word is filled with noise
      PutWord(value, 4, interface.port);
      return 0;
    case 0x00130005:
      PutWord(value, size, interface.protocol);
      return 0;
    case 0x00130007:
      PutWord(value, size, interface.canProperty);
      return 0;
    default:
      return -1074384896;
  }
}

}  // namespace kvtest
