// The receive path of the driver on a bound interface, in-process: the kernel's drop count, batched
// reads, and a read that waits (for a frame, or until its session is cleared).
#include <gtest/gtest.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <future>
#include <string>
#include <vector>

#include "driver/Sessions.h"
#include "driver/Status.h"
#include "driver/tarvix.h"
#include "tarvix/TarvixControl.h"
#include "tests/socketcan/UmlHost.h"

namespace kvtest {
namespace {

// CANX on vcan0, with a receive queue the kernel overruns quickly.
constexpr const char* kBinding = R"({"receiveQueueFrames": 300, "devices": [{"name": "SocketCAN",
    "interfaces": [{"name": "CANX", "device": "vcan0", "port": 1}]}]})";
constexpr uint32_t kClassicFrameBytes = 24;
constexpr uint32_t kBufferBytes = 100000;

class SocketCanDriverTest : public ::testing::Test {
 protected:
  void SetUp() override {
    std::string error;
    ASSERT_TRUE(tarvix::LoadConfiguration(kBinding, "", &error)) << error;
    ASSERT_EQ(kxCreateSession(driver::kDatabaseSubordinate, "", "", "CANX",
                              driver::kModeReceiveStream, &session_),
              driver::kSuccess);
  }
  void TearDown() override { tarvix::ResetToDefaults(); }

  kxRef session_ = 0;
  std::vector<uint8_t> buffer_ = std::vector<uint8_t>(kBufferBytes);
};

// The state letter of a thread of this process ('S': asleep, as in a waiting poll).
char ThreadState(pid_t tid) {
  const std::string stat = ReadFile("/proc/self/task/" + std::to_string(tid) + "/stat");
  const size_t end = stat.rfind(')');
  return end == std::string::npos || end + 2 >= stat.size() ? '?' : stat[end + 2];
}

TEST_F(SocketCanDriverTest, KernelDropsBecomeTheOverflowWarningAndOneReadTakesManyFrames) {
  ASSERT_EQ(Shell("cangen vcan0 -g 0 -n 5000 -I 555 -L 8"), 0);
  uint32_t bytes = 0;
  EXPECT_EQ(kxReadFrame(session_, buffer_.data(), kBufferBytes, 0.0, &bytes),
            driver::kWarnReceiveQueueOverflow);
  EXPECT_GT(bytes, 64 * kClassicFrameBytes) << "more than one batch of the socket";
}

TEST_F(SocketCanDriverTest, AWaitingReadReturnsWithAFrameAndWhenItsSessionIsCleared) {
  Background sender("sleep 0.2; exec cansend vcan0 456#01");
  uint32_t bytes = 0;
  EXPECT_EQ(kxReadFrame(session_, buffer_.data(), kBufferBytes, 60.0, &bytes), driver::kSuccess);
  EXPECT_EQ(bytes, kClassicFrameBytes);

  std::atomic<pid_t> readerThread{0};
  auto reader = std::async(std::launch::async, [&] {
    readerThread = static_cast<pid_t>(syscall(SYS_gettid));
    uint32_t none = 0;
    return kxReadFrame(session_, buffer_.data(), kBufferBytes, -1.0, &none);
  });
  EXPECT_TRUE(WaitFor([&] { return readerThread != 0 && ThreadState(readerThread) == 'S'; }));
  EXPECT_EQ(kxClear(session_), driver::kSuccess);
  ASSERT_EQ(reader.wait_for(kDeadline), std::future_status::ready) << "the read kept waiting";
  EXPECT_EQ(reader.get(), driver::kInvalidReference);
}

}  // namespace
}  // namespace kvtest
