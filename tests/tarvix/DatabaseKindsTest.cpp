// The system object (versions, device and interface lists) and each kind of database: built-in,
// subordinate, named (SimDB) and in-memory, and their checks.
#include <gtest/gtest.h>

#include "driver/Properties.h"
#include "driver/Status.h"
#include "tests/tarvix/TarvixTestSupport.h"

namespace tarvix::test {
namespace {

using DatabaseKindsTest = TarvixTest;

struct OpenCase {
  const char* database;
  const char* cluster;
  const char* interfaceName;
  kxStatus status;
  uint32_t ioMode;    // read back when the session opens
  uint64_t baudRate;  // read back when the session opens
};

const OpenCase kOpenCases[] = {
    {":can:", "", "CAN1", 0, 0, 500000},
    {":can_fd:", "", "CAN3", 0, 1, 500000},
    {":can_fd_brs:", "", "CAN5", 0, 2, 500000},
    {":can_fd_brs:", "", "CAN1", driver::kInterfaceNotCapable, 0, 0},
    {":subordinate:", "", "CAN1", 0, 0, 500000},
    {":subordinate:", "", "CAN3", 0, 2, 500000},
    {":subordinate:", "", "CAN6", 0, 2, 500000},
    {":subordinate_j1939:", "", "CAN2", 0, 0, 500000},
    {":subordinate_j1939:", "", "LIN1", driver::kProtocolMismatch, 0, 0},
    {"SimDB", "Body", "CAN1@qv_corle_tarvix", 0, 0, 500000},
    {"SimDB", "FD", "CAN5", 0, 2, 500000},
    {"SimDB", "FD", "CAN1", driver::kInterfaceNotCapable, 0, 0},
    {"SimDB", "LIN", "LIN1", 0, 0, 19200},
    {"SimDB", "FlexRay", "FlexRay2", 0, 0, 10000000},
    {"SimDB", "LIN", "CAN1", driver::kProtocolMismatch, 0, 0},
    {"SimDB", "Gearbox", "CAN1", driver::kClusterNotFound, 0, 0},
    {"OtherDB", "Body", "CAN1", driver::kDatabaseNotFound, 0, 0},
    {":can:", "", "CAN9", driver::kInterfaceNotFound, 0, 0},
    {":memory:", "", "LIN2", 0, 0, 19200},
};

TEST_F(DatabaseKindsTest, SessionsOpenOnTheirDatabasesAndReportItsSettings) {
  for (const OpenCase& c : kOpenCases) {
    kxRef s = 0;
    ASSERT_EQ(
        kxCreateSession(c.database, c.cluster, "", c.interfaceName, driver::kModeReceiveStream, &s),
        c.status)
        << c.database << "/" << c.cluster << " on " << c.interfaceName;
    if (c.status != 0) continue;
    uint64_t rate = 0;
    EXPECT_EQ(kxGetProperty(s, driver::kPropBaudRate, 8, &rate), 0);
    EXPECT_EQ(rate, c.baudRate) << c.database << " on " << c.interfaceName;
    uint32_t ioMode = 99;
    if (kxGetProperty(s, driver::kPropCanIoMode, 4, &ioMode) == 0) {
      EXPECT_EQ(ioMode, c.ioMode) << c.database << " on " << c.interfaceName;
    }
    EXPECT_EQ(kxClear(s), 0);
  }
}

TEST_F(DatabaseKindsTest, InMemoryDatabaseHoldsClustersAndFrames) {
  kxRef db = 0;
  kxRef cluster = 0;
  kxRef frame = 0;
  ASSERT_EQ(kxdbOpenDatabase(":memory123", &db), 0);
  ASSERT_EQ(kxdbCreateObject(db, driver::kClassCluster, "Cluster", &cluster), 0);
  ASSERT_EQ(kxdbCreateObject(cluster, driver::kClassFrame, "TxFrame", &frame), 0);
  EXPECT_EQ(kxdbCreateObject(db, driver::kClassFrame, "Wrong", &frame), driver::kWrongObjectKind);
  EXPECT_EQ(kxdbCreateObject(cluster, driver::kClassFrame, "TxFrame", &frame), 0);
  const uint32_t id = 0x123;
  EXPECT_EQ(kxdbSetProperty(frame, driver::kPropFrameIdentifier, 4, &id), 0);
  const uint64_t wide = 0x123;
  EXPECT_EQ(kxdbSetProperty(frame, driver::kPropFrameIdentifier, 8, &wide),
            driver::kWrongPropertySize);
  EXPECT_EQ(kxdbSetProperty(frame, driver::kPropClusterBaudRate, 8, &wide),
            driver::kUnknownProperty);
  const double negative = -1.0;
  EXPECT_EQ(kxdbSetProperty(frame, driver::kPropFrameCyclicRate, 8, &negative),
            driver::kInvalidPropertyValue);
  const uint32_t fd = driver::kCanIoModeFdBrs;
  ASSERT_EQ(kxdbSetProperty(cluster, driver::kPropClusterCanIoMode, 4, &fd), 0);
  kxRef s = 0;
  EXPECT_EQ(
      kxCreateSession(":memory123", "Cluster", "TxFrame", "CAN1", driver::kModeOutputQueued, &s),
      driver::kInterfaceNotCapable);
  EXPECT_EQ(
      kxCreateSession(":memory123", "Cluster", "Missing", "CAN3", driver::kModeOutputQueued, &s),
      driver::kFrameNotFound);
  EXPECT_EQ(
      kxCreateSession(":memory123", "Cluster", "TxFrame", "CAN3", driver::kModeOutputQueued, &s),
      0);
  EXPECT_EQ(kxClear(s), 0);
  EXPECT_EQ(kxdbCloseDatabase(db, 0), 0);
  EXPECT_EQ(kxdbCloseDatabase(db, 0), driver::kInvalidReference);
  EXPECT_EQ(
      kxCreateSession(":memory123", "Cluster", "TxFrame", "CAN3", driver::kModeOutputQueued, &s),
      driver::kDatabaseNotFound);
}

using HardwareListingTest = TarvixTest;

TEST_F(HardwareListingTest, ListReadsCheckRoomReferencesAndTerminators) {
  kxRef system = 0;
  ASSERT_EQ(kxSystemOpen(&system), 0);
  uint32_t two[2] = {};
  EXPECT_EQ(kxGetProperty(system, driver::kPropSystemDevices, sizeof two, two),
            driver::kBufferTooSmall);
  uint32_t devices[64] = {};
  EXPECT_EQ(kxGetProperty(system, driver::kPropSystemDevices, 255, devices),
            driver::kWrongPropertySize);
  EXPECT_EQ(kxGetProperty(system, driver::kPropSystemDevices, sizeof devices, nullptr),
            driver::kBufferMissing);
  ASSERT_EQ(kxGetProperty(system, driver::kPropSystemDevices, sizeof devices, devices), 0);
  EXPECT_EQ(kxGetProperty(devices[0], driver::kPropSystemVersionMajor, 4, two),
            driver::kUnknownProperty);
  uint32_t word = 0;
  EXPECT_EQ(kxSetProperty(system, driver::kPropSystemVersionMajor, 4, &word),
            driver::kPropertyReadOnly);
  EXPECT_EQ(kxGetProperty(0x7777, driver::kPropSystemVersionMajor, 4, &word),
            driver::kInvalidReference);
  uint32_t interfaces[16] = {};
  ASSERT_EQ(kxGetProperty(devices[2], driver::kPropDeviceInterfaces, sizeof interfaces, interfaces),
            0);
  char name[16];
  EXPECT_EQ(kxGetProperty(interfaces[0], driver::kPropInterfaceName, 8, name),
            driver::kBufferTooSmall)
      << "FlexRay1 needs 9 bytes";
  EXPECT_EQ(kxGetProperty(interfaces[0], driver::kPropInterfaceName, 9, name), 0);
  EXPECT_STREQ(name, "FlexRay1");
  EXPECT_EQ(kxSystemClose(system), 0);
  EXPECT_EQ(kxSystemClose(system), driver::kInvalidReference) << "a closed system is gone";
}

}  // namespace
}  // namespace tarvix::test
