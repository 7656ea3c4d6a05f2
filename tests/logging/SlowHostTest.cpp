// A host that stops reading while its session logs a busy bus: the log keeps every frame, another
// host is served as before, and the slow host gets a current table once it reads again.
#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <string>

#include "tarvix/TarvixControl.h"
#include "tests/logging/LogRunFixture.h"

namespace kvtest {
namespace {

using namespace nKV_DLL300;

constexpr int32_t kSmallBuffer = 4096;  // socket buffers that a stalled host fills at once
constexpr uint32_t kIdentifiers = 100;  // 0x100 upwards, each every 10 ms: 10 000 frames/s
constexpr uint32_t kFirstIdentifier = 0x100;
constexpr uint64_t kPeriodUnits = 10 * 10000;  // 10 ms in 100 ns units
// 1.6 s of traffic: room for a poll thread that a busy machine holds back now and then. A poll
// thread that waited up to a second per send for the host would read one 100 000-byte batch
// (about 4 000 frames) per second or less, and fill it within the stall below.
constexpr uint32_t kQueueFrames = 16384;
constexpr uint32_t kStallQueues = 3;  // the stall lasts this many queues' worth of frames

// A 1 Mbit/s bus with a counter byte per identifier, seen by CAN1 and CAN2.
std::string BusyBus() {
  std::string traffic;
  for (uint32_t i = 0; i < kIdentifiers; ++i) {
    if (i > 0) traffic += ",";
    traffic += R"({"id":)" + std::to_string(kFirstIdentifier + i) +
               R"(,"length":1,"periodMs":10,"offsetMs":)" + std::to_string(i % 10) +
               R"(,"payload":"ctr"})";
  }
  return R"({"receiveQueueFrames":)" + std::to_string(kQueueFrames) +
         R"(,"buses":[{"name":"busy","bitRate":1000000,"traffic":[)" + traffic +
         R"(]}],"devices":[{"name":"SIM-CAN","interfaces":[{"name":"CAN1","bus":"busy"},)"
         R"({"name":"CAN2","bus":"busy"}]}]})";
}

// What a host has seen of its stream: the gaps in the sequence numbers and its latest table.
struct HostView {
  uint32_t nextSequence = 0;
  uint32_t gaps = 0;
  uint64_t frames = 0;       // sum of the counts of the latest table
  uint64_t newestFrame = 0;  // latest time stamp in the latest table
  int32_t lastStatus = 0;    // of the latest table

  // Takes one message; true when it was a (decodable) table.
  bool take(const kvhost::HostMessage& m) {
    gaps += m.header.sequence - nextSequence;
    nextSequence = m.header.sequence + 1;
    if (m.header.type != kvhost::kCanRecords) return false;
    auto records = kvhost::DecodeCanRecords(m.payload, m.header.idCount);
    EXPECT_TRUE(records) << "a record message that is not whole";
    if (!records) return false;
    frames = newestFrame = 0;
    for (const kvhost::IdentifierRecord& r : *records) {
      frames += r.count;
      newestFrame = std::max(newestFrame, r.lastTimestamp);
    }
    lastStatus = m.header.lastStatus;
    return true;
  }
};

class SlowHostTest : public LogRunTest {
 protected:
  ServiceOptions Options() override {
    ServiceOptions options = LogRunTest::Options();
    options.socketSendBufferBytes = kSmallBuffer;
    return options;
  }

  // A host that sent `commands`, each acknowledged; `view` follows its stream from there.
  kvhost::HostClient StartedSession(const std::vector<std::string>& commands, bool smallWindow,
                                    HostView& view) {
    kvhost::HostClient host;
    const bool connected = smallWindow
                               ? host.ConnectWithReceiveBuffer("127.0.0.1", port(), kSmallBuffer)
                               : host.Connect("127.0.0.1", port());
    EXPECT_TRUE(connected) << host.error();
    EXPECT_TRUE(host.Receive(kReplyDeadline)) << "no greeting";
    for (const std::string& command : commands) {
      auto reply = Command(host, command);
      EXPECT_TRUE(reply && reply->header.type == kvhost::kText) << command;
      if (reply) view.nextSequence = reply->header.sequence + 1;
    }
    return host;
  }

  // Reads `host` until a table arrives.
  static void NextTable(kvhost::HostClient& host, HostView& view) {
    const auto deadline = std::chrono::steady_clock::now() + kConditionDeadline;
    while (std::chrono::steady_clock::now() < deadline) {
      auto m = host.Receive(kReplyDeadline);
      ASSERT_TRUE(m) << "no message";
      if (view.take(*m)) return;
    }
    FAIL() << "no table";
  }
};

TEST_F(SlowHostTest, StalledHostCostsTheLogNoFrameAndCatchesUpWithACurrentTable) {
  std::string error;
  ASSERT_TRUE(tarvix::LoadConfiguration(BusyBus(), drive_.path().string(), &error)) << error;
  HostView slowView, steadyView;
  kvhost::HostClient slow = StartedSession(
      {"SET_PROP_SESSION_PORTNAME=CAN1", "SET_PROP_TX_TIME_DATA=5", "SET_PROP_LOGFILE_NAME=slow",
       "SET_PROP_LOGFILE_TYPE=1", "SET_PROP_LOGFILE=1", "CMD_SESSION_START"},
      true, slowView);
  kvhost::HostClient steady = StartedSession(
      {"SET_PROP_SESSION_PORTNAME=CAN2", "SET_PROP_TX_TIME_DATA=50", "CMD_SESSION_START"}, false,
      steadyView);
  ASSERT_NO_FATAL_FAILURE(NextTable(slow, slowView));
  ASSERT_NO_FATAL_FAILURE(NextTable(steady, steadyView));

  // The slow host stops reading but keeps its heartbeat, until its reports are being skipped and
  // the bus has carried kStallQueues receive queues' worth of frames since.
  const ServiceStatistics& statistics = service().statistics();
  std::optional<uint64_t> framesAtFirstSkip;
  uint32_t steadyTables = 0;
  auto heartbeat = std::chrono::steady_clock::now();
  const auto deadline = heartbeat + kConditionDeadline;
  while (!framesAtFirstSkip ||
         steadyView.frames < *framesAtFirstSkip + kStallQueues * kQueueFrames) {
    ASSERT_LT(std::chrono::steady_clock::now(), deadline)
        << "the slow host's reports never skipped";
    if (std::chrono::steady_clock::now() - heartbeat > 1s) {
      ASSERT_TRUE(slow.Send("CMD_HEARTBEAT"));
      heartbeat = std::chrono::steady_clock::now();
    }
    if (auto m = steady.Receive(100ms); m && steadyView.take(*m)) ++steadyTables;
    if (!framesAtFirstSkip && statistics.snapshotsSkipped.load() > 0) {
      framesAtFirstSkip = steadyView.frames;
    }
  }
  EXPECT_GT(steadyTables, 10u) << "the other host was not served meanwhile";
  EXPECT_EQ(steadyView.lastStatus, 0);

  // Reading again, the slow host soon gets a table at least as new as the other host's.
  const uint64_t newestSeen = steadyView.newestFrame;
  do {
    ASSERT_NO_FATAL_FAILURE(NextTable(slow, slowView));
  } while (slowView.newestFrame < newestSeen);
  EXPECT_EQ(slowView.lastStatus, 0) << "frames were lost";
  EXPECT_GT(slowView.gaps, 0u) << "skipped reports leave no gap in the sequence numbers";
  EXPECT_LE(slowView.gaps, statistics.snapshotsSkipped.load());
  Terminate(slow);

  // Every frame of every identifier is in the log: each counter step and each period.
  const std::string log = LogFile("slow.zfl");
  std::map<uint32_t, driver::RawFrameView> previous;
  size_t frames = 0;
  for (const driver::RawFrameView& frame : ReadRecords(log, BinaryRecordLayout::kFixed24)) {
    ++frames;
    const uint32_t id = frame.header.identifier;
    if (auto before = previous.find(id); before != previous.end()) {
      const driver::RawFrameView& p = before->second;
      ASSERT_EQ(frame.payload[0], uint8_t(p.payload[0] + 1))
          << std::hex << id << " after frame " << std::dec << frames;
      ASSERT_LT(frame.header.timestamp - p.header.timestamp, 2 * kPeriodUnits) << std::hex << id;
    }
    previous[id] = frame;
  }
  EXPECT_EQ(previous.size(), kIdentifiers);
  EXPECT_GT(frames, kStallQueues * kQueueFrames);
}

}  // namespace
}  // namespace kvtest
