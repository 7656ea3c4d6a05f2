// The test-control interface: injected statuses and the recorded call sequence.
#include <gtest/gtest.h>

#include "driver/Properties.h"
#include "tests/tarvix/TarvixTestSupport.h"

namespace tarvix::test {
namespace {

using ControlTest = TarvixTest;

constexpr kxStatus kInjected = driver::StatusCode(0xBFF63099);

TEST_F(ControlTest, OnceFaultHitsTheNextMatchingCallOnlyAndMakesNoSession) {
  InjectStatus("kxStart", "CAN1", kInjected, false);
  const kxRef other = Open(driver::kDatabaseCan, "CAN2");
  EXPECT_EQ(kxStart(other, 0), 0) << "another interface";
  const kxRef s = Open(driver::kDatabaseCan, "CAN1@qv_corle_tarvix");
  EXPECT_EQ(kxStart(s, 0), kInjected);
  EXPECT_EQ(kxStart(s, 0), 0);
  InjectStatus("kxCreateSession", "CAN3", kInjected, false);
  kxRef created = 0;
  EXPECT_EQ(kxCreateSession(":can:", "", "", "CAN3@x", 6, &created), kInjected);
  EXPECT_EQ(created, 0u) << "no session is made";
}

TEST_F(ControlTest, AlwaysFaultStaysUntilCleared) {
  InjectStatus("kxReadFrame", "", kInjected, true);
  const kxRef s = Open(driver::kDatabaseSubordinate, "LIN1");
  uint8_t buffer[48];
  uint32_t bytes = 5;
  for (int i = 0; i < 3; ++i)
    EXPECT_EQ(kxReadFrame(s, buffer, sizeof buffer, 0.0, &bytes), kInjected);
  ClearInjections();
  EXPECT_NE(kxReadFrame(s, buffer, sizeof buffer, 0.0, &bytes), kInjected);
}

TEST_F(ControlTest, RecordingKeepsOperationsArgumentsAndResults) {
  StartRecording();
  const kxRef s = Open(driver::kDatabaseCan, "CAN1@qv_corle_tarvix");
  ASSERT_EQ(kxStop(s, driver::kScopeInterfaceOnly), 0);
  ASSERT_EQ(Set<uint64_t>(s, driver::kPropBaudRate, 500000), 0);
  ASSERT_EQ(kxSetProperty(s, driver::kPropBusErrorFrames, 2, kErrorsOn), 0);
  EXPECT_EQ(Set<uint32_t>(s, 0x12345678, 1), driver::kUnknownProperty);
  StopRecording();
  EXPECT_EQ(kxClear(s), 0);
  const auto calls = RecordedCalls();
  ASSERT_EQ(calls.size(), 5u) << "the clear came after recording stopped";
  EXPECT_EQ(calls[0].operation, "kxCreateSession");
  EXPECT_EQ(calls[0].texts, (std::vector<std::string>{":can:", "", "", "CAN1@qv_corle_tarvix"}));
  EXPECT_EQ(calls[0].id, driver::kModeReceiveStream);
  EXPECT_EQ(calls[0].result, s);
  EXPECT_EQ(calls[0].interfaceName, "CAN1");
  EXPECT_EQ(calls[1].operation, "kxStop");
  EXPECT_EQ(calls[1].id, driver::kScopeInterfaceOnly);
  EXPECT_EQ(calls[2].id, driver::kPropBaudRate);
  EXPECT_EQ(calls[2].size, 8u);
  EXPECT_EQ(calls[2].reference, s);
  EXPECT_EQ(calls[3].value, (std::vector<uint8_t>{1, 0}));
  EXPECT_EQ(calls[4].status, driver::kUnknownProperty);
  EXPECT_EQ(calls[4].interfaceName, "CAN1");
}

TEST_F(ControlTest, ResetClosesSessionsAndRestoresDefaults) {
  const kxRef s = Open(driver::kDatabaseCan, "CAN1");
  Load(R"({"versions":{"major":9}})");
  EXPECT_EQ(kxStart(s, 0), driver::kInvalidReference) << "a reload closes every session";
  EXPECT_EQ(SystemValue(driver::kPropSystemVersionMajor), 9u);
  ResetToDefaults();
  EXPECT_EQ(SystemValue(driver::kPropSystemVersionMajor), 21u);
}

}  // namespace
}  // namespace tarvix::test
