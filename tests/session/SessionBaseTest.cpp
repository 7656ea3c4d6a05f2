// The session life cycle and poll loop skeleton in-process, against the simulated driver.
#include <gtest/gtest.h>

#include <memory_resource>
#include <thread>

#include "bus/BusStatistics.h"
#include "bus/CPollCANDataThread.h"
#include "bus/CTableSession.h"
#include "driver/Sessions.h"
#include "driver/Status.h"
#include "driver/tarvix.h"
#include "tarvix/TarvixControl.h"
#include "tests/support/ServiceFixture.h"

namespace nKV_DLL300 {
namespace {

using kvtest::WaitUntil;

constexpr char kBodyInterface[] = "CAN1@qv_corle_tarvix";

// The smallest bus session over the shared poll loop: CAN records, no statistics report.
class MinimalSession : public CTableSession<CanIdentifierRules, CanBusStatistics, 100000> {
 public:
  explicit MinimalSession(HostConnection* owner)
      : CTableSession(owner, driver::BusKind::kCan, ReadPacing::kNearlyFullRule) {}
  ~MinimalSession() override { endForDestruction(); }

  int32_t open() {
    return kxCreateSession(driver::kDatabaseSubordinate, "", "", kBodyInterface,
                           driver::kModeReceiveStream, &driverSession);
  }
  void startPollThread() override {
    startPollThreadWith(std::make_unique<CPollCANDataThread>(this));
  }
  void reportBusState(uint64_t elapsed) override {
    beginReport();
    uint64_t none = 0;
    firstReportElapsed.compare_exchange_strong(none, elapsed);
  }
  int32_t pollLoop() override {
    const int32_t status = CTableSession::pollLoop();
    loopsEnded.fetch_add(1);
    return status;
  }

  std::atomic<int> loopsEnded{0};
  std::atomic<uint64_t> firstReportElapsed{0};

 protected:
  const char* logHeaderLine() const override { return ""; }
  uint32_t batchFrameCount(uint32_t bytes) const override { return bytes / 24; }
  void countFrame(const driver::RawFrameView&, bool) override {}
};

size_t CallsOf(const std::string& operation) {
  size_t n = 0;
  for (const tarvix::CallRecord& call : tarvix::RecordedCalls()) n += call.operation == operation;
  return n;
}

class SessionBaseTest : public ::testing::Test {
 protected:
  void SetUp() override {
    tarvix::ResetToDefaults();
    session = std::make_unique<MinimalSession>(&connection);
    ASSERT_EQ(session->open(), 0);
  }
  void TearDown() override {
    session.reset();
    tarvix::ResetToDefaults();
  }

  // Without a socket every send fails quietly; the session's state is what these tests watch.
  HostConnection connection{platform::net::kInvalidSocket, ConnectionSetup{}};
  std::unique_ptr<MinimalSession> session;
};

// The driver buffers frames from the creation on; a slow start (a J1939 address claim) must not
// squeeze them into the first second of the statistics.
TEST_F(SessionBaseTest, FirstStatisticsPeriodStartsWhenTheSessionWasCreated) {
  constexpr auto kSlowStart = std::chrono::milliseconds(1500);
  std::this_thread::sleep_for(kSlowStart);  // the slow start itself, not a wait for a result
  session->startPollThread();
  ASSERT_TRUE(WaitUntil([&] { return session->firstReportElapsed.load() != 0; }));
  EXPECT_GE(session->firstReportElapsed.load(), static_cast<uint64_t>(kSlowStart.count()));
  EXPECT_EQ(session->stop(), 0);
}

TEST_F(SessionBaseTest, FailingClearKeepsTheReferenceAndRecordsTheCode) {
  const uint32_t reference = session->driverSession;
  session->startPollThread();
  tarvix::InjectStatus("kxClear", "", driver::kInvalidReference, false);
  EXPECT_EQ(session->stop(), driver::kInvalidReference);
  EXPECT_EQ(session->driverSession, reference);
  EXPECT_EQ(session->lastStatus.load(), driver::kInvalidReference);
  EXPECT_EQ(session->clearDriverSession(), 0);  // the reference is still there to be cleared
  EXPECT_EQ(session->driverSession, 0u);
}

TEST_F(SessionBaseTest, TableThatCannotBeAllocatedLeavesTheLoopIdleWithMinus22) {
  session->tableResource = std::pmr::null_memory_resource();
  tarvix::StartRecording();
  session->startPollThread();
  EXPECT_TRUE(WaitUntil([&] { return session->lastStatus.load() == kStatusTableNotAllocated; }));
  EXPECT_EQ(session->stop(), 0);
  EXPECT_EQ(CallsOf("kxReadFrame"), 0u);
  EXPECT_EQ(session->idCount.load(), 0u);
}

TEST_F(SessionBaseTest, FailingReadIsRecordedAndPollingGoesOn) {
  tarvix::InjectStatus("kxReadFrame", "", driver::kInvalidFrame, false);
  session->startPollThread();
  EXPECT_TRUE(WaitUntil([&] { return session->lastStatus.load() == driver::kInvalidFrame; }));
  EXPECT_TRUE(WaitUntil([&] { return session->idCount.load() == 4; }));
  EXPECT_EQ(session->stop(), 0);
}

TEST_F(SessionBaseTest, NothingToReadIsNeverRecorded) {
  tarvix::InjectStatus("kxReadFrame", "", kReadNothingYet, true);
  tarvix::StartRecording();
  session->startPollThread();
  ASSERT_TRUE(WaitUntil([&] { return CallsOf("kxReadFrame") > 20; }));
  // Neither while polling nor when the loop ends (a paused or stopped session) is it a failure.
  EXPECT_EQ(session->stop(), 0);
  EXPECT_EQ(session->lastStatus.load(), 0);
}

}  // namespace
}  // namespace nKV_DLL300
