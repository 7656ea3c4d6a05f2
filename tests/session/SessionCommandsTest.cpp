// The session commands over TCP: their texts with and without a session, and how sessions end.
#include <gtest/gtest.h>

#include <chrono>
#include <cstdio>
#include <functional>

#include "driver/Status.h"
#include "hostlink/HostLink.h"
#include "tarvix/TarvixControl.h"
#include "tests/support/BusSessionFixture.h"

namespace kvtest {
namespace {

using CanSessionTest = BusSessionTest;

const std::string kCan1 = "SET_PROP_SESSION_PORTNAME=CAN1";

std::string Formatted(const char* format, int32_t a, int32_t b = 0) {
  char text[128];
  std::snprintf(text, sizeof text, format, a, b);
  return text;
}

bool IsRecords(const kvhost::HostMessage& m) { return m.header.type == kvhost::kCanRecords; }

struct CommandCase {
  const char* command;
  const char* reply;  // nullptr: no reply at all
  uint8_t type = kvhost::kText;
};

// Without a session every command keeps the connection, except terminate.
TEST_F(CanSessionTest, CommandsWithoutASessionAnswerWithTheirTexts) {
  const CommandCase cases[] = {
      {"CMD_SESSION_START", "<ERROR: WRONG PORT NAME>\n", kvhost::kErrorText},
      {"CMD_SESSION_STOP", nullptr},
      {"CMD_SESSION_READ_LAST_ERROR", "<TCP Error: 0> \n"},
      {"CMD_SESSION_RESET", "<ACK: CMD_SESSION_RESET>\n"},
      {"CMD_HEARTBEAT", nullptr},
      {"CMD_TX_START", "<ACK: CMD_TX_START>\n"},
      {"CMD_TX_STOP", "<ACK: CMD_TX_STOP>\n"},
  };
  kvhost::HostClient host = ConnectHost();
  for (const CommandCase& c : cases) {
    SCOPED_TRACE(c.command);
    if (c.reply == nullptr) {
      // A command without reply: the reply of the next command must be the next text.
      SendAndWaitDispatched(host, c.command);  // one command per receive
      ExpectReply(host, "CMD_SESSION_READ_LAST_ERROR", "<TCP Error: 0> \n");
      continue;
    }
    auto reply = ExpectReply(host, c.command, c.reply, c.type);
    EXPECT_EQ(reply ? reply->header.idCount : 99u, 0u);
  }
  ExpectReply(host, "CMD_SESSION_TERMINATE", "<ACK: CMD_SESSION_TERMINATE>\n");
  EXPECT_TRUE(host.WaitForClose(kReplyDeadline));
}

// A port name of another bus set meanwhile is stored for the next session; refusals keep
// following the running one.
TEST_F(CanSessionTest, CommandsOnARunningSessionAnswerWithTheirTexts) {
  const std::string canRefusal = "<ERROR: SET_PROP_SESSION_LISTEN_ONLY: CAN Session yet created>\n";
  const std::string started = "<ERROR: CAN session is already started>\n";
  kvhost::HostClient host = StartedHost({kCan1});
  // Records are in the table before the commands, so each command's header shows them; of the
  // property replies only the refusal by the session does.
  ASSERT_TRUE(RecordsWhere(host, AllFour));
  auto expect = [&](const char* command, const std::string& text, uint8_t type, uint32_t ids) {
    auto reply = ExpectReply(host, command, text, type);
    EXPECT_EQ(reply ? reply->header.idCount : 99u, ids) << command;
  };
  expect("CMD_SESSION_START", started, kvhost::kErrorText, 4);
  expect("CMD_SESSION_READ_LAST_ERROR", "<CAN Error: 0>  <TCP Error: 0> \n", kvhost::kText, 4);
  expect("SET_PROP_SESSION_PORTNAME=LIN1", "<ACK: SET_PROP_SESSION_PORTNAME LIN1>", kvhost::kText,
         0);
  expect("SET_PROP_SESSION_LISTEN_ONLY=1", canRefusal, kvhost::kErrorText, 4);
  expect("CMD_SESSION_START", started, kvhost::kErrorText, 4);
  expect("CMD_TX_START", "<ACK: CMD_TX_START>\n", kvhost::kText, 4);
  expect("CMD_TX_STOP", "<ACK: CMD_TX_STOP>\n", kvhost::kText, 4);
  EXPECT_TRUE(NextRecords(host).has_value()) << "the other port name stopped the session";
  expect("CMD_SESSION_STOP", "<ACK: CMD_SESSION_STOP>\n", kvhost::kText, 4);
  expect("CMD_SESSION_START", started, kvhost::kErrorText, 4);
}

// Each bus answers with its own texts, and terminating clears its driver session.
TEST_F(CanSessionTest, SessionCommandsAnswerWithTheTextsOfTheBus) {
  const struct {
    std::string port;
    std::string bus;
  } buses[] = {{"CAN1", "CAN"}, {"LIN1", "LIN"}, {"FlexRay1", "FlexRay"}};
  for (const auto& b : buses) {
    SCOPED_TRACE(b.port);
    tarvix::StartRecording();
    kvhost::HostClient host = StartedHost({"SET_PROP_SESSION_PORTNAME=" + b.port});
    ExpectReply(host, "CMD_SESSION_READ_LAST_ERROR", "<" + b.bus + " Error: 0>  <TCP Error: 0> \n");
    ExpectReply(host, "CMD_SESSION_START", "<ERROR: " + b.bus + " session is already started>\n",
                kvhost::kErrorText);
    ExpectReply(host, "CMD_SESSION_TERMINATE", "<ACK: CMD_SESSION_TERMINATE>\n");
    EXPECT_TRUE(host.WaitForClose(kReplyDeadline));
    EXPECT_TRUE(WaitUntil([&] { return ClearedOn(b.port); }));
  }
}

TEST_F(CanSessionTest, StoppedSessionSendsNothingMoreUntilItIsReset) {
  kvhost::HostClient host = StartedHost({kCan1, "SET_PROP_TX_TIME_DATA=50"});
  ASSERT_TRUE(NextRecords(host).has_value());
  ExpectReply(host, "CMD_SESSION_STOP", "<ACK: CMD_SESSION_STOP>\n");
  // The loop may finish the pass it was in; the reply to this command comes after that pass.
  ASSERT_TRUE(Command(host, "CMD_SESSION_READ_LAST_ERROR").has_value());
  EXPECT_FALSE(NextMessage(host, IsRecords, std::chrono::milliseconds(500)).has_value())
      << "records were sent ten periods after the stop";
  ExpectReply(host, "CMD_SESSION_RESET", "<ACK: CMD_SESSION_RESET>\n");
}

TEST_F(CanSessionTest, ResetEmptiesTheTableAtTheNextSend) {
  kvhost::HostClient host = StartedHost({kCan1, "SET_PROP_TX_TIME_DATA=200"});
  ASSERT_TRUE(RecordsWhere(host, [](const RecordMessage& m) {
    const auto* r = m.find(0x100);
    return r != nullptr && r->count > 60;
  }));
  ExpectReply(host, "CMD_SESSION_RESET", "<ACK: CMD_SESSION_RESET>\n");
  auto after = NextRecords(host);
  ASSERT_TRUE(after.has_value());
  const auto* counter = after->find(0x100);
  ASSERT_NE(counter, nullptr);
  EXPECT_LT(counter->count, 40u);  // the table was emptied one period (20 frames) before
}

// Terminate, a closed socket and a silent host each stop the session and clear its driver session.
TEST_F(CanSessionTest, EveryEndOfTheConnectionClearsTheDriverSession) {
  heartbeatLimitMs_ = kTestHeartbeatLimitMs;
  StartService();
  const std::function<void(kvhost::HostClient&)> endings[] = {
      [&](kvhost::HostClient& host) {
        ExpectReply(host, "CMD_SESSION_TERMINATE", "<ACK: CMD_SESSION_TERMINATE>\n");
        EXPECT_TRUE(host.WaitForClose(kReplyDeadline));
      },
      [&](kvhost::HostClient& host) { host.Close(); },
      [&](kvhost::HostClient& host) {
        // The host keeps receiving records but sends nothing: the watchdog ends it.
        auto ended = NextMessage(
            host, [](const kvhost::HostMessage& m) { return m.header.type == kvhost::kErrorText; });
        ASSERT_TRUE(ended.has_value());
        EXPECT_EQ(ended->text(), nKV_DLL300::kHeartbeatErrorText);
        EXPECT_TRUE(host.WaitForClose(kReplyDeadline));
      },
  };
  for (size_t i = 0; i < std::size(endings); ++i) {
    SCOPED_TRACE(i);
    tarvix::StartRecording();
    kvhost::HostClient host = StartedHost({kCan1});
    endings[i](host);
    EXPECT_TRUE(WaitUntil([&] { return ClearedOn("CAN1"); }));
    EXPECT_TRUE(WaitUntil([&] { return service().statistics().connectionsEnded.load() == i + 1; }));
  }
}

TEST_F(CanSessionTest, LastErrorShowsTheSessionsFailingStateRead) {
  tarvix::InjectStatus("kxReadState", "CAN1", driver::kUnknownState, true);
  kvhost::HostClient host = StartedHost({kCan1});
  auto statistics = NextMessage(
      host, [](const kvhost::HostMessage& m) { return m.header.type == kvhost::kStatistics; });
  ASSERT_TRUE(statistics.has_value());
  EXPECT_EQ(statistics->header.lastStatus, driver::kUnknownState);
  ExpectReply(host, "CMD_SESSION_READ_LAST_ERROR",
              Formatted("<CAN Error: %d>  <TCP Error: %d> \n", driver::kUnknownState, 0));
}

TEST_F(CanSessionTest, DriverFailureAtStartIsReportedAndEndsTheConnection) {
  tarvix::InjectStatus("kxCreateSession", "CAN1", driver::kInterfaceNotFound, true);
  std::optional<kvhost::HostMessage> reply;
  kvhost::HostClient host = HostWith({kCan1}, &reply);
  ASSERT_TRUE(reply.has_value());
  EXPECT_EQ(reply->text(), Formatted("<ERROR: %d>\n", driver::kInterfaceNotFound));
  EXPECT_EQ(reply->header.type, kvhost::kErrorText);
  EXPECT_EQ(reply->header.lastStatus, driver::kInterfaceNotFound);
  EXPECT_TRUE(host.WaitForClose(kReplyDeadline));
}

TEST_F(CanSessionTest, RejectedBaudRateFailsTheStart) {
  // The built-in database at the host's rate: 0.
  ExpectStartFails({kCan1, "SET_PROP_SESSION_RUNMODE=NORMAL"},
                   Formatted("<ERROR: %d>\n", driver::kInvalidPropertyValue));
}

}  // namespace
}  // namespace kvtest
