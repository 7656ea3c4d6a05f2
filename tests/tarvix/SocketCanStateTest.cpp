// Interfaces bound to SocketCAN devices where no device is: the CAN state word (error frames, the
// device's own report, a device that is down or gone) and sessions on a lost bus. Their traffic is
// tested inside user-mode Linux (tests/socketcan); these run everywhere, sanitizer builds too.
#include <gtest/gtest.h>
#include <linux/can.h>
#include <linux/can/error.h>

#include <future>
#include <vector>

#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/States.h"
#include "driver/Status.h"
#include "driver/tarvix.h"
#include "tarvix/TarvixControl.h"
#include "tarvix/socketcan/BusState.h"

namespace tarvix::test {
namespace {

WireFrame Error(uint32_t errorClass, std::vector<std::pair<int, uint8_t>> bytes = {}) {
  WireFrame f;
  f.canId = CAN_ERR_FLAG | errorClass;
  f.length = CAN_ERR_DLC;
  for (auto [at, value] : bytes) f.data[at] = value;
  return f;
}

uint32_t Word(uint32_t comm, uint32_t lastError, uint32_t tx, uint32_t rx) {
  return comm | lastError << 8 | tx << 16 | rx << 24;
}

TEST(SocketCanStateTest, StateWordFollowsErrorFramesUnlessTheDeviceReportsItsOwn) {
  const DeviceReport up{true, true};
  DeviceReport passive = up;
  passive.hasState = true;
  passive.canState = 2;  // CAN_STATE_ERROR_PASSIVE
  passive.hasCounters = true;
  passive.txErrors = 130;
  passive.rxErrors = 7;
  DeviceReport sleeping = up;
  sleeping.hasState = true;
  sleeping.canState = 5;  // CAN_STATE_SLEEPING
  const struct {
    const char* what;
    std::vector<WireFrame> frames;
    bool started;
    DeviceReport device;
    uint32_t word;
  } cases[] = {
      {"stopped", {}, false, up, Word(driver::kCanCommStopped, 0, 0, 0)},
      {"passive",
       {Error(CAN_ERR_CRTL, {{1, CAN_ERR_CRTL_RX_PASSIVE}})},
       true,
       up,
       Word(driver::kCanCommErrorPassive, 0, 0, 0)},
      {"active again",
       {Error(CAN_ERR_CRTL, {{1, CAN_ERR_CRTL_TX_PASSIVE}}),
        Error(CAN_ERR_CRTL, {{1, CAN_ERR_CRTL_ACTIVE}})},
       true,
       up,
       Word(driver::kCanCommErrorActive, 0, 0, 0)},
      {"counters and stuff error",
       {Error(CAN_ERR_PROT | CAN_ERR_CNT, {{2, CAN_ERR_PROT_STUFF}, {6, 90}, {7, 3}})},
       true,
       up,
       Word(driver::kCanCommErrorActive, driver::kCanLastErrorStuff, 90, 3)},
      {"no acknowledge",
       {Error(CAN_ERR_ACK)},
       true,
       up,
       Word(driver::kCanCommErrorActive, driver::kCanLastErrorAck, 0, 0)},
      {"bus off, restarted",
       {Error(CAN_ERR_BUSOFF), Error(CAN_ERR_RESTARTED)},
       true,
       up,
       Word(driver::kCanCommErrorActive, 0, 0, 0)},
      {"device down", {}, true, DeviceReport{true, false}, Word(driver::kCanCommBusOff, 0, 0, 0)},
      {"device gone", {}, true, DeviceReport{}, Word(driver::kCanCommBusOff, 0, 0, 0)},
      {"device's own state and counters",
       {Error(CAN_ERR_BUSOFF)},
       true,
       passive,
       Word(driver::kCanCommErrorPassive, 0, 130, 7)},
      {"device asleep", {}, true, sleeping, Word(driver::kCanCommErrorActive, 0, 0, 0) | 1u << 5},
  };
  for (const auto& c : cases) {
    BusState state;
    for (const WireFrame& f : c.frames) state.observe(f);
    EXPECT_EQ(state.word(c.started, c.device), c.word) << c.what;
  }
}

// CAN9 on a device this machine does not have.
constexpr const char* kMissingDevice = R"({"devices": [{"name": "SocketCAN", "interfaces": [
    {"name": "CAN9", "device": "kvnone0", "port": 9}]}]})";

TEST(SocketCanStateTest, SessionsOnAMissingDeviceRunOnALostBus) {
  std::string error;
  ASSERT_TRUE(LoadConfiguration(kMissingDevice, "", &error)) << error;
  kxRef receive = 0;
  ASSERT_EQ(
      kxCreateSession(driver::kDatabaseCan, "", "", "CAN9", driver::kModeReceiveStream, &receive),
      driver::kSuccess);
  ASSERT_EQ(kxStart(receive, driver::kScopeNormal), driver::kSuccess);
  uint32_t state = 0;
  ASSERT_EQ(kxReadState(receive, driver::kStateCan, sizeof state, &state, nullptr), 0);
  EXPECT_EQ(state & 0xF, driver::kCanCommBusOff);
  uint8_t buffer[64];
  uint32_t bytes = 1;
  EXPECT_EQ(kxReadFrame(receive, buffer, sizeof buffer, 0.0, &bytes), driver::kReadTimeout);
  EXPECT_EQ(bytes, 0u);
  // A read that waits without limit ends when its session is cleared.
  auto waiting = std::async(std::launch::async, [&] {
    uint32_t none = 0;
    return kxReadFrame(receive, buffer, sizeof buffer, -1.0, &none);
  });
  EXPECT_EQ(kxClear(receive), driver::kSuccess);
  ASSERT_EQ(waiting.wait_for(std::chrono::seconds(30)), std::future_status::ready);
  EXPECT_EQ(waiting.get(), driver::kInvalidReference);
  ResetToDefaults();
}

}  // namespace
}  // namespace tarvix::test
