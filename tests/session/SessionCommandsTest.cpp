// The session commands over TCP: their texts with and without a session, and how sessions end.
#include <gtest/gtest.h>

#include <chrono>
#include <cstdio>

#include "driver/Status.h"
#include "service/HostLink.h"
#include "tarvix/TarvixControl.h"
#include "tests/session/CanSessionFixture.h"

namespace kvtest {
namespace {

using nKV_DLL300::SessionSettings;

std::string Formatted(const char* format, int32_t a, int32_t b = 0) {
  char text[128];
  std::snprintf(text, sizeof text, format, a, b);
  return text;
}

bool Cleared(uint32_t reference) {
  for (const tarvix::CallRecord& call : tarvix::RecordedCalls()) {
    if (call.operation == "kxClear" && call.reference == reference && call.status == 0) return true;
  }
  return false;
}

bool IsRecords(const kvhost::HostMessage& m) { return m.header.type == kvhost::kCanRecords; }

struct CommandCase {
  const char* command;
  const char* reply;  // nullptr: no reply at all
  uint8_t type;
};

// Without a session every command keeps the connection, except terminate.
TEST_F(CanSessionTest, CommandsWithoutASessionAnswerWithTheirTexts) {
  const CommandCase cases[] = {
      {"CMD_SESSION_START", "<ERROR: WRONG PORT NAME>\n", kvhost::kErrorText},
      {"CMD_SESSION_STOP", nullptr, 0},
      {"CMD_SESSION_READ_LAST_ERROR", "<TCP Error: 0> \n", kvhost::kText},
      {"CMD_SESSION_RESET", "<ACK: CMD_SESSION_RESET>\n", kvhost::kText},
      {"CMD_HEARTBEAT", nullptr, 0},
      {"CMD_TX_START", "<ACK: CMD_TX_START>\n", kvhost::kText},
      {"CMD_TX_STOP", "<ACK: CMD_TX_STOP>\n", kvhost::kText},
  };
  kvhost::HostClient host = ConnectHost();
  for (const CommandCase& c : cases) {
    SCOPED_TRACE(c.command);
    if (c.reply == nullptr) {
      // A command without reply: the reply of the next command must be the next text.
      SendAndWaitDispatched(host, c.command);  // one command per receive
      auto reply = Command(host, "CMD_SESSION_READ_LAST_ERROR");
      ASSERT_TRUE(reply.has_value());
      EXPECT_EQ(reply->text(), "<TCP Error: 0> \n");
      continue;
    }
    auto reply = Command(host, c.command);
    ASSERT_TRUE(reply.has_value());
    EXPECT_EQ(reply->text(), c.reply);
    EXPECT_EQ(reply->header.type, c.type);
    EXPECT_EQ(reply->header.idCount, 0u);
  }
  auto terminated = Command(host, "CMD_SESSION_TERMINATE");
  ASSERT_TRUE(terminated.has_value());
  EXPECT_EQ(terminated->text(), "<ACK: CMD_SESSION_TERMINATE>\n");
  EXPECT_TRUE(host.WaitForClose(kReplyDeadline));
}

TEST_F(CanSessionTest, CommandsOnARunningSessionAnswerWithTheirTexts) {
  const CommandCase cases[] = {
      {"CMD_SESSION_START", "<ERROR: CAN session is already started>\n", kvhost::kErrorText},
      {"CMD_SESSION_READ_LAST_ERROR", "<CAN Error: 0>  <TCP Error: 0> \n", kvhost::kText},
      {"CMD_TX_START", "<ACK: CMD_TX_START>\n", kvhost::kText},
      {"CMD_TX_STOP", "<ACK: CMD_TX_STOP>\n", kvhost::kText},
      {"CMD_SESSION_STOP", "<ACK: CMD_SESSION_STOP>\n", kvhost::kText},
      {"CMD_SESSION_START", "<ERROR: CAN session is already started>\n", kvhost::kErrorText},
  };
  kvhost::HostClient host = StartedHost(0, "CAN1");
  // Records are in the table before the commands, so each header shows them.
  ASSERT_TRUE(RecordsWhere(host, [](const RecordMessage& m) { return m.records.size() == 4; }));
  for (const CommandCase& c : cases) {
    SCOPED_TRACE(c.command);
    auto reply = Command(host, c.command);
    ASSERT_TRUE(reply.has_value());
    EXPECT_EQ(reply->text(), c.reply);
    EXPECT_EQ(reply->header.type, c.type);
    EXPECT_EQ(reply->header.idCount, 4u);
  }
}

TEST_F(CanSessionTest, StoppedSessionSendsNothingMore) {
  kvhost::HostClient host = StartedHost(0, "CAN1", [](SessionSettings& s) { s.txTimeData = 50; });
  ASSERT_TRUE(NextRecords(host).has_value());
  auto stopped = Command(host, "CMD_SESSION_STOP");
  ASSERT_TRUE(stopped.has_value());
  EXPECT_EQ(stopped->text(), "<ACK: CMD_SESSION_STOP>\n");
  // The loop may finish the pass it was in; the reply to this command comes after that pass.
  ASSERT_TRUE(Command(host, "CMD_SESSION_READ_LAST_ERROR").has_value());
  EXPECT_FALSE(NextMessage(host, IsRecords, std::chrono::milliseconds(500)).has_value())
      << "records were sent ten periods after the stop";
  auto reset = Command(host, "CMD_SESSION_RESET");
  ASSERT_TRUE(reset.has_value());
  EXPECT_EQ(reset->text(), "<ACK: CMD_SESSION_RESET>\n");
}

TEST_F(CanSessionTest, ResetEmptiesTheTableAtTheNextSend) {
  kvhost::HostClient host = StartedHost(0, "CAN1", [](SessionSettings& s) { s.txTimeData = 200; });
  auto before = RecordsWhere(host, [](const RecordMessage& m) {
    const auto* r = m.find(0x100);
    return r != nullptr && r->count > 60;
  });
  ASSERT_TRUE(before.has_value());
  auto reset = Command(host, "CMD_SESSION_RESET");
  ASSERT_TRUE(reset.has_value());
  EXPECT_EQ(reset->text(), "<ACK: CMD_SESSION_RESET>\n");
  auto after = NextRecords(host);
  ASSERT_TRUE(after.has_value());
  const auto* counter = after->find(0x100);
  ASSERT_NE(counter, nullptr);
  EXPECT_LT(counter->count, 40u);  // the table was emptied one period (20 frames) before
}

TEST_F(CanSessionTest, TerminateStopsTheSessionClearsTheDriverSessionAndCloses) {
  kvhost::HostClient host = StartedHost(0, "CAN1");
  const uint32_t reference = ConnectionAt(0).session->driverSession;
  tarvix::StartRecording();
  auto reply = Command(host, "CMD_SESSION_TERMINATE");
  ASSERT_TRUE(reply.has_value());
  EXPECT_EQ(reply->text(), "<ACK: CMD_SESSION_TERMINATE>\n");
  EXPECT_TRUE(host.WaitForClose(kReplyDeadline));
  EXPECT_TRUE(Cleared(reference));
}

TEST_F(CanSessionTest, LastErrorShowsTheSessionsFailingStateRead) {
  tarvix::InjectStatus("kxReadState", "CAN1", driver::kUnknownState, true);
  kvhost::HostClient host = StartedHost(0, "CAN1");
  auto statistics = NextMessage(host, [](const kvhost::HostMessage& m) {
    return m.header.type == kvhost::kStatistics;
  });
  ASSERT_TRUE(statistics.has_value());
  EXPECT_EQ(statistics->header.lastStatus, driver::kUnknownState);
  auto reply = Command(host, "CMD_SESSION_READ_LAST_ERROR");
  ASSERT_TRUE(reply.has_value());
  EXPECT_EQ(reply->text(), Formatted("<CAN Error: %d>  <TCP Error: %d> \n", driver::kUnknownState, 0));
}

TEST_F(CanSessionTest, DriverFailureAtStartIsReportedAndEndsTheConnection) {
  tarvix::InjectStatus("kxCreateSession", "CAN1", driver::kInterfaceNotFound, true);
  kvhost::HostClient host = ConnectHost();
  UsePort(ConnectionAt(0), "CAN1");
  auto reply = Command(host, "CMD_SESSION_START");
  ASSERT_TRUE(reply.has_value());
  EXPECT_EQ(reply->text(), Formatted("<ERROR: %d>\n", driver::kInterfaceNotFound));
  EXPECT_EQ(reply->header.type, kvhost::kErrorText);
  EXPECT_EQ(reply->header.lastStatus, driver::kInterfaceNotFound);
  EXPECT_TRUE(host.WaitForClose(kReplyDeadline));
}

TEST_F(CanSessionTest, RejectedBaudRateFailsTheStart) {
  kvhost::HostClient host = ConnectHost();
  UsePort(ConnectionAt(0), "CAN1");
  ConnectionAt(0).settings.runMode.Set("NORMAL");  // built-in database at the host's rate: 0
  auto reply = Command(host, "CMD_SESSION_START");
  ASSERT_TRUE(reply.has_value());
  EXPECT_EQ(reply->text(), Formatted("<ERROR: %d>\n", driver::kInvalidPropertyValue));
  EXPECT_TRUE(host.WaitForClose(kReplyDeadline));
}

TEST_F(CanSessionTest, AnotherPortNameKeepsTheRunningSessionsKind) {
  kvhost::HostClient host = StartedHost(0, "CAN1");
  auto renamed = Command(host, "SET_PROP_SESSION_PORTNAME=LIN1");
  ASSERT_TRUE(renamed.has_value());
  EXPECT_EQ(renamed->text(), "<ACK: SET_PROP_SESSION_PORTNAME LIN1>");
  auto refused = Command(host, "SET_PROP_SESSION_LISTEN_ONLY=1");
  ASSERT_TRUE(refused.has_value());
  EXPECT_EQ(refused->text(), "<ERROR: SET_PROP_SESSION_LISTEN_ONLY: CAN Session yet created>\n");
  auto again = Command(host, "CMD_SESSION_START");
  ASSERT_TRUE(again.has_value());
  EXPECT_EQ(again->text(), "<ERROR: CAN session is already started>\n");
  auto lastError = Command(host, "CMD_SESSION_READ_LAST_ERROR");
  ASSERT_TRUE(lastError.has_value());
  EXPECT_EQ(lastError->text(), "<CAN Error: 0>  <TCP Error: 0> \n");
  EXPECT_TRUE(NextRecords(host).has_value());
}

TEST_F(CanSessionTest, HostThatClosesItsSocketHasItsSessionStopped) {
  kvhost::HostClient host = StartedHost(0, "CAN1");
  const uint32_t reference = ConnectionAt(0).session->driverSession;
  tarvix::StartRecording();
  host.Close();
  EXPECT_TRUE(WaitUntil([&] { return Cleared(reference); }));
  EXPECT_TRUE(WaitUntil([&] { return service().statistics().connectionsEnded.load() == 1; }));
}

TEST_F(CanSessionTest, HeartbeatWatchdogEndsASilentHostWithALiveSession) {
  kvhost::HostClient host = StartedHost(0, "CAN1");
  const uint32_t reference = ConnectionAt(0).session->driverSession;
  tarvix::StartRecording();
  // The host keeps receiving records but sends nothing: after 10 s the watchdog ends it.
  auto ended = NextMessage(host, [](const kvhost::HostMessage& m) {
    return m.header.type == kvhost::kErrorText;
  });
  ASSERT_TRUE(ended.has_value());
  EXPECT_EQ(ended->text(), nKV_DLL300::kHeartbeatErrorText);
  EXPECT_TRUE(host.WaitForClose(kReplyDeadline));
  EXPECT_TRUE(Cleared(reference));
}

}  // namespace
}  // namespace kvtest
