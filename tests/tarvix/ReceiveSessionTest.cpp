// Receive sessions as only the driver shows them (what a host sees is tested over TCP): bus time,
// arbitration, undecodable frames, reads, the bounded queue, poll threads sharing the driver.
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>

#include "driver/FrameTypes.h"
#include "driver/Properties.h"
#include "driver/States.h"
#include "tests/tarvix/TarvixTestSupport.h"

namespace tarvix::test {
namespace {

using driver::kExtendedIdFlag;

using ReceiveSessionTest = TarvixTest;

TEST_F(ReceiveSessionTest, ReadsOnAQuietBusReturnAtOnceAndBadArgumentsAreRefused) {
  const kxRef s = Open(driver::kDatabaseSubordinate, "CAN3");
  uint8_t buffer[64];
  uint32_t bytes = 99;
  EXPECT_EQ(kxReadFrame(s, buffer, sizeof buffer, 0.0, &bytes), driver::kReadTimeout);
  EXPECT_EQ(bytes, 0u);
  EXPECT_EQ(kxReadFrame(s, buffer, sizeof buffer, 0.01, &bytes), driver::kReadTimeout);
  EXPECT_EQ(kxReadFrame(s, nullptr, sizeof buffer, 0.0, &bytes), driver::kBufferMissing);
  EXPECT_EQ(kxReadFrame(0x04FFFFFF, buffer, sizeof buffer, 0.0, &bytes), driver::kInvalidReference);
  uint64_t state = 0;
  uint32_t fault = 0;
  const kxRef lin = Open(driver::kDatabaseSubordinate, "LIN1");
  EXPECT_EQ(kxReadState(lin, driver::kStateLin, 4, &state, &fault), driver::kWrongStateSize);
  EXPECT_EQ(kxReadState(lin, driver::kStateCan, 4, &state, &fault), driver::kUnknownState);
}

TEST_F(ReceiveSessionTest, SmallBufferGetsWholeFramesOnly) {
  const kxRef s = Open(driver::kDatabaseSubordinate, "CAN5");
  std::vector<uint8_t> buffer(100000);
  const auto frames =
      ReadUntil(s, [](const auto& f) { return CountId(f, 0x200, driver::kFrameCanFdBrsData) > 0; });
  uint32_t bytes = 0;
  // 64-byte FD frames take 80 bytes; 40 bytes of room take none of them.
  kxStatus st = driver::kReadTimeout;
  const auto deadline = std::chrono::steady_clock::now() + kDeadline;
  while (st != driver::kBufferTooSmall && std::chrono::steady_clock::now() < deadline) {
    st = kxReadFrame(s, buffer.data(), 40, 0.0, &bytes);
    if (st == 0) {
      EXPECT_EQ(bytes % 8, 0u);
    }
  }
  EXPECT_EQ(st, driver::kBufferTooSmall);
  EXPECT_EQ(bytes, 0u);
}

TEST_F(ReceiveSessionTest, SaturatedBusCarriesWhatBitLengthsAllowAndNoMore) {
  Load(R"({"buses":[{"name":"sat","bitRate":500000,
            "traffic":[{"id":"0x123","length":8,"periodMs":0,"payload":"55 55 55 55 55 55 55 55"}]}],
          "devices":[{"name":"D","interfaces":[{"name":"CAN1","bus":"sat"}]}]})");
  const kxRef s = Open(driver::kDatabaseSubordinate, "CAN1");
  const auto frames = ReadUntil(s, [](const auto& f) { return f.size() >= 200; });
  ASSERT_GE(frames.size(), 200u);
  // A standard frame with 8 bytes takes 111 bits without stuff bits, 130 with the most; at
  // 500 kbit/s one bit is 20 units of 100 ns.
  const uint64_t gap = frames[1].timestamp - frames[0].timestamp;
  EXPECT_GE(gap, 111u * 20);
  EXPECT_LE(gap, 130u * 20);
  for (size_t i = 1; i < frames.size(); ++i) {
    EXPECT_EQ(frames[i].timestamp - frames[i - 1].timestamp, gap) << "back to back, never closer";
  }
}

TEST_F(ReceiveSessionTest, CompetingFramesGoOutByIdentifierPriority) {
  Load(R"({"buses":[{"name":"b","bitRate":500000,"traffic":[
            {"id":"0x300","length":1,"periodMs":1000},
            {"id":"0x1FFFFFFF","extended":true,"length":1,"periodMs":1000},
            {"id":"0x100","kind":"remote","periodMs":1000},
            {"id":"0x100","length":1,"periodMs":1000},
            {"id":"0x0FF","length":1,"periodMs":1000}]}],
          "devices":[{"name":"D","interfaces":[{"name":"CAN1","bus":"b"}]}]})");
  // Frames due at the same moment: the first round shows the arbitration order.
  const kxRef s = Open(driver::kDatabaseSubordinate, "CAN1");
  const auto frames = ReadUntil(s, [](const auto& f) { return f.size() >= 10; });
  ASSERT_GE(frames.size(), 10u);
  // The session may have joined in the middle of a round: find the round's first frame.
  size_t start = 0;
  while (frames[start].identifier != 0x0FF) ++start;
  ASSERT_LE(start + 5, frames.size());
  EXPECT_EQ(frames[start + 1].identifier, 0x100u);
  EXPECT_EQ(frames[start + 1].type, driver::kFrameCanData) << "a data frame beats a remote frame";
  EXPECT_EQ(frames[start + 2].type, driver::kFrameCanRemote);
  EXPECT_EQ(frames[start + 3].identifier, 0x300u);
  EXPECT_EQ(frames[start + 4].identifier, 0x1FFFFFFF | kExtendedIdFlag);
}

// A host sees the wrong bit rate over TCP; the receive error counter and a classic session on an FD
// bus are seen only here.
TEST_F(ReceiveSessionTest, SessionsThatCannotDecodeTheBusCountErrorsAndSeeErrorFrames) {
  const kxRef s = Open(driver::kDatabaseCan, "CAN1");
  ASSERT_EQ(kxStop(s, driver::kScopeInterfaceOnly), 0);
  ASSERT_EQ(Set<uint64_t>(s, driver::kPropBaudRate, 250000), 0);
  ASSERT_EQ(kxStart(s, driver::kScopeNormal), 0);
  ASSERT_EQ(kxSetProperty(s, driver::kPropBusErrorFrames, 2, kErrorsOn), 0);
  ASSERT_FALSE(ReadUntil(s, [](const auto& f) { return !f.empty(); }).empty());
  uint32_t state = 0;
  uint32_t fault = 1;
  ASSERT_EQ(kxReadState(s, driver::kStateCan, 4, &state, &fault), 0);
  EXPECT_GT(state >> 24, 0u) << "receive errors are counted";
  EXPECT_EQ(fault, 0u);
  const kxRef classic = Open(driver::kDatabaseCan, "CAN5");
  ASSERT_EQ(kxSetProperty(classic, driver::kPropBusErrorFrames, 2, kErrorsOn), 0);
  const auto mixed = ReadUntil(classic, [](const auto& f) { return CountId(f, 0x080, 0) >= 2; });
  EXPECT_EQ(CountId(mixed, 0x200, driver::kFrameCanFdBrsData), 0u);
  EXPECT_GT(CountId(mixed, 0, driver::kFrameCanBusError), 0u);
}

TEST_F(ReceiveSessionTest, OverflowDropsTheOldestFramesAndWarnsOnce) {
  Load(R"({"receiveQueueFrames":8,
          "buses":[{"name":"sat","bitRate":500000,"traffic":[{"id":"0x123","length":1,"periodMs":0,"payload":"ctr"}]}],
          "devices":[{"name":"D","interfaces":[{"name":"CAN1","bus":"sat"}]}]})");
  const kxRef s = Open(driver::kDatabaseSubordinate, "CAN1");
  std::vector<uint8_t> buffer(4096);
  uint32_t bytes = 0;
  kxStatus st = 0;
  const auto deadline = std::chrono::steady_clock::now() + kDeadline;
  do {
    std::this_thread::sleep_for(std::chrono::milliseconds(5));  // lets more than 8 frames pass
    st = kxReadFrame(s, buffer.data(), static_cast<uint32_t>(buffer.size()), 0.0, &bytes);
  } while (st != driver::kWarnReceiveQueueOverflow && std::chrono::steady_clock::now() < deadline);
  ASSERT_EQ(st, driver::kWarnReceiveQueueOverflow);
  EXPECT_GT(st, 0) << "a warning: the frames read are good";
  const auto frames = Decode(buffer.data(), bytes);
  ASSERT_EQ(frames.size(), 8u);
  for (size_t i = 1; i < frames.size(); ++i) {
    EXPECT_EQ(uint8_t(frames[i - 1].payload[0] + 1), frames[i].payload[0])
        << "the newest frames remain";
  }
}

TEST_F(ReceiveSessionTest, PollThreadsAndAServiceThreadShareTheDriver) {
  struct Poller {
    const char* interfaceName;
    uint32_t stateId;
    uint32_t stateSize;
  };
  const Poller pollers[] = {{"CAN1", driver::kStateCan, 4},
                            {"CAN2", driver::kStateCan, 4},
                            {"LIN1", driver::kStateLin, 8},
                            {"FlexRay1", driver::kStateFlexRay, 4}};
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
  // EXPECT only: an ASSERT here would return while the pollers still run.
  while (finished.load() < 4) {
    kxRef system = 0;
    EXPECT_EQ(kxSystemOpen(&system), 0);
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
