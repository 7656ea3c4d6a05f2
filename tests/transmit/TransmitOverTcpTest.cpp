// A host defines, starts, updates and stops a frame on CAN3; a second host watches CAN4 on the
// same quiet test bus and sees exactly that frame. Transmit messages by session kind: acknowledged
// on CAN, acknowledged and nothing else on LIN and FlexRay, dropped unanswered without a CAN
// session.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tarvix/TarvixControl.h"
#include "tests/support/BusSessionFixture.h"

namespace kvtest {
namespace {

using Bytes = std::vector<uint8_t>;

constexpr uint32_t kTxId = 0x123;
constexpr uint8_t kTypeFdBrs = 0x18;
constexpr uint8_t kEchoFlag = 0x80;
const std::string kRecordPeriod = "SET_PROP_TX_TIME_DATA=100";
constexpr double kUnitsPerSecond = 1e7;  // record time stamps count 100 ns
// Record messages that pass while a stopped frame must not be counted again (at 100 ms each,
// far longer than the 50 ms repetition).
constexpr int kQuietMessages = 6;
// How long a host waits for a message between two heartbeats of its neighbour.
constexpr std::chrono::milliseconds kHeartbeatPoll = 100ms;

const std::vector<std::string> kTxProperties = {
    "SET_TX_PROP_PAYLOAD_LENGTH=8", "SET_TX_PROP_EXTENDED_ID=1",   "SET_TX_PROP_FRAME_TYPE=0",
    "SET_TX_PROP_TIMING_TYPE=1",    "SET_TX_PROP_CYCLIC_RATE=0,5", "SET_TX_PROP_PAYLOAD=1,2",
    "SET_TX_PROP_IDENTIFIER=16"};

// True when the driver was asked to build or use a transmit database or output session.
bool AnyTransmitCall() {
  for (const tarvix::CallRecord& call : tarvix::RecordedCalls()) {
    if (call.operation.starts_with("kxdb") || call.operation == "kxWriteFrame") return true;
  }
  return false;
}

class TransmitTest : public BusSessionTest {
 protected:
  // Slot 0: a CAN session on CAN3 at the test bus's rates, classic unless `canIoMode` says FD.
  kvhost::HostClient Transmitter(uint32_t canIoMode = 0, uint8_t logTransmitted = 0) {
    return StartedHost({"SET_PROP_SESSION_PORTNAME=CAN3", "SET_PROP_SESSION_RUNMODE=NORMAL",
                        "SET_PROP_SESSION_BAUDRATE=500000",
                        "SET_PROP_SESSION_CANFD_BAUDRATE=2000000",
                        "SET_PROP_SESSION_CAN_IOMODE=" + std::to_string(canIoMode),
                        "SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES=" + std::to_string(logTransmitted),
                        kRecordPeriod});
  }

  // Watches CAN4 as the bus runs, with a record message every 100 ms.
  kvhost::HostClient Monitor() {
    return StartedHost({"SET_PROP_SESSION_PORTNAME=CAN4", kRecordPeriod});
  }

  // Sends each property message and checks its acknowledgement, "<ACK: NAME>\n".
  void Define(kvhost::HostClient& host, const std::vector<std::string>& messages) {
    for (const std::string& message : messages) {
      auto reply = Command(host, message);
      ASSERT_TRUE(reply.has_value()) << message;
      EXPECT_EQ(reply->header.type, kvhost::kText);
      EXPECT_EQ(reply->text(), "<ACK: " + message.substr(0, message.find('=')) + ">\n");
    }
  }
  void Expect(kvhost::HostClient& host, const std::string& command) { Define(host, {command}); }

  // Sends every transmit property; none may be answered, so the next text is the error query's.
  void ExpectTxPropertiesDropped(kvhost::HostClient& host, const std::string& lastErrorPrefix) {
    for (const std::string& message : kTxProperties) SendAndWaitDispatched(host, message);
    auto reply = Command(host, "CMD_SESSION_READ_LAST_ERROR");
    ASSERT_TRUE(reply.has_value());
    EXPECT_TRUE(reply->text().starts_with(lastErrorPrefix)) << reply->text();
  }

  // Connects a host and names its port over TCP (bus kind from the name); checks the reply.
  kvhost::HostClient HostOnPort(const std::string& port) {
    kvhost::HostClient host = ConnectHost();
    auto reply = Command(host, "SET_PROP_SESSION_PORTNAME=" + port);
    EXPECT_TRUE(reply.has_value());
    if (reply) {
      EXPECT_EQ(reply->text(), "<ACK: SET_PROP_SESSION_PORTNAME " + port + ">");
    }
    return host;
  }

  // The first record of `identifier` in a message of `host` for which `accept` holds.
  std::optional<kvhost::IdentifierRecord> Seen(
      kvhost::HostClient& host, uint32_t identifier, uint8_t type,
      const std::function<bool(const kvhost::IdentifierRecord&)>& accept) {
    auto message = RecordsWhere(host, [&](const RecordMessage& m) {
      const kvhost::IdentifierRecord* record = m.find(identifier, type);
      return record != nullptr && accept(*record);
    });
    if (!message) return std::nullopt;
    return *message->find(identifier, type);
  }

  std::optional<kvhost::IdentifierRecord> SeenCount(kvhost::HostClient& host, uint32_t atLeast,
                                                    uint32_t identifier = kTxId,
                                                    uint8_t type = kTypeData) {
    return Seen(host, identifier, type,
                [&](const kvhost::IdentifierRecord& r) { return r.count >= atLeast; });
  }

  // The count of `identifier` in the next record message, 0 when it is not listed. A session
  // with an empty table sends no records, so a statistics message (once a second) also ends the
  // wait, giving `noNews`.
  std::optional<uint32_t> NextCount(kvhost::HostClient& host, uint32_t identifier = kTxId,
                                    uint32_t noNews = 0) {
    auto message = NextMessage(host, [](const kvhost::HostMessage& m) {
      return m.header.type == kvhost::kCanRecords || m.header.type == kvhost::kStatistics;
    });
    if (!message) return std::nullopt;
    if (message->header.type == kvhost::kStatistics) return noNews;
    auto records = kvhost::DecodeCanRecords(message->payload, message->header.idCount);
    if (!records) return std::nullopt;
    for (const kvhost::IdentifierRecord& record : *records) {
      if (record.identifier == identifier) return record.count;
    }
    return 0u;
  }

  // The frame is no longer on the bus: its count stays the same over several record messages.
  // The first message may still hold a frame that was in flight at the stop.
  void ExpectCountStops(kvhost::HostClient& monitor, uint32_t identifier = kTxId) {
    ASSERT_TRUE(NextCount(monitor, identifier).has_value());
    auto settled = NextCount(monitor, identifier);
    ASSERT_TRUE(settled.has_value());
    for (int i = 0; i < kQuietMessages; ++i) {
      auto later = NextCount(monitor, identifier, *settled);
      ASSERT_TRUE(later.has_value());
      EXPECT_EQ(*later, *settled) << "the frame is still being sent";
    }
  }

  void DefineCyclic(kvhost::HostClient& host) {
    Define(host, {"SET_TX_PROP_IDENTIFIER=291", "SET_TX_PROP_PAYLOAD_LENGTH=5",
                  "SET_TX_PROP_PAYLOAD=1,2,3", "SET_TX_PROP_TIMING_TYPE=0",
                  "SET_TX_PROP_CYCLIC_RATE=0,05"});
  }
};

TEST_F(TransmitTest, EventFrameGoesOutOncePerStartWithItsIdentifierLengthAndPayload) {
  kvhost::HostClient sender = Transmitter();
  kvhost::HostClient monitor = Monitor();
  Define(sender, {"SET_TX_PROP_IDENTIFIER=291", "SET_TX_PROP_PAYLOAD_LENGTH=5",
                  "SET_TX_PROP_PAYLOAD=1,2,3", "SET_TX_PROP_TIMING_TYPE=1"});

  Expect(sender, "CMD_TX_START");
  auto first = SeenCount(monitor, 1);
  ASSERT_TRUE(first.has_value());
  EXPECT_EQ(first->count, 1u);
  EXPECT_EQ(first->payloadLength, 5u);
  EXPECT_EQ(first->payload, (Bytes{1, 2, 3, 0, 0}));

  Expect(sender, "CMD_TX_START");
  ASSERT_TRUE(SeenCount(monitor, 2).has_value());
  for (int i = 0; i < kQuietMessages; ++i)
    EXPECT_EQ(NextCount(monitor), 2u) << "an event frame repeated";

  // A stop empties the payload: the next start sends the length in zeros.
  Expect(sender, "CMD_TX_STOP");
  Expect(sender, "CMD_TX_START");
  auto third = SeenCount(monitor, 3);
  ASSERT_TRUE(third.has_value());
  EXPECT_EQ(third->payload, (Bytes{0, 0, 0, 0, 0}));
}

TEST_F(TransmitTest, CyclicFrameRepeatsFollowsUpdatesIsReplacedByASecondStartAndEndsWithStop) {
  kvhost::HostClient sender = Transmitter();
  kvhost::HostClient monitor = Monitor();
  DefineCyclic(sender);
  Expect(sender, "CMD_TX_START");

  // About 20 frames a second, measured in bus time between two records.
  auto early = SeenCount(monitor, 3);
  ASSERT_TRUE(early.has_value());
  auto later = SeenCount(monitor, early->count + 20);
  ASSERT_TRUE(later.has_value());
  const double seconds = (later->lastTimestamp - early->lastTimestamp) / kUnitsPerSecond;
  ASSERT_GT(seconds, 0.0);
  const double perSecond = (later->count - early->count) / seconds;
  EXPECT_GT(perSecond, 10.0);
  EXPECT_LT(perSecond, 40.0);

  Define(sender, {"SET_TX_PROP_PAYLOAD=9,8,7"});
  EXPECT_TRUE(Seen(monitor, kTxId, kTypeData, [](const kvhost::IdentifierRecord& r) {
                return r.payload == Bytes{9, 8, 7, 0, 0};
              }).has_value());

  // A second start replaces the running frame instead of adding one; the stop ends it.
  Define(sender, {"SET_TX_PROP_IDENTIFIER=292"});
  Expect(sender, "CMD_TX_START");
  ASSERT_TRUE(SeenCount(monitor, 3, kTxId + 1).has_value());
  ExpectCountStops(monitor, kTxId);
  Expect(sender, "CMD_TX_STOP");
  ExpectCountStops(monitor, kTxId + 1);
}

TEST_F(TransmitTest, RemoteExtendedAndFdFramesReachTheOtherInterface) {
  struct Case {
    const char* name;
    uint32_t canIoMode;
    std::vector<std::string> definition;
    uint32_t seenIdentifier;
    uint8_t seenType;
    uint32_t seenLength;
  };
  const std::vector<Case> cases = {
      {"remote",
       0,
       {"SET_TX_PROP_IDENTIFIER=801", "SET_TX_PROP_FRAME_TYPE=1"},
       801,
       kTypeRemote,
       0},
      {"extended",
       0,
       {"SET_TX_PROP_IDENTIFIER=28036592", "SET_TX_PROP_EXTENDED_ID=1",
        "SET_TX_PROP_PAYLOAD_LENGTH=8", "SET_TX_PROP_PAYLOAD=1,2,3,4,5,6,7,8"},
       28036592 | kExtendedFlag,
       kTypeData,
       8},
      {"FD with bit-rate switching",
       2,
       {"SET_TX_PROP_IDENTIFIER=512", "SET_TX_PROP_FRAME_TYPE=24", "SET_TX_PROP_PAYLOAD_LENGTH=12",
        "SET_TX_PROP_PAYLOAD=1,2,3,4,5,6,7,8,9,10,11,12"},
       512,
       kTypeFdBrs,
       12},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    tarvix::ResetToDefaults();
    StartService();
    kvhost::HostClient sender = Transmitter(c.canIoMode);
    kvhost::HostClient monitor = Monitor();
    Define(sender, c.definition);
    Expect(sender, "CMD_TX_START");
    auto seen = Seen(monitor, c.seenIdentifier, c.seenType,
                     [](const kvhost::IdentifierRecord&) { return true; });
    ASSERT_TRUE(seen.has_value());
    EXPECT_EQ(seen->count, 1u);
    if (c.seenType != kTypeRemote) {
      EXPECT_EQ(seen->payloadLength, c.seenLength);
      for (uint32_t i = 0; i < seen->payload.size(); ++i) EXPECT_EQ(seen->payload[i], i + 1);
    }
  }
}

TEST_F(TransmitTest, OwnSessionSeesItsFrameOnlyWhenLoggingTransmittedFrames) {
  for (uint8_t logTransmitted : {0, 1}) {
    SCOPED_TRACE(logTransmitted);
    tarvix::ResetToDefaults();
    StartService();
    kvhost::HostClient sender = Transmitter(0, logTransmitted);
    kvhost::HostClient monitor = Monitor();
    Define(sender, {"SET_TX_PROP_IDENTIFIER=291", "SET_TX_PROP_PAYLOAD_LENGTH=1"});
    Expect(sender, "CMD_TX_START");
    ASSERT_TRUE(SeenCount(monitor, 1).has_value());

    if (logTransmitted != 0) {
      auto echo = SeenCount(sender, 1);
      ASSERT_TRUE(echo.has_value());
      EXPECT_EQ(echo->echo, kEchoFlag);
    } else {
      for (int i = 0; i < kQuietMessages; ++i) EXPECT_EQ(NextCount(sender), 0u);
    }
  }
}

// Terminate, a closed socket and a lost heartbeat each stop a cyclic frame. The sender that falls
// silent is ended while the monitor stays active; a fresh watcher then finds the bus quiet.
TEST_F(TransmitTest, EndingTheSessionStopsACyclicFrame) {
  enum class End { kTerminate, kCloseSocket, kHeartbeatLoss };
  for (End end : {End::kTerminate, End::kCloseSocket, End::kHeartbeatLoss}) {
    SCOPED_TRACE(static_cast<int>(end));
    tarvix::ResetToDefaults();
    heartbeatLimitMs_ =
        end == End::kHeartbeatLoss ? kTestHeartbeatLimitMs : nKV_DLL300::kDefaultHeartbeatLimitMs;
    StartService();
    kvhost::HostClient sender = Transmitter();
    kvhost::HostClient monitor = Monitor();
    DefineCyclic(sender);
    Expect(sender, "CMD_TX_START");
    ASSERT_TRUE(SeenCount(monitor, 3).has_value());

    if (end == End::kTerminate) {
      Expect(sender, "CMD_SESSION_TERMINATE");
      EXPECT_TRUE(sender.WaitForClose(kConditionDeadline));
    } else if (end == End::kCloseSocket) {
      sender.Close();
      ASSERT_TRUE(WaitUntil([&] { return service().statistics().connectionsEnded.load() >= 1; }));
    } else {
      std::optional<kvhost::HostMessage> farewell;
      ASSERT_TRUE(WaitUntil([&] {
        SendAndWaitDispatched(monitor, "CMD_HEARTBEAT");
        farewell = NextMessage(
            sender,
            [](const kvhost::HostMessage& m) { return m.header.type == kvhost::kErrorText; },
            kHeartbeatPoll);
        return farewell.has_value();
      }));
      EXPECT_EQ(farewell->text(), "<ERROR: Heartbeat message missing| TCP Client disconnect> \n");
      ASSERT_TRUE(WaitUntil([&] { return service().statistics().connectionsEnded.load() >= 1; }));
      EXPECT_EQ(service().statistics().connectionsEnded.load(), 1u) << "the active host was ended";
      kvhost::HostClient watcher = Monitor();
      for (int i = 0; i < kQuietMessages; ++i) {
        SendAndWaitDispatched(watcher, "CMD_HEARTBEAT");
        EXPECT_EQ(NextCount(watcher), 0u);
      }
      continue;
    }
    ExpectCountStops(monitor);
  }
}

TEST_F(TransmitTest, TransmitPropertiesAreAcknowledgedOnlyOnACanSession) {
  kvhost::HostClient host = StartedHost({"SET_PROP_SESSION_PORTNAME=CAN3"});
  Define(host, kTxProperties);
  kvhost::HostClient portOnly = HostOnPort("CAN2");  // a CAN port, but no session yet
  ExpectTxPropertiesDropped(portOnly, "<TCP Error: ");
}

TEST_F(TransmitTest, LinAndFlexRaySessionsOnlyAcknowledgeTransmitCommands) {
  const std::pair<const char*, const char*> cases[] = {{"LIN1", "<LIN Error: "},
                                                       {"FlexRay1", "<FlexRay Error: "}};
  for (const auto& [port, lastErrorPrefix] : cases) {
    SCOPED_TRACE(port);
    tarvix::ResetToDefaults();
    StartService();
    kvhost::HostClient host = HostOnPort(port);
    if (std::string(port) == "LIN1") {
      ASSERT_TRUE(Command(host, "SET_PROP_SESSION_BAUDRATE=19200").has_value());
    }
    Expect(host, "CMD_SESSION_START");
    tarvix::StartRecording();
    Expect(host, "CMD_TX_START");
    Expect(host, "CMD_TX_STOP");
    ExpectTxPropertiesDropped(host, lastErrorPrefix);
    tarvix::StopRecording();
    EXPECT_FALSE(AnyTransmitCall());
  }
}

}  // namespace
}  // namespace kvtest
