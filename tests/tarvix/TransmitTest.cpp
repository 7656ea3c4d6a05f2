// Output sessions as only the driver shows them (sends, echo and J1939 claims are tested over TCP):
// cyclic spacing, write checks, a send that never completes, a taken J1939 address.
#include <gtest/gtest.h>

#include "driver/FrameTypes.h"
#include "driver/Properties.h"
#include "tests/tarvix/TarvixTestSupport.h"

namespace tarvix::test {
namespace {

class TransmitTest : public TarvixTest {
 protected:
  // The database a CAN session builds for its transmit frame, and an output session on CAN3.
  kxRef OpenOutput(uint32_t mode, uint32_t timingType, double cyclicRate,
                   uint32_t identifier = 0x155) {
    EXPECT_EQ(kxdbOpenDatabase(":memory42", &db_), 0);
    kxRef cluster = 0;
    kxRef frame = 0;
    EXPECT_EQ(kxdbCreateObject(db_, driver::kClassCluster, "Cluster", &cluster), 0);
    EXPECT_EQ(kxdbSetProperty(cluster, driver::kPropClusterBaudRate, 8, &kRate), 0);
    EXPECT_EQ(kxdbCreateObject(cluster, driver::kClassFrame, "TxFrame", &frame), 0);
    const uint32_t length = 4;
    EXPECT_EQ(kxdbSetProperty(frame, driver::kPropFrameIdentifier, 4, &identifier), 0);
    EXPECT_EQ(kxdbSetProperty(frame, driver::kPropFramePayloadLength, 4, &length), 0);
    EXPECT_EQ(kxdbSetProperty(frame, driver::kPropFrameTimingType, 4, &timingType), 0);
    EXPECT_EQ(kxdbSetProperty(frame, driver::kPropFrameCyclicRate, 8, &cyclicRate), 0);
    kxRef out = 0;
    EXPECT_EQ(kxCreateSession(":memory42", "Cluster", "TxFrame", "CAN3", mode, &out), 0);
    EXPECT_EQ(Set<uint64_t>(out, driver::kPropBaudRate, kRate), 0);
    return out;
  }

  static std::vector<uint8_t> Record(uint8_t first, uint8_t length = 4) {
    std::vector<uint8_t> r(24, 0);
    r[15] = length;
    r[16] = first;
    return r;
  }

  static constexpr uint64_t kRate = 500000;
  kxRef db_ = 0;
};

TEST_F(TransmitTest, SinglePointCyclicFrameRepeatsAtItsRate) {
  const kxRef rx = Open(driver::kDatabaseSubordinate, "CAN4");
  const kxRef out = OpenOutput(driver::kModeOutputSinglePoint, driver::kTimingCyclicData, 0.01);
  const auto r = Record(0x42);
  ASSERT_EQ(kxWriteFrame(out, r.data(), 24, 10.0), 0);
  const auto frames = ReadUntil(rx, [](const auto& f) { return f.size() >= 5; });
  ASSERT_GE(frames.size(), 5u);
  for (size_t i = 1; i < frames.size(); ++i) {
    EXPECT_EQ(frames[i].timestamp - frames[i - 1].timestamp, 100000u) << "10 ms in 100 ns units";
  }
  ASSERT_EQ(kxStop(out, driver::kScopeNormal), 0);
}

TEST_F(TransmitTest, WritesAreCheckedAgainstTheSession) {
  const kxRef rx = Open(driver::kDatabaseSubordinate, "CAN4");
  const kxRef out = OpenOutput(driver::kModeOutputQueued, driver::kTimingEventData, 0.0);
  const auto r = Record(1);
  EXPECT_EQ(kxWriteFrame(rx, r.data(), 24, 10.0), driver::kWrongSessionMode);
  EXPECT_EQ(kxWriteFrame(out, r.data(), 23, 10.0), driver::kInvalidFrame);
  auto tooLong = Record(1, 9);
  tooLong.resize(32, 0);
  EXPECT_EQ(kxWriteFrame(out, tooLong.data(), 32, 10.0), driver::kInvalidFrame)
      << "classic frames hold 8 bytes";
  uint8_t buffer[64];
  uint32_t bytes = 0;
  EXPECT_EQ(kxReadFrame(out, buffer, sizeof buffer, 0.0, &bytes), driver::kWrongSessionMode);
  EXPECT_EQ(kxWait(rx, driver::kWaitTransmitComplete, 0, 0.0, nullptr), driver::kWrongSessionMode);
  EXPECT_EQ(kxWait(out, 0x8003, 0, 0.0, nullptr), driver::kInvalidCondition);
}

TEST_F(TransmitTest, OutputAtTheWrongRateNeverCompletes) {
  const kxRef out = OpenOutput(driver::kModeOutputQueued, driver::kTimingEventData, 0.0);
  ASSERT_EQ(Set<uint64_t>(out, driver::kPropBaudRate, 250000), 0);
  const auto r = Record(1);
  ASSERT_EQ(kxWriteFrame(out, r.data(), 24, 10.0), 0);
  EXPECT_EQ(kxWait(out, driver::kWaitTransmitComplete, 0, 0.05, nullptr), driver::kWaitTimeout);
}

class J1939Test : public TarvixTest {
 protected:
  kxRef Claimant(const char* interfaceName, uint32_t address) {
    const kxRef s = Open(driver::kDatabaseSubordinateJ1939, interfaceName);
    EXPECT_EQ(Set<uint64_t>(s, driver::kPropJ1939NodeName, 0x1234567890ULL + address), 0);
    EXPECT_EQ(Set<uint32_t>(s, driver::kPropJ1939NodeAddress, address), 0);
    return s;
  }
  static uint32_t Claimed(kxRef s) {
    uint32_t a = 0;
    EXPECT_EQ(kxGetProperty(s, driver::kPropJ1939NodeAddress, 4, &a), 0);
    return a;
  }
  static bool WaitClaimed(kxRef s) {
    const auto deadline = std::chrono::steady_clock::now() + kDeadline;
    while (Claimed(s) >= driver::kJ1939NullAddress && std::chrono::steady_clock::now() < deadline) {
      std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    return Claimed(s) < driver::kJ1939NullAddress;
  }
};

TEST_F(J1939Test, FreeAddressIsClaimedAndTakenAddressStaysUnclaimed) {
  const kxRef first = Claimant("CAN3", 0x80);
  ASSERT_TRUE(WaitClaimed(first));
  EXPECT_EQ(Claimed(first), 0x80u);
  const kxRef second = Claimant("CAN4", 0x80);
  const kxRef third = Claimant("CAN4", 0x81);
  ASSERT_TRUE(WaitClaimed(third)) << "claimed after the second one began";
  EXPECT_EQ(Claimed(second), driver::kJ1939NullAddress);
}

}  // namespace
}  // namespace tarvix::test
