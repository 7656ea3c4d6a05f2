// The system object: version values, device and interface lists, interface properties.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "driver/Properties.h"
#include "driver/Status.h"
#include "tests/tarvix/TarvixTestSupport.h"

namespace tarvix::test {
namespace {

class HardwareListingTest : public TarvixTest {};

struct Listed {
  std::string name;
  uint32_t port;
  uint32_t protocol;
  uint32_t canFd;
};

// The listing a host's hardware table is built from: devices in order, interfaces in order.
std::vector<Listed> ListInterfaces() {
  std::vector<Listed> out;
  kxRef system = 0;
  EXPECT_EQ(kxSystemOpen(&system), 0);
  uint32_t devices[64] = {};
  EXPECT_EQ(kxGetProperty(system, driver::kPropSystemDevices, sizeof devices, devices), 0);
  for (uint32_t d = 0; d < 64 && devices[d] != 0; ++d) {
    uint32_t interfaces[16] = {};
    EXPECT_EQ(kxGetProperty(devices[d], driver::kPropDeviceInterfaces, sizeof interfaces, interfaces), 0);
    for (uint32_t i = 0; i < 16 && interfaces[i] != 0; ++i) {
      char name[16] = {};
      uint8_t port[16] = {};
      Listed l{};
      EXPECT_EQ(kxGetProperty(interfaces[i], driver::kPropInterfaceName, 16, name), 0);
      EXPECT_EQ(kxGetProperty(interfaces[i], driver::kPropInterfacePort, 16, port), 0);
      EXPECT_EQ(kxGetProperty(interfaces[i], driver::kPropInterfaceProtocol, 4, &l.protocol), 0);
      EXPECT_EQ(kxGetProperty(interfaces[i], driver::kPropInterfaceCanFd, 4, &l.canFd), 0);
      for (int b = 4; b < 16; ++b) EXPECT_EQ(port[b], 0) << "bytes after the port are zero";
      l.name = name;
      std::memcpy(&l.port, port, 4);
      out.push_back(l);
    }
  }
  EXPECT_EQ(kxSystemClose(system), 0);
  return out;
}

TEST_F(HardwareListingTest, DefaultHardwareListsTenInterfacesInDeviceOrder) {
  const std::vector<Listed> expected = {
      {"CAN1", 1, 0, 0},     {"CAN2", 2, 0, 0},     {"CAN3", 3, 0, 1}, {"CAN4", 4, 0, 1},
      {"CAN5", 5, 0, 1},     {"CAN6", 6, 0, 1},     {"LIN1", 1, 2, 0}, {"LIN2", 2, 2, 0},
      {"FlexRay1", 1, 1, 0}, {"FlexRay2", 2, 1, 0},
  };
  const std::vector<Listed> got = ListInterfaces();
  ASSERT_EQ(got.size(), expected.size());
  for (size_t i = 0; i < got.size(); ++i) {
    EXPECT_EQ(got[i].name, expected[i].name);
    EXPECT_EQ(got[i].port, expected[i].port) << got[i].name;
    EXPECT_EQ(got[i].protocol, expected[i].protocol) << got[i].name;
    EXPECT_EQ(got[i].canFd, expected[i].canFd) << got[i].name;
  }
}

TEST_F(HardwareListingTest, VersionValuesAreTheDefaults) {
  kxRef system = 0;
  ASSERT_EQ(kxSystemOpen(&system), 0);
  const std::pair<uint32_t, uint32_t> expected[] = {
      {driver::kPropSystemVersionMajor, 21}, {driver::kPropSystemVersionMinor, 5},
      {driver::kPropSystemVersionUpdate, 0}, {driver::kPropSystemVersionPhase, 3},
      {driver::kPropSystemVersionPacked, 0x15503000}};
  for (const auto& [id, value] : expected) {
    uint32_t got = 0xFFFFFFFF;
    EXPECT_EQ(kxGetProperty(system, id, 4, &got), 0);
    EXPECT_EQ(got, value) << std::hex << id;
  }
  EXPECT_EQ(kxSystemClose(system), 0);
  EXPECT_EQ(kxSystemClose(system), driver::kInvalidReference) << "a closed system is gone";
}

TEST_F(HardwareListingTest, ListReadsCheckRoomAndReferences) {
  kxRef system = 0;
  ASSERT_EQ(kxSystemOpen(&system), 0);
  uint32_t two[2] = {};
  EXPECT_EQ(kxGetProperty(system, driver::kPropSystemDevices, sizeof two, two), driver::kBufferTooSmall);
  uint32_t devices[64] = {};
  EXPECT_EQ(kxGetProperty(system, driver::kPropSystemDevices, 255, devices), driver::kWrongPropertySize);
  EXPECT_EQ(kxGetProperty(system, driver::kPropSystemDevices, sizeof devices, nullptr), driver::kBufferMissing);
  ASSERT_EQ(kxGetProperty(system, driver::kPropSystemDevices, sizeof devices, devices), 0);
  EXPECT_EQ(kxGetProperty(devices[0], driver::kPropSystemVersionMajor, 4, two), driver::kUnknownProperty);
  uint32_t word = 0;
  EXPECT_EQ(kxSetProperty(system, driver::kPropSystemVersionMajor, 4, &word), driver::kPropertyReadOnly);
  EXPECT_EQ(kxGetProperty(0x7777, driver::kPropSystemVersionMajor, 4, &word), driver::kInvalidReference);
  EXPECT_EQ(kxSystemClose(system), 0);
}

TEST_F(HardwareListingTest, InterfaceNameNeedsRoomForItsTerminator) {
  kxRef system = 0;
  ASSERT_EQ(kxSystemOpen(&system), 0);
  uint32_t devices[64] = {};
  ASSERT_EQ(kxGetProperty(system, driver::kPropSystemDevices, sizeof devices, devices), 0);
  uint32_t interfaces[16] = {};
  ASSERT_EQ(kxGetProperty(devices[2], driver::kPropDeviceInterfaces, sizeof interfaces, interfaces), 0);
  char name[16];
  EXPECT_EQ(kxGetProperty(interfaces[0], driver::kPropInterfaceName, 8, name), driver::kBufferTooSmall)
      << "FlexRay1 needs 9 bytes";
  EXPECT_EQ(kxGetProperty(interfaces[0], driver::kPropInterfaceName, 9, name), 0);
  EXPECT_STREQ(name, "FlexRay1");
  EXPECT_EQ(kxSystemClose(system), 0);
}

}  // namespace
}  // namespace tarvix::test
