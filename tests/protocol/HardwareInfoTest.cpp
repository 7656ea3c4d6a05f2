// Listing the driver's devices into hardware records and reading its version values (the default
// hardware's table is checked over TCP).
#include <gtest/gtest.h>

#include <cstring>

#include "protocol/HardwareInfo.h"
#include "tests/support/FakeDriverSystem.h"

namespace nKV_DLL300 {
namespace {

using kvtest::FakeDriverSystem;
using kvtest::FakeInterface;

constexpr int32_t kDriverError = static_cast<int32_t>(0xBFF63008);

std::string NameOf(const HardwareRecord& record) {
  return std::string(record.name, strnlen(record.name, sizeof record.name));
}

TEST(HardwareInfoTest, TwoDevicesOfTwoInterfacesListTheFirstDeviceFirstAndNoneGiveNoRecords) {
  FakeDriverSystem driver;
  std::vector<HardwareRecord> table(3);
  EXPECT_EQ(buildHardwareTable(driver, table), 0);
  EXPECT_TRUE(table.empty());
  driver.devices = {{{"A1", 1, 0, 0}, {"A2", 2, 0, 0}}, {{"B1", 1, 0, 0}, {"B2", 2, 0, 0}}};
  EXPECT_EQ(buildHardwareTable(driver, table), 0);
  const char* names[] = {"A1", "A2", "B1", "B2"};
  ASSERT_EQ(table.size(), std::size(names));
  for (size_t i = 0; i < table.size(); ++i) EXPECT_EQ(NameOf(table[i]), names[i]);
}

TEST(HardwareInfoTest, NonCanInterfaceHasZeroAtOffset24AndNoNoiseAfterThePort) {
  FakeDriverSystem driver;
  driver.devices = {{{"LIN1", 1, 2, 77}}};
  std::vector<HardwareRecord> table;
  ASSERT_EQ(buildHardwareTable(driver, table), 0);
  ASSERT_EQ(table.size(), 1u);
  uint8_t bytes[sizeof(HardwareRecord)];
  std::memcpy(bytes, &table[0], sizeof bytes);
  EXPECT_EQ(table[0].protocol, 2u);
  for (size_t offset = 24; offset < sizeof bytes; ++offset) EXPECT_EQ(bytes[offset], 0) << offset;
}

// A failing interface part way, or a failing system open, leaves no records and the status.
TEST(HardwareInfoTest, DriverFailureGivesAnEmptyTableAndItsStatus) {
  for (bool failOpen : {false, true}) {
    FakeDriverSystem driver = FakeDriverSystem::DefaultHardware();
    if (failOpen)
      driver.failOpenStatus = kDriverError;
    else
      driver.failingProperties[0x00130007] = kDriverError;  // the first CAN interface fails
    std::vector<HardwareRecord> table(2);
    EXPECT_EQ(buildHardwareTable(driver, table), kDriverError) << failOpen;
    EXPECT_TRUE(table.empty()) << failOpen;
    EXPECT_EQ(driver.openCount, driver.closeCount) << failOpen;
  }
}

TEST(HardwareInfoTest, VersionValuesAreReadInOrderAndZeroedOnFailure) {
  FakeDriverSystem driver = FakeDriverSystem::DefaultHardware();
  uint32_t version[kDriverVersionCount] = {};
  EXPECT_EQ(readDriverVersion(driver, version), 0);
  const uint32_t expected[] = {21, 5, 0, 3, 0x15503000};
  for (size_t i = 0; i < kDriverVersionCount; ++i) EXPECT_EQ(version[i], expected[i]) << i;

  driver.failingProperties[0x0011000A] = kDriverError;
  EXPECT_EQ(readDriverVersion(driver, version), kDriverError);
  for (uint32_t value : version) EXPECT_EQ(value, 0u);
  EXPECT_EQ(driver.openCount, driver.closeCount);
}

}  // namespace
}  // namespace nKV_DLL300
