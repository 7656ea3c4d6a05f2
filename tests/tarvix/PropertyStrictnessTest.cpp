// Property ids and sizes are checked against the kind of session; interface settings have rules.
#include <gtest/gtest.h>

#include <cstring>

#include "driver/Properties.h"
#include "tests/tarvix/TarvixTestSupport.h"

namespace tarvix::test {
namespace {

using PropertyStrictnessTest = TarvixTest;

struct PropertyCase {
  const char* database;
  const char* cluster;
  const char* interfaceName;
  uint32_t id;
  uint32_t size;
  kxStatus expected;
  uint64_t value = 0;  // zero unless given; the valid ones accept zero or check it (baud rate)
};

// Sizes for every session property on each kind of session, and values out of their range.
const PropertyCase kCases[] = {
    {":can:", "", "CAN1", driver::kPropBaudRate, 8, driver::kInvalidPropertyValue},  // 0 bit/s
    {":can:", "", "CAN1", driver::kPropBaudRate, 4, driver::kWrongPropertySize},
    {":can_fd_brs:", "", "CAN3", driver::kPropCanFdBaudRate, 8, 0},
    {":can_fd_brs:", "", "CAN3", driver::kPropCanFdBaudRate, 4, driver::kWrongPropertySize},
    {":can:", "", "CAN1", driver::kPropTermination, 4, 0},
    {":can:", "", "CAN1", driver::kPropTermination, 1, driver::kWrongPropertySize},
    {":can:", "", "CAN1", driver::kPropTransceiverType, 4, 0},
    {":can:", "", "CAN1", driver::kPropIsoFdMode, 4, 0},
    {":can:", "", "CAN1", driver::kPropListenOnly, 1, 0},
    {":can:", "", "CAN1", driver::kPropListenOnly, 4, driver::kWrongPropertySize},
    {":can:", "", "CAN1", driver::kPropEcho, 1, 0},
    {":can:", "", "CAN1", driver::kPropBusErrorFrames, 2, 0},
    {":can:", "", "CAN1", driver::kPropBusErrorFrames, 1, driver::kWrongPropertySize},
    {":can:", "", "CAN1", driver::kPropCanIoMode, 4, driver::kPropertyReadOnly},
    {":can:", "", "CAN1", driver::kPropLinChecksumFlag, 1, driver::kUnknownProperty},
    {":can:", "", "CAN1", driver::kPropJ1939NodeName, 8, driver::kUnknownProperty},
    {":can:", "", "CAN1", 0x00100999, 4, driver::kUnknownProperty},
    {":can_j1939:", "", "CAN1", driver::kPropJ1939NodeName, 8, 0},
    {":can_j1939:", "", "CAN1", driver::kPropJ1939NodeAddress, 8, driver::kWrongPropertySize},
    {":memory:", "", "LIN1", driver::kPropLinNoResponseFrames, 1, 0},
    {":memory:", "", "LIN1", driver::kPropLinChecksumFlag, 1, 0},
    {":memory:", "", "LIN1", driver::kPropBusErrorFrames, 2, 0},
    {":memory:", "", "LIN1", driver::kPropTermination, 4, driver::kUnknownProperty},
    {"SimDB", "FlexRay", "FlexRay1", driver::kPropFlexRayTermination, 4, 0},
    {"SimDB", "FlexRay", "FlexRay1", driver::kPropFlexRayNullFrames, 1, 0},
    {"SimDB", "FlexRay", "FlexRay1", driver::kPropKeySlot, 4, 0},
    {"SimDB", "FlexRay", "FlexRay1", driver::kPropKeySlot, 2, driver::kWrongPropertySize},
    {"SimDB", "FlexRay", "FlexRay1", driver::kPropBusErrorFrames, 2, driver::kUnknownProperty},
    {":can:", "", "CAN1", driver::kPropTransceiverType, 4, driver::kInvalidPropertyValue, 5},
    {":can:", "", "CAN1", driver::kPropTermination, 4, driver::kInvalidPropertyValue, 2},
    {":can:", "", "CAN1", driver::kPropBaudRate, 8, driver::kInvalidPropertyValue, 2000000},
    {":subordinate:", "", "CAN1", driver::kPropTermination, 4, driver::kSubordinateReadOnly, 1},
    {":subordinate:", "", "CAN1", driver::kPropEcho, 1, 0, 1},
};

TEST_F(PropertyStrictnessTest, EachIdHasItsSizeAndItsKindOfSession) {
  for (const PropertyCase& c : kCases) {
    kxRef s = 0;
    ASSERT_EQ(
        kxCreateSession(c.database, c.cluster, "", c.interfaceName, driver::kModeReceiveStream, &s),
        0);
    uint8_t bytes[8] = {};
    std::memcpy(bytes, &c.value, 8);
    EXPECT_EQ(kxSetProperty(s, c.id, c.size, bytes), c.expected)
        << c.database << " 0x" << std::hex << c.id << " size " << std::dec << c.size << " value "
        << c.value;
    EXPECT_EQ(kxClear(s), 0);
  }
}

TEST_F(PropertyStrictnessTest, InterfaceSettingsWaitForAStoppedSession) {
  const kxRef s = Open(driver::kDatabaseCan, "CAN1");
  EXPECT_EQ(Set<uint64_t>(s, driver::kPropBaudRate, 500000), 0) << "a new session is not started";
  ASSERT_EQ(kxStart(s, driver::kScopeNormal), 0);
  EXPECT_EQ(Set<uint64_t>(s, driver::kPropBaudRate, 250000), driver::kPropertyWhileRunning);
  EXPECT_EQ(Set<uint8_t>(s, driver::kPropEcho, 1), 0) << "session settings change while running";
  ASSERT_EQ(kxStop(s, driver::kScopeInterfaceOnly), 0);
  EXPECT_EQ(Set<uint64_t>(s, driver::kPropBaudRate, 250000), 0);
  uint64_t rate = 0;
  EXPECT_EQ(kxGetProperty(s, driver::kPropBaudRate, 8, &rate), 0);
  EXPECT_EQ(rate, 250000u);
  EXPECT_EQ(kxStart(s, 7), driver::kInvalidScope);
}

TEST_F(PropertyStrictnessTest, MissingValueAndClearedSessionReferenceAreRefused) {
  const kxRef s = Open(driver::kDatabaseCan, "CAN1");
  EXPECT_EQ(kxSetProperty(s, driver::kPropEcho, 1, nullptr), driver::kBufferMissing);
  ASSERT_EQ(kxClear(s), 0);
  EXPECT_EQ(Set<uint8_t>(s, driver::kPropEcho, 1), driver::kInvalidReference);
  EXPECT_EQ(kxClear(s), driver::kInvalidReference);
  EXPECT_EQ(kxStart(s, 0), driver::kInvalidReference);
}

}  // namespace
}  // namespace tarvix::test
