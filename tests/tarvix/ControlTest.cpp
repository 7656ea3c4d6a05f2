// The test-control interface: injected statuses and resets (recording is used by every over-TCP
// test).
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
