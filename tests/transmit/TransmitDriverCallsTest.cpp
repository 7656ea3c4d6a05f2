// What a transmit frame asks of the simulated driver: the calls of a start in their order, with
// their conditions, the failure rules and the release of the output session.
#include <gtest/gtest.h>

#include <cstdio>
#include <cstring>
#include <memory>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include "driver/Properties.h"
#include "driver/Status.h"
#include "hostlink/SessionSettings.h"
#include "tarvix/TarvixControl.h"
#include "transmit/CTransmitFrame.h"

namespace kvtest {
namespace {

using nKV_DLL300::CTransmitFrame;
using nKV_DLL300::SessionSettings;

constexpr uint64_t kBaudRate = 500000;
constexpr uint64_t kDataBaudRate = 2000000;

// One recorded call as a line: "operation id/size=value" with the value read as a little-endian
// integer (the cyclic rate as a number of seconds), names after it.
std::string Describe(const tarvix::CallRecord& call) {
  char line[160];
  uint64_t value = 0;
  if (!call.value.empty()) {
    std::memcpy(&value, call.value.data(), std::min<size_t>(call.value.size(), sizeof value));
  }
  if (call.operation == "kxdbSetProperty" && call.id == driver::kPropFrameCyclicRate) {
    double seconds = 0;
    std::memcpy(&seconds, &value, sizeof seconds);
    std::snprintf(line, sizeof line, "%s %#x/%u=%g", call.operation.c_str(), call.id, call.size,
                  seconds);
  } else if (call.operation == "kxdbSetProperty" || call.operation == "kxSetProperty") {
    std::snprintf(line, sizeof line, "%s %#x/%u=%llu", call.operation.c_str(), call.id, call.size,
                  static_cast<unsigned long long>(value));
  } else if (call.operation == "kxWriteFrame") {
    std::snprintf(line, sizeof line, "%s %u", call.operation.c_str(), call.size);
  } else {
    std::snprintf(line, sizeof line, "%s %#x", call.operation.c_str(), call.id);
  }
  std::string text = line;
  for (const std::string& name : call.texts) {
    // The database name changes with the clock: only its form is compared.
    text += " " + (name.starts_with(":memory") ? std::string(":memory<n>") : name);
  }
  return text;
}

std::vector<std::string> RecordedLines() {
  std::vector<std::string> lines;
  for (const tarvix::CallRecord& call : tarvix::RecordedCalls()) lines.push_back(Describe(call));
  return lines;
}

std::optional<tarvix::CallRecord> LastCall(const std::string& operation) {
  std::optional<tarvix::CallRecord> found;
  for (const tarvix::CallRecord& call : tarvix::RecordedCalls()) {
    if (call.operation == operation) found = call;
  }
  return found;
}

// The recorded calls begin by releasing the output session and then its database.
void ExpectReleasedFirst(uint32_t session, uint32_t database) {
  const std::vector<tarvix::CallRecord> calls = tarvix::RecordedCalls();
  const std::pair<std::string, uint32_t> expected[] = {
      {"kxStop", session}, {"kxClear", session}, {"kxdbCloseDatabase", database}};
  ASSERT_GE(calls.size(), 3u);
  for (size_t i = 0; i < 3; ++i) {
    EXPECT_EQ(calls[i].operation, expected[i].first);
    EXPECT_EQ(calls[i].reference, expected[i].second) << calls[i].operation;
  }
}

class TransmitDriverCallsTest : public ::testing::Test {
 protected:
  void SetUp() override {
    tarvix::ResetToDefaults();
    settings.portName.set("CAN3");
    settings.interfaceName.set("CAN3@qv_corle_tarvix");
    settings.baudRate.store(kBaudRate);
    settings.canFdBaudRate.store(kDataBaudRate);
    frame.txIdentifier = 0x123;
    frame.txPayloadLength = 5;
    frame.SetTxPayload("1,2,3");
  }
  void TearDown() override {
    frame.stopIfActive();
    tarvix::ResetToDefaults();
  }

  void Start() {
    tarvix::StartRecording();
    frame.StartTransmit();
    tarvix::StopRecording();
  }

  SessionSettings settings;
  int32_t status = 0;
  CTransmitFrame frame{settings, status};
};

struct StartCase {
  const char* name;
  uint32_t canIoMode;
  uint32_t isoFdMode;
  uint8_t extendedId;
  uint8_t frameType;
  uint32_t timingType;
  std::vector<std::string> calls;
};

void PrintTo(const StartCase& c, std::ostream* os) { *os << c.name; }

class TransmitStartCallsTest : public TransmitDriverCallsTest,
                               public ::testing::WithParamInterface<StartCase> {};

TEST_P(TransmitStartCallsTest, StartMakesTheDatabaseSessionAndWriteInOrder) {
  const StartCase& c = GetParam();
  settings.canIoMode.store(c.canIoMode);
  settings.isoFdMode.store(c.isoFdMode);
  frame.txExtendedId = c.extendedId;
  frame.txFrameType = c.frameType;
  frame.txTimingType = c.timingType;
  frame.txCyclicRate = 0.05;

  Start();

  EXPECT_EQ(RecordedLines(), c.calls);
  EXPECT_EQ(status, 0);
  EXPECT_TRUE(frame.txActive);
  auto write = LastCall("kxWriteFrame");
  ASSERT_TRUE(write.has_value());
  ASSERT_GE(write->value.size(), 24u);
  EXPECT_EQ(write->value[12], c.frameType == 1 ? 1 : 0);  // only a remote frame is a remote record
  EXPECT_EQ(write->value[15], 5);                         // length
}

std::vector<std::string> Join(std::vector<std::string> first,
                              const std::vector<std::string>& rest) {
  first.insert(first.end(), rest.begin(), rest.end());
  return first;
}

// The cluster a start makes: an FD cluster (I/O mode above 0) also gets the data rate.
std::vector<std::string> Cluster(uint32_t canIoMode) {
  std::vector<std::string> calls = {
      "kxdbOpenDatabase 0 :memory<n>", "kxdbCreateObject 0x10000 Cluster",
      "kxdbSetProperty 0x10073/4=0", "kxdbSetProperty 0x9010001/8=500000",
      "kxdbSetProperty 0x10010/4=" + std::to_string(canIoMode)};
  if (canIoMode != 0) calls.push_back("kxdbSetProperty 0x9010011/8=2000000");
  return calls;
}

constexpr int kNoFrameMode = -1;

// The frame, its properties, the output session and the write, as a start makes them.
std::vector<std::string> FrameAndSession(bool extended, uint32_t timingType, int frameMode) {
  std::vector<std::string> calls = {"kxdbCreateObject 0x20000 TxFrame"};
  if (extended) calls.push_back("kxdbSetProperty 0x2020010/1=1");
  calls = Join(calls, {"kxdbSetProperty 0x20003/4=291", "kxdbSetProperty 0x20007/4=5",
                       "kxdbSetProperty 0x20011/4=" + std::to_string(timingType),
                       "kxdbSetProperty 0x1020012/8=0.05"});
  if (frameMode != kNoFrameMode)
    calls.push_back("kxdbSetProperty 0x20066/4=" + std::to_string(frameMode));
  const bool eventFrame = timingType == 1;
  calls = Join(calls, {std::string(eventFrame ? "kxCreateSession 0xa" : "kxCreateSession 0xb") +
                           " :memory<n> Cluster TxFrame CAN3",
                       "kxSetProperty 0x9100016/8=500000", "kxSetProperty 0x100025/4=0",
                       "kxSetProperty 0x100029/4=0", "kxWriteFrame 24"});
  if (eventFrame) calls.push_back("kxWait 0x8001");
  return calls;
}

INSTANTIATE_TEST_SUITE_P(
    Orders, TransmitStartCallsTest,
    ::testing::Values(
        // Classic cluster: three cluster properties; no extended identifier, no frame I/O mode;
        // an event frame goes to a queued session and the start waits until it was sent.
        StartCase{"ClassicEventFrame", 0, 0, 0, 0, 1,
                  Join(Cluster(0), FrameAndSession(false, 1, kNoFrameMode))},
        // FD clusters get the data rate as a fourth property; frame types 0x08, 0x10, 0x18 choose
        // the frame's I/O mode 0, 1, 2 while the ISO FD mode is 0; a cyclic frame goes to a
        // single-point session and nothing waits.
        StartCase{"FdBrsCyclicExtendedFrame", 2, 0, 1, 0x18, 0,
                  Join(Cluster(2), FrameAndSession(true, 0, 2))},
        StartCase{"FdFrameOnFdCluster", 1, 0, 0, 0x10, 0,
                  Join(Cluster(1), FrameAndSession(false, 0, 1))},
        StartCase{"ClassicModeFrameOnFdCluster", 2, 0, 0, 0x08, 4,
                  Join(Cluster(2), FrameAndSession(false, 4, 0))},
        StartCase{"NonIsoFdModeSetsNoFrameMode", 2, 1, 0, 0x18, 0,
                  Join(Cluster(2), FrameAndSession(false, 0, kNoFrameMode))},
        StartCase{"RemoteFrameSetsNoFrameMode", 0, 0, 0, 1, 1,
                  Join(Cluster(0), FrameAndSession(false, 1, kNoFrameMode))}),
    [](const auto& info) { return std::string(info.param.name); });

TEST_F(TransmitDriverCallsTest, FailedDatabaseOpenLeavesLaterHandlesAndSkipsTheWrite) {
  tarvix::InjectStatus("kxdbOpenDatabase", "", driver::kOutOfMemory, false);
  Start();
  EXPECT_EQ(status, driver::kOutOfMemory);
  EXPECT_EQ(frame.txCluster, 0u);
  EXPECT_EQ(frame.txFrameObject, 0u);
  EXPECT_EQ(frame.txSession, 0u);
  EXPECT_TRUE(frame.txActive);  // a stop still follows and cleans up
  EXPECT_FALSE(LastCall("kxWriteFrame").has_value());
  EXPECT_FALSE(LastCall("kxCreateSession").has_value());

  frame.StopTransmit();
  EXPECT_FALSE(frame.txActive);
}

TEST_F(TransmitDriverCallsTest, FailedSessionCreationIsUndoneByTheStopAndTheNextStartWrites) {
  tarvix::InjectStatus("kxCreateSession", "", driver::kInterfaceNotFound, false);
  Start();
  EXPECT_EQ(status, driver::kInterfaceNotFound);
  EXPECT_FALSE(LastCall("kxWriteFrame").has_value());
  const uint32_t database = frame.txDatabase;
  ASSERT_NE(database, 0u);

  tarvix::StartRecording();
  frame.StopTransmit();
  auto close = LastCall("kxdbCloseDatabase");
  ASSERT_TRUE(close.has_value());
  EXPECT_EQ(close->reference, database);
  EXPECT_EQ(status, 0);

  frame.SetTxPayload("4");
  Start();  // the status word is set afresh: this start writes
  EXPECT_EQ(status, 0);
  EXPECT_TRUE(LastCall("kxWriteFrame").has_value());
}

TEST_F(TransmitDriverCallsTest, CyclicPayloadUpdateIsWrittenAtOnceEventUpdateOnlyStored) {
  frame.txTimingType = 0;
  frame.txCyclicRate = 0.05;
  Start();
  tarvix::StartRecording();
  frame.SetTxPayload("9,8");
  auto write = LastCall("kxWriteFrame");
  ASSERT_TRUE(write.has_value());
  EXPECT_EQ(std::vector<uint8_t>(write->value.begin() + 16, write->value.begin() + 21),
            (std::vector<uint8_t>{9, 8, 0, 0, 0}));
  frame.StopTransmit();

  frame.txTimingType = 1;
  Start();
  tarvix::StartRecording();
  frame.SetTxPayload("7");
  EXPECT_FALSE(LastCall("kxWriteFrame").has_value());
  EXPECT_EQ(frame.txPayload, (std::vector<uint8_t>{7}));
}

TEST_F(TransmitDriverCallsTest, SecondStartReleasesTheFirstOutputSessionBeforeBuilding) {
  frame.txTimingType = 0;
  frame.txCyclicRate = 0.05;
  Start();
  const uint32_t firstSession = frame.txSession;
  const uint32_t firstDatabase = frame.txDatabase;

  Start();
  ExpectReleasedFirst(firstSession, firstDatabase);
  ASSERT_GE(tarvix::RecordedCalls().size(), 4u);
  EXPECT_EQ(tarvix::RecordedCalls()[3].operation, "kxdbOpenDatabase");
  EXPECT_EQ(frame.txPayload, (std::vector<uint8_t>{1, 2, 3}));  // kept for the new start
  EXPECT_EQ(status, 0);
}

TEST_F(TransmitDriverCallsTest, FrameDestroyedWhileActiveReleasesItsOutputSession) {
  auto owned = std::make_unique<CTransmitFrame>(settings, status);
  owned->txTimingType = 0;
  owned->txCyclicRate = 0.05;
  owned->txPayloadLength = 1;
  owned->StartTransmit();
  const uint32_t session = owned->txSession, database = owned->txDatabase;
  ASSERT_EQ(status, 0);
  tarvix::StartRecording();
  owned.reset();
  ExpectReleasedFirst(session, database);
  EXPECT_EQ(tarvix::RecordedCalls().size(), 3u);
}

}  // namespace
}  // namespace kvtest
