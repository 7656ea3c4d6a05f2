// Several threads use the driver at once, as the service thread and the poll threads do.
#include <gtest/gtest.h>

#include <atomic>
#include <thread>

#include "driver/Properties.h"
#include "driver/States.h"
#include "tests/tarvix/TarvixTestSupport.h"

namespace tarvix::test {
namespace {

class ConcurrencyTest : public TarvixTest {};

TEST_F(ConcurrencyTest, PollThreadsAndAServiceThreadShareTheDriver) {
  struct Poller {
    const char* interfaceName;
    uint32_t stateId;
    uint32_t stateSize;
  };
  const Poller pollers[] = {{"CAN1", driver::kStateCan, 4}, {"CAN2", driver::kStateCan, 4},
                            {"LIN1", driver::kStateLin, 8}, {"FlexRay1", driver::kStateFlexRay, 4}};
  std::atomic<int> finished{0};
  std::vector<std::thread> threads;
  for (const Poller& p : pollers) {
    threads.emplace_back([&finished, p] {
      const kxRef s = Open(driver::kDatabaseSubordinate, p.interfaceName);
      const auto frames = ReadUntil(s, [](const auto& f) { return f.size() >= 30; });
      EXPECT_GE(frames.size(), 30u) << p.interfaceName;
      uint8_t state[8] = {};
      uint32_t fault = 0;
      EXPECT_EQ(kxReadState(s, p.stateId, p.stateSize, state, &fault), 0);
      EXPECT_EQ(kxClear(s), 0);
      ++finished;
    });
  }
  // Meanwhile the service thread lists the hardware and opens and closes sessions.
  while (finished.load() < 4) {
    kxRef system = 0;
    ASSERT_EQ(kxSystemOpen(&system), 0);
    uint32_t devices[64] = {};
    EXPECT_EQ(kxGetProperty(system, driver::kPropSystemDevices, sizeof devices, devices), 0);
    EXPECT_EQ(kxSystemClose(system), 0);
    const kxRef s = Open(driver::kDatabaseSubordinate, "CAN1");
    EXPECT_EQ(Set<uint8_t>(s, driver::kPropEcho, 1), 0);
    EXPECT_EQ(kxClear(s), 0);
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }
  for (auto& t : threads) t.join();
}

}  // namespace
}  // namespace tarvix::test
